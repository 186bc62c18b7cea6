#ifndef QUERYACTOR_H
#define QUERYACTOR_H

#include <QSqlQuery>
#include <QString>

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
    bool commit();
    void rollback(const QSqlQuery &query, const char *function, const char *message);
    static void warn(const QSqlQuery &query, const char *function, const char *message);

    QString threadId() const;

protected:
    QueryAgentDatabase &m_database;
};

#endif
