#include "queryactor.h"

#include "queryagentdatabase.h"

#include <QDebug>
#include <QSqlError>

QueryActor::QueryActor(QueryAgentDatabase &database)
    : m_database(database)
{
}

QueryActor::~QueryActor() = default;

QSqlQuery QueryActor::prepareQuery(const QString &statement)
{
    if (QSqlQuery *cached = m_database.m_queryCache.object(statement))
        return *cached;

    QSqlQuery query(m_database);
    query.setForwardOnly(true);
    if (!query.prepare(statement)) {
        warn(query, "QSqlQuery QueryActor::prepareQuery(const QString&)", "Failed to prepare query");
        return QSqlQuery(QString(), QSqlDatabase());
    }
    m_database.m_queryCache.insert(statement, new QSqlQuery(query), 1);
    return query;
}

bool QueryActor::transaction()
{
    return m_database.transaction();
}

bool QueryActor::commit()
{
    return m_database.commit();
}

void QueryActor::rollback(const QSqlQuery &query, const char *function, const char *message)
{
    warn(query, function, message);
    m_database.rollback();
}

void QueryActor::warn(const QSqlQuery &query, const char *function, const char *message)
{
    qWarning().noquote() << (function ? function : "");
    qWarning().noquote() << (message ? message : "");
    qWarning() << query.lastError();
    qWarning() << query.lastQuery();
}

QString QueryActor::threadId() const
{
    return QString::number(m_database.threadId());
}
