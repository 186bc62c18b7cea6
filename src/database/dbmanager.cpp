// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "dbmanager.h"

#include "contentmanager.h"
#include "queryagent.h"

#include <QDebug>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QLocale>
#include <QSettings>
#include <QSqlError>
#include <QSqlQuery>

namespace {

const int CurrentVersion = 12;
const int PackageScope = 2;

const char *const SchemaStatements[] = {
    "PRAGMA user_version = 12;",
    "CREATE TABLE directory ( id INTEGER PRIMARY KEY AUTOINCREMENT, parentId INTEGER, path TEXT UNIQUE, scope INTEGER NOT NULL);",
    "CREATE TABLE file ( id INTEGER PRIMARY KEY AUTOINCREMENT, directoryId INTEGER NOT NULL, mimeType TEXT, fileName TEXT, displayName TEXT, modificationTime DATETIME, permissions INTEGER NOT NULL, metadataCurrent BOOL, category TEXT);",
    "CREATE TABLE image ( fileId INTEGER PRIMARY KEY, dateTaken DATETIME, width INTEGER, height INTEGER, orientation INTEGER);",
    "CREATE TABLE themelet ( fileId INTEGER PRIMARY KEY, favorite INTEGER DEFAULT 0, homeWallpaper TEXT, applicationWallpaper TEXT, highlightColor TEXT, secondaryHighlightColor TEXT, primaryColor TEXT, secondaryColor TEXT, timestamp TEXT, ringerVolume INTEGER, enabledSounds INTEGER, partnerSpace TEXT, version INTEGER);",
    "CREATE TABLE zefId ( fileId INTEGER PRIMARY KEY, zefId TEXT);",
    "CREATE TABLE download ( fileId INTEGER PRIMARY KEY, source TEXT);",
    "CREATE TABLE resource ( fileId INTEGER, resourceType TEXT, resourceId INTEGER);",
    "CREATE UNIQUE INDEX file_directory ON file (directoryId, fileName);",
    "CREATE UNIQUE INDEX resource_fileId_resourceType ON resource (fileId, resourceType);",
    "CREATE INDEX resource_file_id ON resource (fileId);",
    "CREATE INDEX resource_resource_id ON resource (resourceId);",
    "CREATE TRIGGER delete_file_trigger BEFORE DELETE ON file FOR EACH ROW BEGIN DELETE FROM themelet WHERE fileId = OLD.id; DELETE FROM image WHERE fileId = OLD.id; DELETE FROM download WHERE fileId = OLD.id; DELETE FROM resource WHERE fileId = OLD.id OR resourceId = OLD.id; DELETE FROM zefId WHERE fileId = OLD.id; END;",
    "CREATE TRIGGER delete_directory_trigger BEFORE DELETE ON directory FOR EACH ROW BEGIN DELETE FROM file WHERE directoryId = OLD.id; DELETE FROM directory WHERE parentId = OLD.id; END;",
};

}

DbManager &DbManager::instance()
{
    static DbManager s_instance;
    return s_instance;
}

DbManager::DbManager()
{
    const QUrl url = QueryAgent::databaseUrl(0);
    const QString path = url.toLocalFile();

    bool existing = QFile::exists(path);
    if (!existing && !QFileInfo(path).dir().mkpath(QStringLiteral("."))) {
        qWarning() << "DbManager::DbManager: failed to create directory '" << path << "' for db!";
        return;
    }

    setConnectOptions(QStringLiteral("QSQLITE_OPEN_URI"));

    // At most one nuke per run: the second failure leaves the connection closed.
    forever {
        setDatabaseName(url.toString());
        open(); // a failed open shows up as a failed version query below

        QSqlQuery query(*this);
        query.exec(QStringLiteral("PRAGMA temp_store = MEMORY;"));
        query.exec(QStringLiteral("PRAGMA journal_mode = WAL;"));

        bool ok = false;
        if (!existing && !createDatabaseSchema(*this)) {
            qCritical("DbManager::DbManager: Failed to create DB schema. Can't continue!");
        } else if (!query.exec(QStringLiteral("PRAGMA user_version;"))) {
            qWarning("DbManager::DbManager()");
            qWarning("Failed to query user version");
            qWarning() << query.lastError();
        } else {
            const bool hasRow = query.next();
            int version = hasRow ? query.value(0).toInt() : 0;
            if (!hasRow || version != CurrentVersion) {
                transaction();
                version = upgrade(version);
                commit();
            }
            if (version == CurrentVersion)
                ok = true;
            else
                qWarning("Database version outdated or non-existent");
        }

        if (ok) {
            query = QSqlQuery();
            qDebug() << "DbManager::DbManager()" << "Themelet DB Fine...";
            checkLocale();
            return;
        }

        query = QSqlQuery();
        close();
        if (!existing)
            return;

        qWarning() << "DbManager::DbManager()" << "Nuking themelet database due previous errors!";
        qWarning() << "Delete: " << path;
        QFile::remove(path);
        QFile::remove(path + QLatin1String("-shm"));
        QFile::remove(path + QLatin1String("-wal"));
        existing = false;
    }
}

DbManager::~DbManager()
{
    // The connection goes before the managers that hold statements on it.
    if (isOpen())
        close();
    qDeleteAll(m_contentManagers);
    m_contentManagers.clear();
}

