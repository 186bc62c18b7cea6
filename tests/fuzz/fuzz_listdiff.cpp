// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The list difference on arbitrary pairs of lists. Byte 0 is the length of
// the old list, byte 1 the batch size (bit 7: the pure difference instead of
// the incremental merge), then the ids of the old rows and of the new ones,
// from a small alphabet so that rows recur. The new list arrives batch by
// batch; at the end the old list must equal it, and no edit may reach past
// either list or refresh a row with another item.
#include "fuzzsupport.h"
#include "synchronizedcontent.h"

#include <QUrl>

#include <algorithm>

namespace {

bool outside(int index, int count, int size) { return count >= 1 && (index < 0 || index + count > size); }

// Forwards the edits to the list and checks each one first.
class Checker : public SynchronizationInterface
{
public:
    explicit Checker(SynchronizedContent &list) : m_list(list) {}

    void insertRange(int index, int count, const QVector<Content> &source, int sourceIndex) override
    {
        if (outside(index, count, m_list.size() + count) || outside(sourceIndex, count, source.size()))
            Fuzz::fail(QStringLiteral("insertRange out of bounds"));
        m_list.insertRange(index, count, source, sourceIndex);
    }
    void removeRange(int index, int count) override
    {
        if (outside(index, count, m_list.size()))
            Fuzz::fail(QStringLiteral("removeRange out of bounds"));
        m_list.removeRange(index, count);
    }
    void updateRange(int index, int count, const QVector<Content> &source, int sourceIndex) override
    {
        if (outside(index, count, m_list.size()) || outside(sourceIndex, count, source.size()))
            Fuzz::fail(QStringLiteral("updateRange out of bounds"));
        for (int i = 0; i < count; ++i) {
            if (m_list.at(index + i) != source.at(sourceIndex + i))
                Fuzz::fail(QStringLiteral("updateRange over another item"));
        }
        m_list.updateRange(index, count, source, sourceIndex);
    }

private:
    SynchronizedContent &m_list;
};

}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    if (size < 2 || size > 4096)
        return 0;
    const size_t oldSize = qMin<size_t>(data[0], size - 2);
    SynchronizedContent list;
    QVector<Content> source;
    for (size_t i = 2; i < size; ++i)
        (i < 2 + oldSize ? static_cast<QVector<Content> &>(list) : source).append(Content(new FileData(data[i] & 0x1f, QUrl())));

    Checker checker(list);
    if (data[1] & 0x80) {
        int index = 0, sourceIndex = 0;
        SynchronizedContent::walk(list, source, index, sourceIndex, &checker, false);
        SynchronizedContent::finish(list, source, index, sourceIndex, &checker);
    } else {
        QVector<Content> received;
        while (received.size() < source.size()) {
            received += source.mid(received.size(), (data[1] & 0x3f) + 1);
            list.merge(received, &checker);
            // Rows behind the cursors are settled.
            if (list.index() > list.size() || list.index() != list.sourceIndex() || list.sourceIndex() > received.size()
                || !std::equal(list.begin(), list.begin() + list.index(), received.begin()))
                Fuzz::fail(QStringLiteral("rows behind the cursors differ from the source"));
        }
        list.finish(source, &checker);
        if (list.index() != 0 || list.sourceIndex() != 0)
            Fuzz::fail(QStringLiteral("cursors not reset by finish"));
    }
    if (static_cast<const QVector<Content> &>(list) != source)
        Fuzz::fail(QStringLiteral("the result differs from the source"));
    return 0;
}
