// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CONTENT_H
#define CONTENT_H

#include "contentdata.h"
#include "filedata.h"
#include "photodata.h"
#include "themeletcontent.h"
#include "themeletdata.h"

#include <QMetaType>
#include <QSharedDataPointer>
#include <QVector>

#include <utility>

// One-pointer, reference-counted handle on a content record. Batches travel
// between threads as QVector<Content>, so the count is atomic.
class Content
{
public:
    Content() = default;
    Content(ContentData *data);
    Content(const Content &other);
    // A move leaves `other` null and touches no count: cheap on a hot path.
    Content(Content &&other) noexcept : m_data(other.m_data) { other.m_data = nullptr; }
    ~Content();

    Content &operator=(const Content &other);
    Content &operator=(Content &&other) noexcept
    {
        std::swap(m_data, other.m_data);
        return *this;
    }

    ThemeletContent::Type type() const;
    bool isValid() const { return m_data != nullptr; }
    ContentData *data() const { return m_data; }

    // Defined by the process that runs the managers (the service); the library
    // only calls it after a commit that changed rows of that type.
    static void signalChanged(int type);

private:
    ContentData *m_data = nullptr;
};

// Same item: same type and id. Inline, as a merge compares every row.
inline bool operator==(const Content &a, const Content &b)
{
    const ContentData *x = a.data();
    const ContentData *y = b.data();
    if (x == y)
        return true;
    return x && y && x->type == y->type && x->id == y->id;
}

inline bool operator!=(const Content &a, const Content &b)
{
    return !(a == b);
}

Q_DECLARE_TYPEINFO(Content, Q_MOVABLE_TYPE);
Q_DECLARE_METATYPE(Content)

// Typed handle. Non-const access detaches by copy construction of T, so an
// edit through a shared handle lands in a private copy. A record of another
// class gives a null handle.
template <typename T>
class ContentSpecialization
{
public:
    ContentSpecialization() = default;
    explicit ContentSpecialization(T *data) : m_data(data) {}
    explicit ContentSpecialization(const Content &content)
        : m_data(dynamic_cast<T *>(content.data()))
    {
    }

    bool isNull() const { return !m_data; }
    T *data() { return m_data.data(); }
    const T *data() const { return m_data.constData(); }
    const T *constData() const { return m_data.constData(); }
    T *operator->() { return m_data.data(); }
    const T *operator->() const { return m_data.constData(); }
    T &operator*() { return *m_data; }
    const T &operator*() const { return *m_data; }
    void detach() { m_data.detach(); }

    operator Content() const { return Content(const_cast<T *>(m_data.constData())); }

private:
    QSharedDataPointer<T> m_data;
};

typedef ContentSpecialization<ThemeletData> Themelet;

#endif
