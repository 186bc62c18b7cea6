// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "queryactor.h"

#include "queryagentdatabase.h"
#include "statementreader.h"

#include <QDateTime>
#include <QDebug>
#include <QSqlError>

#include <algorithm>

#include <sqlite3.h>

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

namespace {

// The types bound here as Qt's SQLite driver binds them; others are left to Qt.
bool boundHere(const QVariant &value)
{
    switch (value.isNull() ? QMetaType::Void : value.userType()) {
    case QMetaType::Void:
    case QMetaType::Int:
    case QMetaType::Bool:
    case QMetaType::UInt:
    case QMetaType::LongLong:
    case QMetaType::Double:
    case QMetaType::QString:
    case QMetaType::QDateTime:
        return true;
    default:
        return false;
    }
}

int bind(sqlite3_stmt *statement, int position, const QVariant &value)
{
    if (value.isNull())
        return sqlite3_bind_null(statement, position);
    switch (value.userType()) {
    case QMetaType::Int:
    case QMetaType::Bool:
        return sqlite3_bind_int(statement, position, value.toInt());
    case QMetaType::UInt:
    case QMetaType::LongLong:
        return sqlite3_bind_int64(statement, position, value.toLongLong());
    case QMetaType::Double:
        return sqlite3_bind_double(statement, position, value.toDouble());
    case QMetaType::QDateTime: {
        const QString text = value.toDateTime().toString(Qt::ISODateWithMs);
        return sqlite3_bind_text16(statement, position, text.utf16(), text.size() * int(sizeof(QChar)),
                                   SQLITE_TRANSIENT);
    }
    default: {
        const QString *text = static_cast<const QString *>(value.constData());
        return sqlite3_bind_text16(statement, position, text->utf16(), text->size() * int(sizeof(QChar)),
                                   SQLITE_STATIC);
    }
    }
}

enum class Batch { Done, NotMine, Failed };

// Qt runs a batch on SQLite as one exec() per row, and each exec() copies
// every bound column and converts every value: on a first index that was a
// fifth of the work. This runs the prepared statement row by row itself.
// NotMine before any row ran when a value needs Qt's own conversion; on a
// failure *row is the row that failed, and the rows before it have run.
Batch stepRows(QSqlQuery &query, const QList<QVariantList> &columns, int *row)
{
    sqlite3_stmt *statement = StatementReader::statementOf(query);
    if (!statement || sqlite3_bind_parameter_count(statement) != columns.size())
        return Batch::NotMine;
    const int rows = columns.first().size();
    for (const QVariantList &column : columns) {
        if (column.size() != rows)
            return Batch::NotMine;
        if (!std::all_of(column.cbegin(), column.cend(), boundHere))
            return Batch::NotMine;
    }
    Batch outcome = Batch::Done;
    for (*row = 0; *row < rows; ++*row) {
        int result = sqlite3_reset(statement);
        for (int i = 0; result == SQLITE_OK && i < columns.size(); ++i)
            result = bind(statement, i + 1, columns.at(i).at(*row));
        if (result == SQLITE_OK)
            result = sqlite3_step(statement);
        if (result != SQLITE_DONE && result != SQLITE_ROW) {
            outcome = Batch::Failed;
            break;
        }
    }
    // No binding may outlive the values it points into.
    sqlite3_reset(statement);
    sqlite3_clear_bindings(statement);
    return outcome;
}

}

bool QueryActor::execBatch(QSqlQuery &query, const QList<QVariantList> &columns, const char *function,
                           const char *failure)
{
    if (columns.isEmpty() || columns.first().isEmpty())
        return true;
    QList<QVariantList> bound = columns;
    for (int i = 0; i < columns.size(); ++i) {
        const QVariantList &column = columns.at(i);
        const auto marked = std::find_if(column.cbegin(), column.cend(), [](const QVariant &value) {
            return value.userType() == QMetaType::QString
                    && static_cast<const QString *>(value.constData())->startsWith(QChar(0xFEFF));
        });
        if (marked == column.cend())
            continue;
        for (QVariant &value : bound[i]) {
            if (value.userType() == QMetaType::QString)
                value = text(value.toString());
        }
    }
    int row = 0;
    switch (stepRows(query, bound, &row)) {
    case Batch::Done:
        query.finish();
        return true;
    case Batch::Failed:
        // The failed row once more through Qt, for its error as Qt reports it.
        for (int i = 0; i < bound.size(); ++i)
            query.bindValue(i, bound.at(i).at(row));
        if (query.exec())
            break; // not failing a second time: the batch still failed
        rollback(query, function, failure);
        return false;
    case Batch::NotMine:
        for (int i = 0; i < bound.size(); ++i)
            query.bindValue(i, bound.at(i));
        return execBatch(query, function, failure);
    }
    rollback(query, function, failure);
    return false;
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
