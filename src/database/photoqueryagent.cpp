// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "photoqueryagent.h"

namespace {

const QString s_select = QStringLiteral(
        "SELECT file.id, directory.path || '/' || file.fileName, file.mimeType, file.fileName, "
        "file.displayName, file.permissions, image.dateTaken, image.width, image.height, image.orientation "
        "FROM file INNER JOIN directory on file.directoryId = directory.id ");

// The lookups name a table "photo" that the schema never had, so they fail at
// prepare and log; only the list statement works. Kept as it always was.
const QString s_byId = s_select + QLatin1String("INNER JOIN photo ON file.id = photo.fileId WHERE file.id = ?;");
const QString s_byPath = s_select + QLatin1String("LEFT JOIN photo ON file.id = photo.fileId WHERE directory.path = ? AND file.fileName = ?;");
const QString s_bySource = s_select + QLatin1String("LEFT JOIN photo ON file.id = photo.fileId WHERE file.id IN (SELECT fileId FROM download WHERE source = ?);");
const QString s_list = s_select + QLatin1String("INNER JOIN image on file.id = image.fileId ORDER BY image.dateTaken;");

Content photoFromRow(const QSqlQuery &query)
{
    PhotoData *photo = new PhotoData(QueryAgent::idFromColumn(query, 0),
                                     QUrl::fromLocalFile(query.value(1).toString()));
    photo->mimeType = query.value(2).toString();
    photo->fileName = query.value(3).toString();
    photo->displayName = query.value(4).toString();
    photo->permissions = query.value(5).toInt();
    photo->dateTakenValue = query.value(6);
    photo->width = query.value(7).toInt();
    photo->height = query.value(8).toInt();
    photo->orientation = query.value(9).toInt();
    return Content(photo);
}

}

PhotoQueryAgent::PhotoQueryAgent(QueryAgentDatabase &database)
    : QueryAgentSpecialization<PhotoData>(database)
{
}

Content PhotoQueryAgent::queryById(qint64 id)
{
    QSqlQuery query = prepareQuery(s_byId);
    query.bindValue(0, id);
    return querySinglePhoto(query);
}

Content PhotoQueryAgent::queryByUrl(const QUrl &url)
{
    QSqlQuery query = prepareUrlQuery(*this, url, s_byPath, s_bySource);
    return querySinglePhoto(query);
}

Content PhotoQueryAgent::querySinglePhoto(QSqlQuery &query)
{
    if (!query.exec()) {
        warn(query, "Content PhotoQueryAgent::querySinglePhoto(QSqlQuery&)", "Failed to query photo");
        return Content();
    }
    if (!query.next())
        return Content();
    Content content = photoFromRow(query);
    query.finish();
    return content;
}

bool PhotoQueryAgent::query(QueryAgent::Recipient *recipient, const QueryAgent::Parameters &)
{
    QSqlQuery query = prepareQuery(s_list);
    if (!query.exec()) {
        warn(query, "virtual bool PhotoQueryAgent::query(QueryAgent::Recipient*, const QueryAgent::Parameters&)",
             "Failed to execute photo query");
        return false;
    }
    deliver(query, recipient, photoFromRow);
    return true;
}
