// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "photoqueryagent.h"

#include "rowpipeline.h"
#include "statementreader.h"

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

// Reads a StatementReader or a copy of its rows.
template <typename Row>
Content photoFromRow(const Row &row)
{
    PhotoData *photo = new PhotoData(row.id(0), QUrl::fromLocalFile(row.text(1)));
    photo->mimeType = row.repeatedText(2);
    photo->fileName = row.text(3);
    photo->displayName = row.text(4);
    photo->permissions = row.integer(5);
    photo->dateTakenValue = row.value(6);
    photo->width = row.integer(7);
    photo->height = row.integer(8);
    photo->orientation = row.integer(9);
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
    StatementReader row(query);
    if (!row.next())
        return Content();
    Content content = photoFromRow(row);
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
    StatementReader rows(query, true);
    RowPipeline::deliver(rows, recipient, photoFromRow<StatementReader>, photoFromRow<RowCopy::Row>);
    return true;
}