int DbManager::upgrade(int version)
{
    switch (version) {
    case 7:
        updateSchema_v7to8();
        Q_FALLTHROUGH();
    case 8:
    case 9: // 9 never had a step of its own
        updateSchema_v8to10();
        Q_FALLTHROUGH();
    case 10:
        if (!resetIndexesForReparsing() || !updateSchemaVersion(QStringLiteral("11")))
            return 10;
        Q_FALLTHROUGH();
    case 11:
        updateSchema_v11to12();
        return 12;
    case 13:
        dropSchema_v13();
        return 12;
    default:
        return version;
    }
}

bool DbManager::createDatabaseSchema(const QSqlDatabase &database)
{
    bool ok = true;
    QSqlQuery query(database);
    for (const char *statement : SchemaStatements) {
        if (!query.exec(QLatin1String(statement))) {
            qWarning("bool DbManager::createDatabaseSchema(const QSqlDatabase&)");
            qWarning("Initialization failed");
            qWarning() << QLatin1String(statement);
            qWarning() << query.lastError();
            ok = false;
        }
    }
    query.finish();
    return ok;
}

bool DbManager::updateSchemaVersion(const QString &version)
{
    const QString number = version.isEmpty() ? QStringLiteral("12") : version;
    QSqlQuery query(*this);
    const bool ok = query.exec(QStringLiteral("PRAGMA user_version=%1;").arg(number));
    if (!ok) {
        qWarning("bool DbManager::updateSchemaVersion(const QString&)");
        qWarning("Failed to update version!");
        qWarning() << query.lastQuery();
        qWarning() << query.lastError();
    }
    query.finish();
    if (ok)
        qDebug() << "bool DbManager::updateSchemaVersion(const QString&)"
                 << "Updated themelet database to version: " << number;
    return ok;
}

bool DbManager::updateSchema(const char *function, const char *message, const QString &statement,
                             const QString &version)
{
    qDebug() << function << message;
    {
        QSqlQuery query(*this);
        const bool ok = query.exec(statement);
        if (!ok) {
            qWarning("%s", function);
            qWarning("Initialization failed");
            qWarning() << statement;
            qWarning() << query.lastError();
        }
        query.finish();
        // The ladder goes on regardless; this step just leaves its version unwritten.
        if (!ok)
            return false;
    }
    if (!resetThemeletsForReparsing())
        return false;
    return updateSchemaVersion(version);
}

bool DbManager::updateSchema_v7to8()
{
    return updateSchema("bool DbManager::updateSchema_v7to8()",
                        "Updating database schema from version 7 to 8!",
                        QStringLiteral("ALTER TABLE themelet ADD COLUMN partnerSpace TEXT;"),
                        QStringLiteral("8"));
}

bool DbManager::updateSchema_v8to10()
{
    return updateSchema("bool DbManager::updateSchema_v8to10()",
                        "Updating database schema from version 8 to 10!",
                        QStringLiteral("ALTER TABLE themelet ADD COLUMN version INTEGER;"),
                        QStringLiteral("10"));
}

bool DbManager::updateSchema_v11to12()
{
    return updateSchema("bool DbManager::updateSchema_v11to12()",
                        "Updating database schema from version 11 to 12!",
                        QStringLiteral("ALTER TABLE file ADD COLUMN category TEXT;"),
                        QStringLiteral("12"));
}

bool DbManager::dropSchema_v13()
{
    // 13 was only ever a number: there is nothing to undo but the version.
    qDebug() << "bool DbManager::dropSchema_v13()" << "Reverting database schema version 13!";
    return updateSchemaVersion(QStringLiteral("12"));
}

bool DbManager::resetForReparsing(const char *function, const QString &statement)
{
    QSqlQuery query(*this);
    const bool ok = query.exec(statement);
    if (!ok) {
        qWarning("%s", function);
        qWarning("Failed to reset themelets for reparsing!");
        qWarning() << query.lastQuery();
        qWarning() << query.lastError();
    }
    query.finish();
    return ok;
}

bool DbManager::resetThemeletsForReparsing()
{
    return resetForReparsing("bool DbManager::resetThemeletsForReparsing()",
                             QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE mimeType=\"application/x-vorka-themelet\";"));
}

bool DbManager::resetIndexesForReparsing()
{
    return resetForReparsing("bool DbManager::resetIndexesForReparsing()",
                             QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE mimeType=\"application/x-vorka-index\";"));
}

void DbManager::checkLocale()
{
    QSettings settings(QStringLiteral("Vorka"), QStringLiteral("themeletd"));
    const QString locale = QLocale().name();
    if (settings.value(QStringLiteral("locale")).toString() == locale)
        return;

    // Stored first: a failed update is not retried until the locale changes again.
    settings.setValue(QStringLiteral("locale"), locale);
    settings.sync();

    QSqlQuery query(*this);
    if (!query.exec(QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE directoryId IN ( SELECT id FROM directory WHERE scope = %1);").arg(PackageScope))) {
        qWarning("DbManager::DbManager()");
        qWarning("Failed to schedule a translation update");
        qWarning() << query.lastError();
        qWarning() << query.lastQuery();
    }
}
