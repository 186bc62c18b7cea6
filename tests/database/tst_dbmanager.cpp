// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "dbmanager.h"
#include "messagelog.h"
#include "testdatabase.h"

#include <QtTest>
#include <QSettings>

#include <memory>
#include <sys/stat.h>

namespace {

enum Setup { NoFile = -1, NotADatabase = -2 }; // files not of a schema version

const QString Fine = QStringLiteral("debug: DbManager::DbManager() Themelet DB Fine...");

const auto warnings = &MessageLog::warningRecords;

ino_t inode(const QString &path)
{
    struct stat info;
    return ::stat(QFile::encodeName(path).constData(), &info) == 0 ? info.st_ino : 0;
}

}

class tst_DbManager : public QObject
{
    Q_OBJECT

private slots:
    void init() { QDir(m_system).removeRecursively(); }

    void startUp_data()
    {
        QTest::addColumn<int>("schema"); // of the tables written, or a Setup
        QTest::addColumn<int>("stamped");
        QTest::addColumn<bool>("metadataCurrent"); // the column exists, set in every row
        QTest::addColumn<QString>("locale");       // stored beforehand; empty: none
        QTest::addColumn<QStringList>("log");
        QTest::addColumn<QString>("flags");        // metadataCurrent of the files

        const QString here = QLocale().name();
        auto step = [](int from, int to) {
            return QString("debug: bool DbManager::updateSchema_v%1to%2() Updating database schema from version %1 to %2!").arg(from).arg(to);
        };
        auto written = [](int version) {
            return QString("debug: bool DbManager::updateSchemaVersion(const QString&) Updated themelet database to version:  \"%1\"").arg(version);
        };
        const QStringList nuke = warnings({ "DbManager::DbManager() Nuking themelet database due previous errors!",
                                            QStringLiteral("Delete:  \"%1\"").arg(m_path) }) << Fine;
        const QStringList outdated = warnings({ "Database version outdated or non-existent" }) + nuke;

        QTest::newRow("no file") << int(NoFile) << 0 << true << QString() << QStringList { Fine } << "";
        QTest::newRow("12") << 12 << 12 << true << here << QStringList { Fine } << "1 1 1 1 1";
        QTest::newRow("7") << 7 << 7 << true << here << QStringList { step(7, 8), written(8), step(8, 10), written(10), written(11),
                                                                    step(11, 12), written(12), Fine } << "0 0 1 0 1";
        QTest::newRow("13") << 12 << 13 << true << here
                << QStringList { "debug: bool DbManager::dropSchema_v13() Reverting database schema version 13!", written(12), Fine }
                << "1 1 1 1 1";
        QTest::newRow("10, reset fails") << 10 << 10 << false << here
                << warnings({ "bool DbManager::resetIndexesForReparsing()", "Failed to reset themelets for reparsing!",
                              "\"UPDATE file SET metadataCurrent = 0 WHERE mimeType=\\\"application/x-vorka-index\\\";\"",
                              TestDatabase::errorText("1", "no such column: metadataCurrent") }) + outdated
                << "";
        QTest::newRow("14") << 12 << 14 << true << here << outdated << "";
        QTest::newRow("not a database") << int(NotADatabase) << 0 << true << here
                << warnings({ "DbManager::DbManager()", "Failed to query user version",
                              TestDatabase::errorText("26", "file is not a database", "Unable to fetch row") }) + nuke
                << "";
        // Another locale marks the files of packages for reading again.
        QTest::newRow("other locale") << 12 << 12 << true << "fi_FI" << QStringList { Fine } << "1 1 1 0 0";
    }

