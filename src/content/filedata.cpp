// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "filedata.h"

#include "themeletcontent.h"

FileData::FileData(qint64 id, const QUrl &url)
    : ContentData(id, url, ThemeletContent::File)
{
}

FileData::FileData(qint64 id, const QUrl &url, int type)
    : ContentData(id, url, type)
{
}

ContentData *FileData::clone() const
{
    return new FileData(*this);
}

QVariant FileData::data(int role) const
{
    switch (role) {
    case ContentIdRole: return id;
    case UrlRole: return url;
    case MimeTypeRole: return mimeType;
    case FileNameRole: return fileName;
    case FilePathRole: return url.toLocalFile();
    case DisplayNameRole: return displayName;
    case ReadOnlyRole: return !(permissions & 2);
    case CategoryRole: return category;
    default: return QVariant();
    }
}

QHash<int, QByteArray> FileData::roleNames()
{
    return {
        { ContentIdRole, "contentId" },
        { UrlRole, "url" },
        { MimeTypeRole, "mimeType" },
        { FileNameRole, "fileName" },
        { FilePathRole, "filePath" },
        { DisplayNameRole, "displayName" },
        { ReadOnlyRole, "readOnly" },
        { CategoryRole, "category" },
    };
}
