// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "filequeryagent.h"

namespace {

const QString s_select = QStringLiteral(
        "SELECT file.id, directory.path || '/' || file.fileName, file.mimeType, file.fileName, "
        "file.displayName, file.category, file.permissions "
        "FROM file INNER JOIN directory on file.directoryId = directory.id ");

Content fileFromRow(const QSqlQuery &query)
{
    FileData *file = new FileData(QueryAgent::idFromColumn(query, 0), QUrl::fromLocalFile(query.value(1).toString()));
    file->mimeType = query.value(2).toString();
    file->fileName = query.value(3).toString();
    file->displayName = query.value(4).toString();
    file->category = query.value(5).toString();
    file->permissions = query.value(6).toInt();
    return Content(file);
}

}

FileQueryAgent::FileQueryAgent(QueryAgentDatabase &database)
    : QueryAgentSpecialization<FileData>(database)
{
}

Content FileQueryAgent::queryById(qint64 id)
{
    QSqlQuery query = prepareQuery(s_select + QLatin1String("WHERE file.id = ?;"));
    query.bindValue(0, id);
    return querySingleFile(query);
}

Content FileQueryAgent::queryByUrl(const QUrl &url)
{
    QSqlQuery query = prepareUrlQuery(
            *this, url,
            s_select + QLatin1String("WHERE directory.path = ? AND file.fileName = ?;"),
            s_select + QLatin1String("WHERE file.id IN (SELECT fileId FROM download WHERE source = ?);"));
    return querySingleFile(query);
}

Content FileQueryAgent::querySingleFile(QSqlQuery &query)
{
    if (!query.exec()) {
        warn(query, "Content FileQueryAgent::querySingleFile(QSqlQuery&)", "Failed to query file");
        return Content();
    }
    if (!query.next())
        return Content();
    Content content = fileFromRow(query);
    query.finish();
    return content;
}

QString FileQueryAgent::listStatement(const FileParameters &parameters, QVariantList *values)
{
    QString separator = QStringLiteral("WHERE ");
    auto takeSeparator = [&separator]() {
        const QString taken = separator;
        separator = QStringLiteral("\n     AND ");
        return taken;
    };

    QString clause;
    if (parameters.mimeType.contains(QLatin1Char('*'))) {
        clause += takeSeparator() + QLatin1String("file.mimeType GLOB ?");
        values->append(parameters.mimeType);
    } else if (!parameters.mimeType.isEmpty()) {
        clause += takeSeparator() + QLatin1String("file.mimeType = ?");
        values->append(parameters.mimeType);
    }

    if (!parameters.directories.isEmpty()) {
        clause += takeSeparator() + QLatin1String("(");
        QString inner;
        for (const QString &directory : parameters.directories) {
            clause += inner + QLatin1String("directory.path GLOB ?");
            values->append(QString(directory + QLatin1String("/*")));
            inner = QStringLiteral("\n         OR ");
        }
        clause += QLatin1String(")");
    }

    QString order;
    if (!parameters.categories.isEmpty()) {
        order += QLatin1String("\n   CASE file.category");
        for (int i = 0; i < parameters.categories.size(); ++i)
            order += QLatin1String("\n     WHEN '") + parameters.categories.at(i)
                    + QLatin1String("' THEN ") + QString::number(i);
        order += QLatin1String("\n     ELSE ") + QString::number(parameters.categories.size())
                + QLatin1String("\n   END,");
    }

    return QString(s_select + QLatin1String("%1 ORDER BY %2 file.displayName ASC;")).arg(clause).arg(order);
}

bool FileQueryAgent::query(QueryAgent::Recipient *recipient, const QueryAgent::Parameters &parameters)
{
    QVariantList values;
    const QString statement = listStatement(static_cast<const FileParameters &>(parameters), &values);
    QSqlQuery query = prepareQuery(statement);
    for (int i = 0; i < values.size(); ++i)
        query.bindValue(i, values.at(i));
    if (!query.exec()) {
        warn(query, "virtual bool FileQueryAgent::query(QueryAgent::Recipient*, const QueryAgent::Parameters&)",
             "Failed to execute file query");
        return false;
    }
    deliver(query, recipient, fileFromRow);
    return true;
}
