// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CONTENTDATA_H
#define CONTENTDATA_H

#include <QSharedData>
#include <QUrl>
#include <QVariant>

class ContentData : public QSharedData
{
public:
    ContentData(qint64 id, const QUrl &url, int type);
    virtual ~ContentData();

    virtual ContentData *clone() const = 0;
    virtual QVariant data(int role) const = 0;
    virtual bool setData(int role, const QVariant &value);

    qint64 id;
    QUrl url;
    int type;
};

#endif
