// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef QUERYAGENTDATABASE_H
#define QUERYAGENTDATABASE_H

#include "themeletcontent.h"

#include <QCache>
#include <QHash>
#include <QSqlDatabase>
#include <QSqlQuery>

class QueryAgent;

// One SQLite connection, private to the thread that made it. It is not
// registered with QSqlDatabase::addDatabase: the connection dies with the object.
class QueryAgentDatabase : public QSqlDatabase
{
public:
    QueryAgentDatabase();
    virtual ~QueryAgentDatabase();

    int threadId() const { return m_threadId; }

private:
    friend class QueryActor;
    friend class QueryAgent;

    QCache<QString, QSqlQuery> m_queryCache;
    QHash<ThemeletContent::Type, QueryAgent *> m_agents;
    int m_threadId;

    Q_DISABLE_COPY(QueryAgentDatabase)
};

#endif
