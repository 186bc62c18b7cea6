// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef STATEMENTREADER_H
#define STATEMENTREADER_H

#include "rowcopy.h"

#include <QSqlQuery>
#include <QString>
#include <QVariant>

typedef struct sqlite3_stmt sqlite3_stmt;

// Walks the rows of an executed query and reads their columns with the values
// Qt's SQLite driver gives. The first row comes through Qt; with `direct`, the
// rows after it are stepped and read straight from the statement under the
// query: the driver converts every text column to UTF-16 through a copy of
// SQLite's own and keeps each value in a QVariant, which over a list of
// 100,000 photos was half of the query thread's time.
class StatementReader
{
public:
    explicit StatementReader(QSqlQuery &query, bool direct = false);

    // The SQLite statement behind a prepared query; null for another driver.
    static sqlite3_stmt *statementOf(QSqlQuery &query);

    // The next row; false at the end (or on an error, as QSqlQuery::next()).
    bool next();

    QVariant value(int column) const;
    QString text(int column) const;
    // For a column most rows repeat (a MIME type): a text equal to the last one
    // read here shares that string instead of making its own.
    QString repeatedText(int column) const;
    int integer(int column) const;
    // The id column as qint64; 0 when it can't be converted.
    qint64 id(int column) const;

    // Whether the current row is read from the statement itself; only then
    // can it be copied.
    bool isDirect() const { return m_statement != nullptr; }
    int columnCount() const;
    // Appends every column of the current, direct row to `copy`.
    void copyRow(RowCopy *copy) const;

private:
    SqlCell cell(int column) const;

    QSqlQuery &m_query;
    sqlite3_stmt *m_direct = nullptr;   // the statement, once the first row is read
    sqlite3_stmt *m_statement = nullptr; // set while its rows are the current ones
    mutable QByteArray m_repeatedBytes;
    mutable QString m_repeatedText;
    bool m_started = false;
    bool m_done = false;
};

#endif
