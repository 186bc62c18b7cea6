// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "content.h"

Content::Content(ContentData *data)
    : m_data(data)
{
    if (m_data)
        m_data->ref.ref();
}

Content::Content(const Content &other)
    : m_data(other.m_data)
{
    if (m_data)
        m_data->ref.ref();
}

Content::~Content()
{
    if (m_data && !m_data->ref.deref())
        delete m_data;
}

Content &Content::operator=(const Content &other)
{
    if (m_data == other.m_data)
        return *this;
    // Take the new reference first: the old record may be what keeps `other` alive.
    ContentData *data = other.m_data;
    if (data)
        data->ref.ref();
    ContentData *old = m_data;
    m_data = data;
    if (old && !old->ref.deref())
        delete old;
    return *this;
}

ThemeletContent::Type Content::type() const
{
    return m_data ? ThemeletContent::Type(m_data->type) : ThemeletContent::Type(-1);
}
