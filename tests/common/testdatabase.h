// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef TESTDATABASE_H
#define TESTDATABASE_H

#include "queryagent.h"

#include <QDir>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QTest>
#include <QUuid>

// A connection of the test's own to the index file (or any file), for filling
// tables by SQL and reading them back without going through the engine.
class TestDatabase
{
public:
    // The index file of the sandbox, as QueryAgent::databaseUrl(0) names it.
    static QString indexPath() { return QueryAgent::databaseUrl(0).toLocalFile(); }

    // A QSqlError in its debug form, as log records show it.
    static QString errorText(const char *code, const char *text, const char *driverText = "Unable to execute statement")
    {
        return QStringLiteral("QSqlError(\"%1\", \"%2\", \"%3\")").arg(QLatin1String(code), QLatin1String(driverText), QLatin1String(text));
    }

    explicit TestDatabase(const QString &path = indexPath()) : m_name(QUuid::createUuid().toString())
    {
        QDir().mkpath(QFileInfo(path).absolutePath());
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), m_name);
        db.setDatabaseName(path);
        if (!db.open())
            qWarning() << "TestDatabase: cannot open" << path << db.lastError();
    }
    ~TestDatabase()
    {
        QSqlDatabase::database(m_name, false).close();
        QSqlDatabase::removeDatabase(m_name);
    }

    // Runs each statement; fails the current test on the first error.
    bool exec(const QStringList &statements)
    {
        QSqlQuery query(QSqlDatabase::database(m_name, false));
        for (const QString &statement : statements) {
            if (!query.exec(statement)) {
                QTest::qFail(qPrintable("SQL failed: " + statement + ": " + query.lastError().text()), __FILE__, __LINE__);
                return false;
            }
        }
        return true;
    }
    bool exec(const QString &statement) { return exec(QStringList { statement }); }

    // First column of the first row, or an invalid QVariant.
    QVariant value(const QString &statement)
    {
        QSqlQuery query(QSqlDatabase::database(m_name, false));
        return query.exec(statement) && query.next() ? query.value(0) : QVariant();
    }

    // All rows, columns joined by '|', NULL as "NULL".
    QStringList rows(const QString &statement)
    {
        QSqlQuery query(QSqlDatabase::database(m_name, false));
        if (!query.exec(statement))
            return { QStringLiteral("ERROR: ") + query.lastError().text() };
        QStringList result;
        while (query.next()) {
            QStringList columns;
            for (int i = 0; i < query.record().count(); ++i)
                columns << (query.isNull(i) ? QStringLiteral("NULL") : query.value(i).toString());
            result << columns.join(QLatin1Char('|'));
        }
        return result;
    }

    QString directoryId(const QString &path)
    {
        return value(QStringLiteral("SELECT id FROM directory WHERE path = '%1'").arg(path)).toString();
    }

    // The file rows of a directory by name, the ZEF id at hand as `zefId`.
    QStringList fileRows(const QString &directory, const QString &columns)
    {
        return rows(QStringLiteral("SELECT %1 FROM file LEFT JOIN zefId ON zefId.fileId = file.id WHERE directoryId = "
                                   "(SELECT id FROM directory WHERE path = '%2') ORDER BY fileName").arg(columns, directory));
    }

private:
    QString m_name;
};

#endif
