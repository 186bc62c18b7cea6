// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "statementreader.h"

#include <QSqlResult>

#include <sqlite3.h>

#include <cstring>

StatementReader::StatementReader(QSqlQuery &query, bool direct)
    : m_query(query)
{
    if (!direct || !query.result())
        return;
    // Qt hands out the statement of its SQLite driver as an opaque pointer.
    const QVariant handle = query.result()->handle();
    if (handle.isValid() && qstrcmp(handle.typeName(), "sqlite3_stmt*") == 0)
        m_direct = *static_cast<sqlite3_stmt *const *>(handle.constData());
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

QVariant StatementReader::value(int column) const
{
    if (!m_statement)
        return m_query.value(column);
    // As the driver makes them.
    switch (sqlite3_column_type(m_statement, column)) {
    case SQLITE_INTEGER:
        return qint64(sqlite3_column_int64(m_statement, column));
    case SQLITE_FLOAT:
        return sqlite3_column_double(m_statement, column);
    case SQLITE_NULL:
        return QVariant(QVariant::String);
    case SQLITE_BLOB:
        return QByteArray(static_cast<const char *>(sqlite3_column_blob(m_statement, column)),
                          sqlite3_column_bytes(m_statement, column));
    default:
        return directText(column);
    }
}

QString StatementReader::directText(int column) const
{
    if (sqlite3_column_type(m_statement, column) != SQLITE_TEXT)
        return value(column).toString();
    // The index is UTF-8: read as stored, without SQLite's UTF-16 copy.
    const char *text = reinterpret_cast<const char *>(sqlite3_column_text(m_statement, column));
    return QString::fromUtf8(text, sqlite3_column_bytes(m_statement, column));
}

QString StatementReader::repeatedText(int column) const
{
    if (!m_statement || sqlite3_column_type(m_statement, column) != SQLITE_TEXT)
        return text(column);
    const char *text = reinterpret_cast<const char *>(sqlite3_column_text(m_statement, column));
    const int size = sqlite3_column_bytes(m_statement, column);
    if (size != m_repeatedBytes.size() || std::memcmp(text, m_repeatedBytes.constData(), size_t(size)) != 0) {
        m_repeatedBytes = QByteArray(text, size);
        m_repeatedText = QString::fromUtf8(text, size);
    }
    return m_repeatedText;
}

int StatementReader::directInteger(int column) const
{
    if (sqlite3_column_type(m_statement, column) != SQLITE_INTEGER)
        return value(column).toInt();
    return int(sqlite3_column_int64(m_statement, column));
}

qint64 StatementReader::id(int column) const
{
    bool ok = false;
    const qint64 id = value(column).toLongLong(&ok);
    return ok ? id : 0;
}
