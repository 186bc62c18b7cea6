// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef QUERYACTOR_H
#define QUERYACTOR_H

#include <QList>
#include <QSqlQuery>
#include <QString>
#include <QVariant>

#include <initializer_list>

class QueryAgentDatabase;

// Everything that runs statements on a connection. Use only on the
// connection's own thread.
class QueryActor
{
public:
    explicit QueryActor(QueryAgentDatabase &database);
    virtual ~QueryActor();

    // Cached per connection (20 statements, least recently used dropped first).
    // On failure the result is a query that can't execute; callers report that.
    QSqlQuery prepareQuery(const QString &statement);

    bool transaction();
    // A constructor's transaction: on failure the report is the function, the
    // text and the connection's error.
    bool constructorTransaction(const char *function);
    bool commit();
    void rollback(const QSqlQuery &query, const char *function, const char *message);

    // A member statement with the report of its failed preparation.
    struct PreparedStatement
    {
        QSqlQuery *query;
        QString text;
        const char *failure;
    };
    // Prepares forward-only, in order; the first failure rolls back with its
    // report and stops, leaving the later statements unprepared. A statement
    // without a failure text stops silently, with nothing rolled back.
    bool prepareStatements(std::initializer_list<PreparedStatement> statements, const char *function);
    // Binds one list per position and runs the batch, unless the first list is
    // empty; a failure rolls back with the report.
    // SQLite takes a leading U+FEFF of a bound string for a byte order mark and
    // drops it; a name that starts with one is bound with one more, so that it
    // is stored, and found, as it is on disk.
    static QVariant text(const QString &value);

    bool execBatch(QSqlQuery &query, const QList<QVariantList> &columns, const char *function,
                   const char *failure);
    // The same for a statement whose lists are bound already.
    bool execBatch(QSqlQuery &query, const char *function, const char *failure);
    static void warn(const QSqlQuery &query, const char *function, const char *message);

    QString threadId() const;

protected:
    QueryAgentDatabase &m_database;
};

#endif
