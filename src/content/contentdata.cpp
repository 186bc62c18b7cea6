// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "contentdata.h"

ContentData::ContentData(qint64 id, const QUrl &url, int type)
    : id(id)
    , url(url)
    , type(type)
{
}

ContentData::~ContentData() = default;

bool ContentData::setData(int, const QVariant &)
{
    return false;
}
