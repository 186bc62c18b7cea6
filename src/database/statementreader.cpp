// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "statementreader.h"

#include <QSqlResult>

#include <sqlite3.h>

StatementReader::StatementReader(QSqlQuery &query, bool direct)
    : m_query(query)
{
    if (direct)
        m_direct = statementOf(query);
}

sqlite3_stmt *StatementReader::statementOf(QSqlQuery &query)
{
    if (!query.result())
        return nullptr;
    // Qt hands out the statement of its SQLite driver as an opaque pointer.
    const QVariant handle = query.result()->handle();
    if (!handle.isValid() || qstrcmp(handle.typeName(), "sqlite3_stmt*") != 0)
        return nullptr;
    return *static_cast<sqlite3_stmt *const *>(handle.constData());
}

bool StatementReader::next()
{
    // Never stepped again once done: a step after the end would run the statement anew.
    if (m_done)
        return false;
    // Qt has stepped to the first row at exec() and holds its values.
    if (!m_started || !m_direct) {
        m_started = true;
        m_done = !m_query.next();
        return !m_done;
    }
    if (sqlite3_step(m_direct) == SQLITE_ROW) {
        m_statement = m_direct;
        return true;
    }
    // The end, or an error that ends the rows as it does in Qt; either way the
    // statement is reset for the next exec().
    m_statement = nullptr;
    m_done = true;
    m_query.finish();
    return false;
}

SqlCell StatementReader::cell(int column) const
{
    SqlCell cell;
    cell.type = sqlite3_column_type(m_statement, column);
    switch (cell.type) {
    case SQLITE_INTEGER:
        cell.integer = sqlite3_column_int64(m_statement, column);
        break;
    case SQLITE_FLOAT:
        cell.real = sqlite3_column_double(m_statement, column);
        break;
    case SQLITE_TEXT:
        cell.bytes = reinterpret_cast<const char *>(sqlite3_column_text(m_statement, column));
        cell.size = sqlite3_column_bytes(m_statement, column);
        break;
    case SQLITE_BLOB:
        cell.bytes = static_cast<const char *>(sqlite3_column_blob(m_statement, column));
        cell.size = sqlite3_column_bytes(m_statement, column);
        break;
    default:
        break;
    }
    return cell;
}

QVariant StatementReader::value(int column) const
{
    return m_statement ? cell(column).value() : m_query.value(column);
}

QString StatementReader::text(int column) const
{
    return m_statement ? cell(column).text() : m_query.value(column).toString();
}

QString StatementReader::repeatedText(int column) const
{
    return m_statement ? cell(column).repeatedText(&m_repeatedBytes, &m_repeatedText) : text(column);
}

int StatementReader::integer(int column) const
{
    return m_statement ? cell(column).toInt() : m_query.value(column).toInt();
}

qint64 StatementReader::id(int column) const
{
    bool ok = false;
    const qint64 id = value(column).toLongLong(&ok);
    return ok ? id : 0;
}

void StatementReader::copyRow(RowCopy *copy) const
{
    const int columns = sqlite3_column_count(m_statement);
    for (int column = 0; column < columns; ++column)
        copy->append(cell(column));
}

int StatementReader::columnCount() const
{
    return m_statement ? sqlite3_column_count(m_statement) : 0;
}
