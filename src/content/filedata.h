// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef FILEDATA_H
#define FILEDATA_H

#include "contentdata.h"

#include <QHash>
#include <QString>

class FileData : public ContentData
{
public:
    enum Role {
        ContentIdRole = 0,
        UrlRole,
        MimeTypeRole,
        FileNameRole,
        FilePathRole,
        DisplayNameRole,
        ReadOnlyRole,
        CategoryRole
    };

    FileData(qint64 id, const QUrl &url);

    ContentData *clone() const override;
    QVariant data(int role) const override;

    static QHash<int, QByteArray> roleNames();

    QString mimeType;
    QString fileName;
    QString displayName;
    QString category;
    int permissions = 0; // bit value 2: writable

protected:
    FileData(qint64 id, const QUrl &url, int type);
};

#endif
