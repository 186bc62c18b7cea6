// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "queryactor.h"

#include "queryagentdatabase.h"

#include <QDebug>
#include <QSqlError>

#include <algorithm>

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

bool QueryActor::constructorTransaction(const char *function)
{
    if (m_database.transaction())
        return true;
    qWarning("%s", function);
    qWarning("Failed to open transation on database");
    qWarning() << m_database.lastError();
    return false;
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

bool QueryActor::prepareStatements(std::initializer_list<PreparedStatement> statements, const char *function)
{
    for (const PreparedStatement &statement : statements) {
        statement.query->setForwardOnly(true);
        if (!statement.query->prepare(statement.text)) {
            if (statement.failure)
                rollback(*statement.query, function, statement.failure);
            return false;
        }
    }
    return true;
}

bool QueryActor::execBatch(QSqlQuery &query, const QList<QVariantList> &columns, const char *function,
                           const char *failure)
{
    if (columns.isEmpty() || columns.first().isEmpty())
        return true;
    for (int i = 0; i < columns.size(); ++i) {
        const QVariantList &column = columns.at(i);
        const auto marked = std::find_if(column.cbegin(), column.cend(), [](const QVariant &value) {
            return value.userType() == QMetaType::QString && value.toString().startsWith(QChar(0xFEFF));
        });
        if (marked == column.cend()) {
            query.bindValue(i, column);
            continue;
        }
        QVariantList kept = column;
        for (QVariant &value : kept) {
            if (value.userType() == QMetaType::QString)
                value = text(value.toString());
        }
        query.bindValue(i, kept);
    }
    return execBatch(query, function, failure);
}

QVariant QueryActor::text(const QString &value)
{
    return value.startsWith(QChar(0xFEFF)) ? QVariant(QChar(0xFEFF) + value) : QVariant(value);
}

bool QueryActor::execBatch(QSqlQuery &query, const char *function, const char *failure)
{
    if (!query.execBatch()) {
        rollback(query, function, failure);
        return false;
    }
    query.finish();
    return true;
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
