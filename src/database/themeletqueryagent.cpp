// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletqueryagent.h"

#include <QColor>

namespace {

const char *const s_queryFunction =
        "virtual bool ThemeletQueryAgent::query(QueryAgent::Recipient*, const QueryAgent::Parameters&)";

const QString s_select = QStringLiteral(
        "SELECT file.id, directory.path || '/' || file.fileName AS filePath, file.mimeType, file.fileName, "
        "file.permissions, file.displayName, zefid.zefId, themelet.favorite, themelet.homeWallpaper, "
        "themelet.applicationWallpaper, themelet.highlightColor, themelet.secondaryHighlightColor, "
        "themelet.primaryColor, themelet.secondaryColor, themelet.ringerVolume, themelet.enabledSounds, "
        "themelet.partnerSpace, themelet.version "
        "FROM file INNER JOIN directory on file.directoryId = directory.id "
        "INNER JOIN themelet ON file.id = themelet.fileId "
        "LEFT OUTER JOIN zefid ON themelet.fileId = zefid.fileId ");

const QString s_resourcesOfOne = QStringLiteral(
        "SELECT resource.fileId, resource.resourceType, directory.path || '/' || file.fileName, "
        "file.fileName, file.displayName FROM resource INNER JOIN file ON resource.resourceId = file.id "
        "INNER JOIN directory on file.directoryId = directory.id WHERE resource.fileId = ?");

const QString s_create = QStringLiteral("CREATE TEMPORARY TABLE %1 AS SELECT * FROM themelet\n");
const QString s_allTail = QStringLiteral("ORDER BY themelet.favorite DESC, themelet.timestamp ASC;");
const QString s_filterTail = QStringLiteral("WHERE themelet.favorite = ? ORDER BY themelet.timestamp ASC;");

// Both list statements follow the temporary table's rowid, which is the order
// of its creation: that is what lets the two cursors be merged.
const QString s_rows = QStringLiteral(
        "SELECT file.id, directory.path || '/' || file.fileName AS filePath, file.mimeType, file.fileName, "
        "file.permissions, file.displayName, zefid.zefId, %1.favorite, %1.homeWallpaper, "
        "%1.applicationWallpaper, %1.highlightColor, %1.secondaryHighlightColor, %1.primaryColor, "
        "%1.secondaryColor, %1.ringerVolume, %1.enabledSounds, %1.partnerSpace, %1.version "
        "FROM %1 INNER JOIN file ON %1.fileId = file.id INNER JOIN directory on file.directoryId = directory.id "
        "LEFT OUTER JOIN zefid ON %1.fileId = zefid.fileId ORDER BY %1.rowid;");

const QString s_resources = QStringLiteral(
        "SELECT resource.fileId, resource.resourceType, directory.path || '/' || file.fileName, "
        "file.fileName, file.displayName FROM %1 INNER JOIN resource ON %1.fileId = resource.fileId "
        "INNER JOIN file ON resource.resourceId = file.id INNER JOIN directory on file.directoryId = directory.id "
        "ORDER BY %1.rowid;");

const QString s_drop = QStringLiteral("DROP TABLE %1");

struct ResourceCursor
{
    QSqlQuery query;
    qint64 nextFileId = 0;
};

void advance(ResourceCursor &cursor)
{
    cursor.nextFileId = cursor.query.next() ? QueryAgent::idFromColumn(cursor.query, 0) : 0;
}

QColor namedColor(const QVariant &value)
{
    QColor color;
    color.setNamedColor(value.toString());
    return color;
}

Content themeletFromRow(const QSqlQuery &query)
{
    ThemeletData *themelet = new ThemeletData(QueryAgent::idFromColumn(query, 0),
                                              QUrl::fromLocalFile(query.value(1).toString()));
    themelet->mimeType = query.value(2).toString();
    themelet->fileName = query.value(3).toString();
    themelet->permissions = query.value(4).toInt();
    themelet->displayName = query.value(5).toString();
    themelet->zefId = query.value(6).toString();
    themelet->favorite = query.value(7).toBool();
    themelet->homeWallpaper = query.value(8).toString();
    themelet->applicationWallpaper = query.value(9).toString();
    themelet->highlightColor = namedColor(query.value(10));
    themelet->secondaryHighlightColor = namedColor(query.value(11));
    themelet->primaryColor = namedColor(query.value(12));
    themelet->secondaryColor = namedColor(query.value(13));
    themelet->ringerVolume = query.value(14).toInt();
    themelet->enabledSounds = query.value(15).toInt();
    themelet->partnerSpace = query.value(16).toString();
    themelet->version = query.value(17).toInt();
    return Content(themelet);
}

// Streams the resource rows onto the handles in order. A cursor row that
// matches no handle is left standing, so the merge carries across batches.
void readResources(ResourceCursor &cursor, Content *contents, int count)
{
    if (cursor.nextFileId == 0 || count == 0)
        return;
    for (int i = 0; i < count; ++i) {
        Themelet themelet(contents[i]);
        themelet.detach();
        if (themelet->id == cursor.nextFileId) {
            do {
                const QString type = cursor.query.value(1).toString();
                QVariantMap resource;
                resource.insert(QStringLiteral("url"), QUrl::fromLocalFile(cursor.query.value(2).toString()));
                resource.insert(QStringLiteral("fileName"), cursor.query.value(3));
                resource.insert(QStringLiteral("displayName"), cursor.query.value(4));
                themelet->resources.insert(type, resource);
                advance(cursor);
            } while (cursor.nextFileId == themelet->id);
        }
        contents[i] = themelet;
        if (cursor.nextFileId == 0)
            return;
    }
}

}

