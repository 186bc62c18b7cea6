// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef ROWCOPY_H
#define ROWCOPY_H

#include <QByteArray>
#include <QString>
#include <QVariant>
#include <QVector>

// One column of a row as SQLite holds it, read into the values Qt's SQLite
// driver gives. The bytes belong to whoever made the cell.
struct SqlCell
{
    // SQLite's fundamental types, with its numbers.
    enum Type { Integer = 1, Float = 2, Text = 3, Blob = 4, Null = 5 };

    int type = Null;
    qint64 integer = 0;
    double real = 0;
    const char *bytes = nullptr;
    int size = 0;

    QVariant value() const;
    QString text() const;
    int toInt() const;
    qint64 id() const; // 0 when it can't be converted
    // For a column most rows repeat (a MIME type): a text equal to the one in
    // `cache` shares its string instead of making its own.
    QString repeatedText(QByteArray *cacheBytes, QString *cacheText) const;
};

// Rows copied off a statement into one buffer, to be read on another thread:
// a list's records can then be made while the statement steps on.
class RowCopy
{
public:
    explicit RowCopy(int columns) : m_columns(columns) { m_bytes.reserve(4096); }

    int rows() const { return m_columns > 0 ? m_cells.size() / m_columns : 0; }
    void append(const SqlCell &cell);
    // Empty again, with the room it had: copies are used over and over.
    void clear()
    {
        m_cells.clear();
        m_bytes.resize(0); // reserved, so the room stays
    }

    // Reads the rows of a copy with StatementReader's accessors.
    class Row
    {
    public:
        void set(const RowCopy *copy, int row)
        {
            m_copy = copy;
            m_first = row * copy->m_columns;
        }
        QVariant value(int column) const { return cell(column).value(); }
        QString text(int column) const { return cell(column).text(); }
        QString repeatedText(int column) const { return cell(column).repeatedText(&m_cacheBytes, &m_cacheText); }
        int integer(int column) const { return cell(column).toInt(); }
        qint64 id(int column) const { return cell(column).id(); }

    private:
        SqlCell cell(int column) const;

        const RowCopy *m_copy = nullptr;
        int m_first = 0;
        mutable QByteArray m_cacheBytes;
        mutable QString m_cacheText;
    };

private:
    struct Stored
    {
        int type;
        int size;
        qint64 integer; // the offset in m_bytes for texts and blobs
        double real;
    };

    const int m_columns;
    QVector<Stored> m_cells;
    QByteArray m_bytes;
};

#endif