    void startUp()
    {
        QFETCH(int, schema);
        QFETCH(int, stamped);
        QFETCH(bool, metadataCurrent);
        QFETCH(QString, locale);
        QFETCH(QStringList, log);
        QFETCH(QString, flags);

        // Old files stay open so that new ones can't take their inodes; a WAL connection keeps "-shm" and "-wal".
        std::unique_ptr<TestDatabase> old;
        QFile blocker(m_path);
        if (schema == NotADatabase) {
            QDir().mkpath(QFileInfo(blocker).absolutePath());
            QVERIFY(blocker.open(QIODevice::WriteOnly) && blocker.write(QByteArray(4096, 'x')) && blocker.flush());
        } else if (schema != NoFile) {
            // A current index taken back to `schema` (7 lacks themelet.partnerSpace, 8 and 9 themelet.version,
            // 10 and 11 file.category); three files in a plain directory and two in a package, all read.
            MessageLog quiet(false);
            QVERIFY(DbManager().isOpen());
            old.reset(new TestDatabase);
            old->exec({ QStringLiteral("PRAGMA user_version = %1;").arg(stamped),
                        "INSERT INTO directory (id, path, scope) VALUES (1, '/home/user/Pictures', 0), (2, '/usr/share/themelet/dusk', 2);",
                        "INSERT INTO file (id, directoryId, mimeType, fileName, permissions, metadataCurrent) VALUES "
                        "(1, 1, 'application/x-vorka-themelet', 'a', 3, 1), (2, 1, 'application/x-vorka-index', 'b', 3, 1), "
                        "(3, 1, 'image/jpeg', 'c', 3, 1), (4, 2, 'application/x-vorka-themelet', 'd', 3, 1), (5, 2, 'audio/ogg', 'e', 3, 1);" });
            const std::pair<int, const char *> drops[] = { { 12, "file DROP COLUMN category" }, { 10, "themelet DROP COLUMN version" },
                    { 8, "themelet DROP COLUMN partnerSpace" }, { metadataCurrent ? 0 : 13, "file DROP COLUMN metadataCurrent" } };
            for (const auto &[below, column] : drops) {
                if (schema < below)
                    old->exec(QStringLiteral("ALTER TABLE %1;").arg(column));
            }
        }
        QMap<QString, ino_t> inodes;
        for (const QString &file : { m_path, m_path + "-shm", m_path + "-wal" }) {
            if (const ino_t node = inode(file))
                inodes.insert(file, node);
        }
        QSettings settings(QStringLiteral("Vorka"), QStringLiteral("themeletd"));
        locale.isEmpty() ? settings.remove(QStringLiteral("locale")) : settings.setValue(QStringLiteral("locale"), locale);

        MessageLog capture(log);
        DbManager manager; // kept open: the files it made are there to be looked at
        QVERIFY(manager.isOpen());
        QCOMPARE(capture.records(), log);
        settings.sync();
        QCOMPARE(settings.value(QStringLiteral("locale")).toString(), QLocale().name());
        // A rebuild deletes every old file; an upgrade keeps the file.
        const bool rebuilt = capture.records().join(' ').contains(QLatin1String("Nuking"));
        for (auto it = inodes.cbegin(); it != inodes.cend(); ++it)
            QVERIFY2(rebuilt ? inode(it.key()) != it.value() : it.key() != m_path || inode(it.key()) == it.value(), qPrintable(it.key()));

        TestDatabase db;
        QCOMPARE(db.value("PRAGMA user_version;").toInt(), 12);
        QCOMPARE(db.value("PRAGMA journal_mode;").toString(), QStringLiteral("wal"));
        QCOMPARE(db.rows("SELECT name FROM pragma_table_info('file')").join(' '),
                 QStringLiteral("id directoryId mimeType fileName displayName modificationTime permissions metadataCurrent category"));
        QCOMPARE(db.rows("SELECT name FROM pragma_table_info('themelet')").join(' '),
                 QStringLiteral("fileId favorite homeWallpaper applicationWallpaper highlightColor secondaryHighlightColor primaryColor "
                                "secondaryColor timestamp ringerVolume enabledSounds partnerSpace version"));
        QCOMPARE(db.rows("SELECT metadataCurrent FROM file ORDER BY id").join(' '), flags);
        QCOMPARE(db.rows("SELECT name FROM sqlite_master WHERE name NOT LIKE 'sqlite_%' ORDER BY type, name").join(' '),
                 QStringLiteral("file_directory resource_fileId_resourceType resource_file_id resource_resource_id directory "
                                "download file image resource themelet zefId delete_directory_trigger delete_file_trigger"));
    }

    void failedRebuild()
    {
        // A directory at the file's path: reading the version, removal and rebuild fail. One nuke, then closed.
        QVERIFY(QDir().mkpath(m_path));
        MessageLog capture(false);
        QVERIFY(!DbManager().isOpen());
        QCOMPARE(capture.records().filter("Nuking").size(), 1);
        QCOMPARE(capture.records().last(), QStringLiteral("critical: DbManager::DbManager: Failed to create DB schema. Can't continue!"));
    }

    void triggers()
    {
        // Directories 1 > 2 > 3, file n in directory n. A directory takes its files and its children along, not its
        // grandchildren nor its children's files; a file takes its rows and the resources naming it.
        QVERIFY(DbManager().isOpen());
        TestDatabase db;
        db.exec({ "INSERT INTO directory (id, parentId, path, scope) VALUES (1, NULL, '/a', 0), (2, 1, '/a/b', 0), (3, 2, '/a/b/c', 0);",
                  "INSERT INTO file (id, directoryId, fileName, permissions) VALUES (1, 1, 'f', 3), (2, 2, 'f', 3), (3, 3, 'f', 3);",
                  "INSERT INTO resource (fileId, resourceType, resourceId) VALUES (1, 'r', 2), (2, 'r', 1), (2, 'w', 3);" });
        for (const char *table : { "themelet", "image", "download", "zefId" })
            db.exec(QStringLiteral("INSERT INTO %1 (fileId) VALUES (1), (2);").arg(QLatin1String(table)));
        db.exec("DELETE FROM directory WHERE id = 1;");
        QCOMPARE(db.rows("SELECT (SELECT group_concat(id, ' ') FROM directory), (SELECT group_concat(id, ' ') FROM file), "
                         "(SELECT group_concat(fileId, ' ') FROM themelet), (SELECT group_concat(fileId, ' ') FROM image), "
                         "(SELECT group_concat(fileId, ' ') FROM download), (SELECT group_concat(fileId, ' ') FROM zefId), "
                         "(SELECT group_concat(fileId || resourceType || resourceId, ' ') FROM resource)"),
                 QStringList { "3|2 3|2|2|2|2|2w3" });
    }

private:
    const QString m_path = TestDatabase::indexPath();
    const QString m_system = QStandardPaths::writableLocation(QStandardPaths::GenericDataLocation) + QLatin1String("/system");
};

QTEST_GUILESS_MAIN(tst_DbManager)
#include "tst_dbmanager.moc"