ThemeletQueryAgent::ThemeletQueryAgent(QueryAgentDatabase &database)
    : QueryAgentSpecialization<ThemeletData>(database)
{
}

Content ThemeletQueryAgent::queryById(qint64 id)
{
    QSqlQuery query = prepareQuery(s_select + QLatin1String("WHERE file.id = ?;"));
    query.bindValue(0, id);
    return querySingleThemelet(query);
}

Content ThemeletQueryAgent::queryByUrl(const QUrl &url)
{
    QSqlQuery query = prepareUrlQuery(
            *this, url,
            s_select + QLatin1String("WHERE directory.path = ? AND file.fileName = ?;"),
            s_select + QLatin1String("WHERE file.id IN (SELECT fileId FROM download WHERE source = ?);"));
    return querySingleThemelet(query);
}

Content ThemeletQueryAgent::querySingleThemelet(QSqlQuery &query)
{
    const char *function = "Content ThemeletQueryAgent::querySingleThemelet(QSqlQuery&)";
    if (!query.exec()) {
        warn(query, function, "Failed to query themelet");
        return Content();
    }
    if (!query.next())
        return Content();
    Content content = themeletFromRow(query);
    query.finish();

    ResourceCursor cursor;
    cursor.query = prepareQuery(s_resourcesOfOne);
    cursor.query.bindValue(0, content.data()->id);
    if (!cursor.query.exec()) {
        warn(query, function, "Failed to execute resource query");
        return content;
    }
    if (!cursor.query.next())
        return content;
    cursor.nextFileId = idFromColumn(cursor.query, 0);
    readResources(cursor, &content, 1);
    cursor.query.finish();
    return content;
}

bool ThemeletQueryAgent::query(QueryAgent::Recipient *recipient, const QueryAgent::Parameters &parameters)
{
    const int filter = static_cast<const ThemeletParameters &>(parameters).filter;
    const QString table = QLatin1String("themelet_") + threadId();

    QSqlQuery create = prepareQuery(s_create.arg(table) + (filter == NoFilter ? s_allTail : s_filterTail));
    if (filter != NoFilter)
        create.bindValue(0, filter == FavoritesOnly);
    if (!create.exec()) {
        warn(create, s_queryFunction, "Failed to create themelet table");
        return false;
    }
    create.finish();

    QSqlQuery rows = prepareQuery(s_rows.arg(table));
    ResourceCursor cursor;
    cursor.query = prepareQuery(s_resources.arg(table));

    if (!rows.exec()) {
        warn(rows, s_queryFunction, "Failed to execute themelet query");
    } else if (!cursor.query.exec()) {
        // Reports the row statement, as it always has.
        warn(rows, s_queryFunction, "Failed to execute resource query");
    } else {
        if (cursor.query.next())
            cursor.nextFileId = idFromColumn(cursor.query, 0);
        deliver(rows, recipient, themeletFromRow, [&cursor](QVector<Content> &batch) {
            readResources(cursor, batch.data(), batch.size());
        });
    }
    rows.finish();
    cursor.query.finish();

    QSqlQuery drop = prepareQuery(s_drop.arg(table));
    if (!drop.exec())
        warn(drop, s_queryFunction, "Failed to drop temporary themelet table");
    return true;
}
