// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "rowcopy.h"

#include <sqlite3.h>

#include <cstring>

static_assert(SqlCell::Integer == SQLITE_INTEGER && SqlCell::Float == SQLITE_FLOAT && SqlCell::Text == SQLITE_TEXT
                      && SqlCell::Blob == SQLITE_BLOB && SqlCell::Null == SQLITE_NULL,
              "the cell types are SQLite's");

QVariant SqlCell::value() const
{
    // As the driver makes them.
    switch (type) {
    case Integer:
        return integer;
    case Float:
        return real;
    case Blob:
        return QByteArray(bytes, size);
    case Text:
        return QString::fromUtf8(bytes, size);
    default:
        return QVariant(QVariant::String);
    }
}

QString SqlCell::text() const
{
    // The index is UTF-8: read as stored, without SQLite's UTF-16 copy.
    return type == Text ? QString::fromUtf8(bytes, size) : value().toString();
}

int SqlCell::toInt() const
{
    return type == Integer ? int(integer) : value().toInt();
}

qint64 SqlCell::id() const
{
    bool ok = false;
    const qint64 id = value().toLongLong(&ok);
    return ok ? id : 0;
}

QString SqlCell::repeatedText(QByteArray *cacheBytes, QString *cacheText) const
{
    if (type != Text)
        return text();
    if (size != cacheBytes->size() || std::memcmp(bytes, cacheBytes->constData(), size_t(size)) != 0) {
        *cacheBytes = QByteArray(bytes, size);
        *cacheText = QString::fromUtf8(bytes, size);
    }
    return *cacheText;
}

void RowCopy::append(const SqlCell &cell)
{
    Stored stored { cell.type, cell.size, cell.integer, cell.real };
    if (cell.type == SqlCell::Text || cell.type == SqlCell::Blob) {
        // -1 keeps a null pointer (an empty blob's) null.
        stored.integer = cell.bytes ? m_bytes.size() : -1;
        m_bytes.append(cell.bytes, cell.size);
    }
    m_cells.append(stored);
}

SqlCell RowCopy::Row::cell(int column) const
{
    const Stored &stored = m_copy->m_cells.at(m_first + column);
    SqlCell cell;
    cell.type = stored.type;
    cell.size = stored.size;
    cell.real = stored.real;
    if (stored.type == SqlCell::Text || stored.type == SqlCell::Blob)
        cell.bytes = stored.integer < 0 ? nullptr : m_copy->m_bytes.constData() + stored.integer;
    else
        cell.integer = stored.integer;
    return cell;
}
