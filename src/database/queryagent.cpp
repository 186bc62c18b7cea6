// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "queryagent.h"

#include "filequeryagent.h"
#include "photoqueryagent.h"
#include "queryagentdatabase.h"
#include "themeletqueryagent.h"

#include <QDebug>
#include <QDir>
#include <QFile>
#include <QSqlError>
#include <QStandardPaths>
#include <QThreadStorage>

QueryAgent::Parameters::~Parameters() = default;
QueryAgent::Recipient::~Recipient() = default;

QueryAgent::QueryAgent(QueryAgentDatabase &database)
    : QueryActor(database)
{
}

QueryAgent::~QueryAgent() = default;

QUrl QueryAgent::databaseUrl(int flags)
{
    const QString path = QStandardPaths::writableLocation(QStandardPaths::GenericDataLocation)
            + QDir::separator() + QLatin1String("system/privileged")
            + QDir::separator() + QLatin1String("Themeletd")
            + QDir::separator() + QLatin1String("themeletd.sqlite");
    QUrl url = QUrl::fromLocalFile(path);
    if (flags & ReadOnlyUrl)
        url.setQuery(QStringLiteral("mode=ro&immutable=1"), QUrl::TolerantMode);
    return url;
}

namespace {

bool openAgentDatabase(QueryAgentDatabase &database)
{
    const QUrl url = QueryAgent::databaseUrl(0);
    database.setConnectOptions(QStringLiteral("QSQLITE_OPEN_URI"));
    database.setDatabaseName(url.toString());

    // A file we may read but not write beside (the write-ahead log needs that)
    // fails the probe; the second attempt opens it read-only and immutable.
    for (int attempt = 0; attempt < 2; ++attempt) {
        if (!database.open()) {
            qWarning("Database not opened");
            qWarning() << database.lastError();
            return false;
        }
        {
            QSqlQuery probe(database);
            if (probe.exec(QStringLiteral("PRAGMA user_version;"))) {
                probe.exec(QStringLiteral("PRAGMA temp_store = MEMORY;"));
                break;
            }
        }
        database.close();
        if (!QFile::exists(url.toLocalFile()))
            return false;
        database.setDatabaseName(QueryAgent::databaseUrl(QueryAgent::ReadOnlyUrl).toString());
    }
    if (!database.isOpen()) {
        qWarning("Failed to open themelet database");
        qWarning() << database.lastError();
        return false;
    }
    return true;
}

}

QueryAgent *QueryAgent::agentFor(ThemeletContent::Type type)
{
    static QThreadStorage<QueryAgentDatabase *> s_databases;
    if (!s_databases.hasLocalData())
        s_databases.setLocalData(new QueryAgentDatabase);
    QueryAgentDatabase &database = *s_databases.localData();

    if (!database.isOpen() && !openAgentDatabase(database))
        return nullptr;

    QueryAgent *&agent = database.m_agents[type];
    if (agent)
        return agent;
    switch (type) {
    case ThemeletContent::File: agent = new FileQueryAgent(database); break;
    case ThemeletContent::Themelet: agent = new ThemeletQueryAgent(database); break;
    case ThemeletContent::Photo: agent = new PhotoQueryAgent(database); break;
    default: break;
    }
    return agent;
}

QSqlQuery QueryAgent::prepareUrlQuery(QueryActor &actor, const QUrl &url,
                                      const QString &byPath, const QString &bySource)
{
    if (url.isLocalFile()) {
        const QString path = url.toLocalFile();
        const int slash = path.lastIndexOf(QLatin1Char('/'));
        QSqlQuery query = actor.prepareQuery(byPath);
        query.bindValue(0, path.mid(0, slash));
        query.bindValue(1, path.mid(slash + 1));
        return query;
    }
    QSqlQuery query = actor.prepareQuery(bySource);
    query.bindValue(0, url.toString());
    return query;
}

qint64 QueryAgent::idFromColumn(const QSqlQuery &query, int column)
{
    bool ok = false;
    const qint64 id = query.value(column).toLongLong(&ok);
    return ok ? id : 0;
}
