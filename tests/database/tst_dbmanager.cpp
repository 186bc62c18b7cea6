#include "dbmanager.h"
#include "messagelog.h"
#include "testdatabase.h"

#include <QtTest>
#include <QSettings>

#include <memory>
#include <sys/stat.h>

namespace {

const QString LocaleKey = QStringLiteral("locale");

// Log records as "<level>: <text>", so that a whole start-up compares as one list.
QString debug(const QString &text) { return QStringLiteral("debug: ") + text; }
QString warning(const QString &text) { return QStringLiteral("warning: ") + text; }
QString critical(const QString &text) { return QStringLiteral("critical: ") + text; }

QString step(int from, int to)
{
    return debug(QStringLiteral("bool DbManager::updateSchema_v%1to%2() Updating database schema from version %1 to %2!")
                         .arg(from).arg(to));
}

QString written(int version)
{
    return debug(QStringLiteral("bool DbManager::updateSchemaVersion(const QString&) Updated themelet database to version:  \"%1\"")
                         .arg(version));
}

QString sqlError(const QString &code, const QString &text,
                 const QString &driverText = QStringLiteral("Unable to execute statement"))
{
    return warning(QStringLiteral("QSqlError(\"%1\", \"%2\", \"%3\")").arg(code, driverText, text));
}

const QString Fine = debug(QStringLiteral("DbManager::DbManager() Themelet DB Fine..."));

QStringList nuke(const QString &path)
{
    return { warning(QStringLiteral("DbManager::DbManager() Nuking themelet database due previous errors!")),
             warning(QStringLiteral("Delete:  \"%1\"").arg(path)) };
}


void ignore(const QStringList &records)
{
    for (const QString &record : records) {
        const int colon = record.indexOf(QLatin1String(": "));
        const QString level = record.left(colon);
        const QtMsgType type = level == QLatin1String("debug") ? QtDebugMsg
                : level == QLatin1String("critical") ? QtCriticalMsg : QtWarningMsg;
        QTest::ignoreMessage(type, qPrintable(record.mid(colon + 2)));
    }
}

// Writes the tables as a file of schema version `schema` had them: v7 lacks
// themelet.partnerSpace, v8 and v9 themelet.version, v10 and v11 file.category.
// Then stamps `userVersion` and fills in two directories (the second one a
// package) with five files, all marked current.
void writeDatabase(TestDatabase &db, int schema, int userVersion, bool metadataCurrent = true)
{
    QString file = QStringLiteral("CREATE TABLE file ( id INTEGER PRIMARY KEY AUTOINCREMENT, directoryId INTEGER NOT NULL, mimeType TEXT, fileName TEXT, displayName TEXT, modificationTime DATETIME, permissions INTEGER NOT NULL");
    if (metadataCurrent)
        file += QLatin1String(", metadataCurrent BOOL");
    if (schema >= 12)
        file += QLatin1String(", category TEXT");
    QString themelet = QStringLiteral("CREATE TABLE themelet ( fileId INTEGER PRIMARY KEY, favorite INTEGER DEFAULT 0, homeWallpaper TEXT, applicationWallpaper TEXT, highlightColor TEXT, secondaryHighlightColor TEXT, primaryColor TEXT, secondaryColor TEXT, timestamp TEXT, ringerVolume INTEGER, enabledSounds INTEGER");
    if (schema >= 8)
        themelet += QLatin1String(", partnerSpace TEXT");
    if (schema >= 10)
        themelet += QLatin1String(", version INTEGER");

    db.exec({ QStringLiteral("CREATE TABLE directory ( id INTEGER PRIMARY KEY AUTOINCREMENT, parentId INTEGER, path TEXT UNIQUE, scope INTEGER NOT NULL);"),
              file + QLatin1String(");"),
              QStringLiteral("CREATE TABLE image ( fileId INTEGER PRIMARY KEY, dateTaken DATETIME, width INTEGER, height INTEGER, orientation INTEGER);"),
              themelet + QLatin1String(");"),
              QStringLiteral("CREATE TABLE zefId ( fileId INTEGER PRIMARY KEY, zefId TEXT);"),
              QStringLiteral("CREATE TABLE download ( fileId INTEGER PRIMARY KEY, source TEXT);"),
              QStringLiteral("CREATE TABLE resource ( fileId INTEGER, resourceType TEXT, resourceId INTEGER);"),
              QStringLiteral("PRAGMA user_version = %1;").arg(userVersion),
              QStringLiteral("INSERT INTO directory (id, parentId, path, scope) VALUES (1, NULL, '/home/user/Pictures', 0), (2, NULL, '/usr/share/themelet/dusk', 2);"),
              QStringLiteral("INSERT INTO themelet (fileId) VALUES (1);") });
    const QString insert = metadataCurrent
            ? QStringLiteral("INSERT INTO file (id, directoryId, mimeType, fileName, permissions, metadataCurrent) VALUES (%1, %2, '%3', '%4', 3, 1);")
            : QStringLiteral("INSERT INTO file (id, directoryId, mimeType, fileName, permissions) VALUES (%1, %2, '%3', '%4', 3);");
    const struct { int directory; const char *mimeType; const char *name; } files[] = {
        { 1, "application/x-vorka-themelet", "a.themelet" },
        { 1, "application/x-vorka-index", "a.index" },
        { 1, "image/jpeg", "a.jpg" },
        { 2, "application/x-vorka-themelet", "dusk.themelet" },
        { 2, "audio/ogg", "dusk.ogg" },
    };
    for (int i = 0; i < 5; ++i)
        db.exec(insert.arg(i + 1).arg(files[i].directory).arg(QLatin1String(files[i].mimeType),
                                                               QLatin1String(files[i].name)));
}

QStringList columns(TestDatabase &db, const QString &table)
{
    return db.rows(QStringLiteral("SELECT name FROM pragma_table_info('%1') ORDER BY cid").arg(table));
}

QStringList currentFlags(TestDatabase &db)
{
    return db.rows(QStringLiteral("SELECT id, metadataCurrent FROM file ORDER BY id"));
}

ino_t inode(const QString &path)
{
    struct stat info;
    return ::stat(QFile::encodeName(path).constData(), &info) == 0 ? info.st_ino : 0;
}

void removeIndexFiles(const QString &path)
{
    for (const char *suffix : { "", "-shm", "-wal" })
        QFile::remove(path + QLatin1String(suffix));
}

}

class tst_DbManager : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void cleanup();

    void newDatabase();
    void upgrade_data();
    void upgrade();
    void rebuild_data();
    void rebuild();
    void failedRebuild();
    void directoryNotCreated();
    void localeCheck_data();
    void localeCheck();
    void deleteFileTrigger();
    void deleteDirectoryTrigger();

private:
    // Runs one start-up with a local DbManager, expecting exactly `expected`
    // as its log; tells whether the connection ended open.
    // With `quiet` the records are only collected.
    QStringList startUp(const QStringList &expected, bool *open = nullptr, bool quiet = false);

    const QString m_path = TestDatabase::indexPath();
    const QString m_system = QStandardPaths::writableLocation(QStandardPaths::GenericDataLocation)
            + QLatin1String("/system");
};

QStringList tst_DbManager::startUp(const QStringList &expected, bool *open, bool quiet)
{
    ignore(expected);
    MessageLog capture(!quiet);
    DbManager manager;
    if (open)
        *open = manager.isOpen();
    return capture.records();
}

void tst_DbManager::init()
{
    QFileInfo system(m_system);
    if (system.isDir())
        QDir(m_system).removeRecursively();
    else
        QFile::remove(m_system);
    // Same locale as last time unless a test says otherwise.
    QSettings(QStringLiteral("Vorka"), QStringLiteral("themeletd")).setValue(LocaleKey, QLocale().name());
}

void tst_DbManager::cleanup()
{
    QLocale::setDefault(QLocale::system());
}

void tst_DbManager::newDatabase()
{
    QSettings settings(QStringLiteral("Vorka"), QStringLiteral("themeletd"));
    settings.remove(LocaleKey);

    bool open = false;
    QCOMPARE(startUp({ Fine }, &open), QStringList { Fine });
    QVERIFY(open);

    TestDatabase db;
    QCOMPARE(db.value(QStringLiteral("PRAGMA user_version;")).toInt(), 12);
    QCOMPARE(db.value(QStringLiteral("PRAGMA journal_mode;")).toString(), QStringLiteral("wal"));
    QCOMPARE(db.rows(QStringLiteral("SELECT type, name FROM sqlite_master WHERE name NOT LIKE 'sqlite_%' ORDER BY type, name")),
             QStringList({ "index|file_directory", "index|resource_fileId_resourceType",
                           "index|resource_file_id", "index|resource_resource_id",
                           "table|directory", "table|download", "table|file", "table|image",
                           "table|resource", "table|themelet", "table|zefId",
                           "trigger|delete_directory_trigger", "trigger|delete_file_trigger" }));
    QCOMPARE(columns(db, QStringLiteral("file")),
             QStringList({ "id", "directoryId", "mimeType", "fileName", "displayName",
                           "modificationTime", "permissions", "metadataCurrent", "category" }));
    QCOMPARE(columns(db, QStringLiteral("themelet")),
             QStringList({ "fileId", "favorite", "homeWallpaper", "applicationWallpaper",
                           "highlightColor", "secondaryHighlightColor", "primaryColor",
                           "secondaryColor", "timestamp", "ringerVolume", "enabledSounds",
                           "partnerSpace", "version" }));
    QCOMPARE(db.value(QStringLiteral("SELECT count(*) FROM file")).toInt(), 0);

    settings.sync();
    QCOMPARE(settings.value(LocaleKey).toString(), QLocale().name());

    // A second start on the file just made finds it fine and changes nothing.
    QCOMPARE(startUp({ Fine }, &open), QStringList { Fine });
    QVERIFY(open);
}

void tst_DbManager::upgrade_data()
{
    QTest::addColumn<int>("schema");
    QTest::addColumn<int>("stamped");
    QTest::addColumn<QStringList>("log");
    QTest::addColumn<int>("version");
    QTest::addColumn<bool>("partnerSpace");
    QTest::addColumn<QStringList>("metadata");

    const QStringList from8 { step(8, 10), written(10), written(11), step(11, 12), written(12), Fine };
    const QStringList allStale { "1|0", "2|0", "3|1", "4|0", "5|1" };
    const QStringList allCurrent { "1|1", "2|1", "3|1", "4|1", "5|1" };

    QTest::newRow("7") << 7 << 7 << QStringList { step(7, 8), written(8) } + from8 << 12 << true << allStale;
    QTest::newRow("8") << 8 << 8 << from8 << 12 << true << allStale;
    QTest::newRow("9 as 8") << 8 << 9 << from8 << 12 << true << allStale;
    QTest::newRow("9 takes no 7 to 8 step") << 7 << 9 << from8 << 12 << false << allStale;
    QTest::newRow("10") << 10 << 10 << QStringList { written(11), step(11, 12), written(12), Fine } << 12
                        << true << allStale;
    QTest::newRow("11") << 10 << 11 << QStringList { step(11, 12), written(12), Fine } << 12 << true
                        << QStringList { "1|0", "2|1", "3|1", "4|0", "5|1" };
    // A failed ALTER doesn't stop the start, but its step writes no version.
    QTest::newRow("11, column already there")
            << 12 << 11
            << QStringList { step(11, 12),
                             warning(QStringLiteral("bool DbManager::updateSchema_v11to12()")),
                             warning(QStringLiteral("Initialization failed")),
                             warning(QStringLiteral("\"ALTER TABLE file ADD COLUMN category TEXT;\"")),
                             sqlError(QStringLiteral("1"), QStringLiteral("duplicate column name: category")),
                             Fine }
            << 11 << true << allCurrent;
    QTest::newRow("12") << 12 << 12 << QStringList { Fine } << 12 << true << allCurrent;
    QTest::newRow("13") << 12 << 13
                        << QStringList { debug(QStringLiteral("bool DbManager::dropSchema_v13() Reverting database schema version 13!")),
                                         written(12), Fine }
                        << 12 << true << allCurrent;
}

void tst_DbManager::upgrade()
{
    QFETCH(int, schema);
    QFETCH(int, stamped);
    QFETCH(QStringList, log);
    QFETCH(int, version);
    QFETCH(bool, partnerSpace);
    QFETCH(QStringList, metadata);

    {
        TestDatabase old;
        writeDatabase(old, schema, stamped);
    }
    const ino_t before = inode(m_path);

    bool open = false;
    QCOMPARE(startUp(log, &open), log);
    QVERIFY(open);
    QCOMPARE(inode(m_path), before);

    TestDatabase db;
    QCOMPARE(db.value(QStringLiteral("PRAGMA user_version;")).toInt(), version);
    const QStringList themelet = columns(db, QStringLiteral("themelet"));
    QCOMPARE(themelet.contains(QStringLiteral("partnerSpace")), partnerSpace);
    QVERIFY(themelet.contains(QStringLiteral("version")));
    QCOMPARE(columns(db, QStringLiteral("file")).count(QStringLiteral("category")), 1);
    QCOMPARE(currentFlags(db), metadata);
}

void tst_DbManager::rebuild_data()
{
    QTest::addColumn<int>("schema");     // 0: a foreign SQLite file, -1: not a database
    QTest::addColumn<int>("stamped");
    QTest::addColumn<bool>("metadataCurrent");
    QTest::addColumn<QStringList>("log"); // the records before the nuke

    const QStringList outdated { warning(QStringLiteral("Database version outdated or non-existent")) };
    QTest::newRow("0, foreign file") << 0 << 0 << true << outdated;
    QTest::newRow("6") << 7 << 6 << true << outdated;
    QTest::newRow("14") << 12 << 14 << true << outdated;
    QTest::newRow("not a database")
            << -1 << 0 << true
            << QStringList { warning(QStringLiteral("DbManager::DbManager()")),
                             warning(QStringLiteral("Failed to query user version")),
                             sqlError(QStringLiteral("26"), QStringLiteral("file is not a database"),
                                      QStringLiteral("Unable to fetch row")) };
    QTest::newRow("10, index reset fails")
            << 10 << 10 << false
            << QStringList { warning(QStringLiteral("bool DbManager::resetIndexesForReparsing()")),
                             warning(QStringLiteral("Failed to reset themelets for reparsing!")),
                             warning(QStringLiteral("\"UPDATE file SET metadataCurrent = 0 WHERE mimeType=\\\"application/x-vorka-index\\\";\"")),
                             sqlError(QStringLiteral("1"), QStringLiteral("no such column: metadataCurrent")) }
                    + outdated;
}

void tst_DbManager::rebuild()
{
    QFETCH(int, schema);
    QFETCH(int, stamped);
    QFETCH(bool, metadataCurrent);
    QFETCH(QStringList, log);

    // The old connection stays open in write-ahead mode, so that "-shm" and
    // "-wal" exist and no inode of the old files can be reused by the new ones.
    std::unique_ptr<TestDatabase> old;
    if (schema < 0) {
        QDir().mkpath(QFileInfo(m_path).absolutePath());
        QFile garbage(m_path);
        QVERIFY(garbage.open(QIODevice::WriteOnly));
        garbage.write(QByteArray(4096, 'x'));
    } else {
        old.reset(new TestDatabase);
        old->exec(QStringLiteral("PRAGMA journal_mode = WAL;"));
        if (schema == 0)
            old->exec(QStringLiteral("CREATE TABLE notes ( text TEXT);"));
        else
            writeDatabase(*old, schema, stamped, metadataCurrent);
    }

    QList<std::shared_ptr<QFile>> held;
    QList<ino_t> oldInodes;
    QStringList existed;
    for (const char *suffix : { "", "-shm", "-wal" }) {
        const QString file = m_path + QLatin1String(suffix);
        if (!QFile::exists(file))
            continue;
        held.append(std::make_shared<QFile>(file));
        QVERIFY(held.last()->open(QIODevice::ReadOnly));
        existed.append(file);
        oldInodes.append(inode(file));
    }
    QCOMPARE(existed.size(), schema < 0 ? 1 : 3);

    const QStringList expected = log + nuke(m_path) + QStringList { Fine };
    bool open = false;
    QCOMPARE(startUp(expected, &open), expected);
    QVERIFY(open);

    // Every old file is gone: what stands at its path now is another file.
    for (int i = 0; i < existed.size(); ++i)
        QVERIFY2(inode(existed.at(i)) != oldInodes.at(i), qPrintable(existed.at(i)));

    TestDatabase db;
    QCOMPARE(db.value(QStringLiteral("PRAGMA user_version;")).toInt(), 12);
    QCOMPARE(db.rows(QStringLiteral("SELECT name FROM sqlite_master WHERE type = 'table' AND name NOT LIKE 'sqlite_%' ORDER BY name")),
             QStringList({ "directory", "download", "file", "image", "resource", "themelet", "zefId" }));
    QCOMPARE(columns(db, QStringLiteral("file")).count(QStringLiteral("metadataCurrent")), 1);
    QCOMPARE(db.value(QStringLiteral("SELECT count(*) FROM file")).toInt(), 0);
}

void tst_DbManager::failedRebuild()
{
    // A directory at the file's path: the version can't be read, the removal
    // fails, and so does the schema of the rebuild. One nuke only, then closed.
    QVERIFY(QDir().mkpath(m_path));

    bool open = true;
    const QStringList records = startUp({}, &open, true);
    QVERIFY(!open);
    QCOMPARE(records.count(nuke(m_path).first()), 1);
    QCOMPARE(records.count(critical(QStringLiteral("DbManager::DbManager: Failed to create DB schema. Can't continue!"))), 1);
    QCOMPARE(records.last(), critical(QStringLiteral("DbManager::DbManager: Failed to create DB schema. Can't continue!")));
    QVERIFY(!records.contains(Fine));
}

void tst_DbManager::directoryNotCreated()
{
    QFile blocker(m_system);
    QVERIFY(blocker.open(QIODevice::WriteOnly));
    blocker.close();
    QSettings settings(QStringLiteral("Vorka"), QStringLiteral("themeletd"));
    settings.remove(LocaleKey);

    const QStringList expected {
        warning(QStringLiteral("DbManager::DbManager: failed to create directory ' \"%1\" ' for db!").arg(m_path))
    };
    bool open = true;
    QCOMPARE(startUp(expected, &open), expected);
    QVERIFY(!open);
    QVERIFY(!QFile::exists(m_path));
    QVERIFY(QFileInfo(m_system).isFile());
    QVERIFY(!settings.contains(LocaleKey));
}

void tst_DbManager::localeCheck_data()
{
    QTest::addColumn<QVariant>("stored");   // invalid: no key
    QTest::addColumn<QString>("locale");    // default locale for the run; empty: the system's
    QTest::addColumn<bool>("metadataCurrent");
    QTest::addColumn<QStringList>("log");
    QTest::addColumn<QStringList>("metadata");

    const QStringList packageStale { "1|1", "2|1", "3|1", "4|0", "5|0" };
    QTest::newRow("same locale") << QVariant(QLocale().name()) << QString() << true << QStringList { Fine }
                                 << QStringList { "1|1", "2|1", "3|1", "4|1", "5|1" };
    QTest::newRow("no key yet") << QVariant() << QString() << true << QStringList { Fine } << packageStale;
    QTest::newRow("other locale stored") << QVariant(QStringLiteral("fi_FI")) << QString() << true
                                         << QStringList { Fine } << packageStale;
    QTest::newRow("default locale changed") << QVariant(QLocale().name()) << QStringLiteral("de_DE") << true
                                            << QStringList { Fine } << packageStale;
    QTest::newRow("update fails")
            << QVariant(QStringLiteral("fi_FI")) << QString() << false
            << QStringList { Fine,
                             warning(QStringLiteral("DbManager::DbManager()")),
                             warning(QStringLiteral("Failed to schedule a translation update")),
                             sqlError(QStringLiteral("1"), QStringLiteral("no such column: metadataCurrent")),
                             warning(QStringLiteral("\"UPDATE file SET metadataCurrent = 0 WHERE directoryId IN ( SELECT id FROM directory WHERE scope = 2);\"")) }
            << QStringList();
}

void tst_DbManager::localeCheck()
{
    QFETCH(QVariant, stored);
    QFETCH(QString, locale);
    QFETCH(bool, metadataCurrent);
    QFETCH(QStringList, log);
    QFETCH(QStringList, metadata);

    QSettings settings(QStringLiteral("Vorka"), QStringLiteral("themeletd"));
    if (stored.isValid())
        settings.setValue(LocaleKey, stored);
    else
        settings.remove(LocaleKey);
    if (!locale.isEmpty())
        QLocale::setDefault(QLocale(locale));
    {
        TestDatabase old;
        writeDatabase(old, 12, 12, metadataCurrent);
    }

    QCOMPARE(startUp(log), log);

    settings.sync();
    QCOMPARE(settings.value(LocaleKey).toString(), QLocale().name());
    if (metadataCurrent) {
        TestDatabase db;
        QCOMPARE(currentFlags(db), metadata);
    }
}

void tst_DbManager::deleteFileTrigger()
{
    startUp({ Fine });
    TestDatabase db;
    db.exec({ QStringLiteral("INSERT INTO directory (id, path, scope) VALUES (1, '/d', 0);"),
              QStringLiteral("INSERT INTO file (id, directoryId, fileName, permissions) VALUES (1, 1, 'a', 3), (2, 1, 'b', 3), (3, 1, 'c', 3);") });
    for (const char *table : { "themelet", "image", "download", "zefId" })
        db.exec(QStringLiteral("INSERT INTO %1 (fileId) VALUES (1), (2);").arg(QLatin1String(table)));
    db.exec(QStringLiteral("INSERT INTO resource (fileId, resourceType, resourceId) VALUES (1, 'ringerTone', 3), (2, 'ringerTone', 1), (2, 'wallpaper', 3);"));

    db.exec(QStringLiteral("DELETE FROM file WHERE id = 1;"));

    QCOMPARE(db.rows(QStringLiteral("SELECT id FROM file ORDER BY id")), QStringList({ "2", "3" }));
    for (const char *table : { "themelet", "image", "download", "zefId" })
        QCOMPARE(db.rows(QStringLiteral("SELECT fileId FROM %1").arg(QLatin1String(table))), QStringList { "2" });
    QCOMPARE(db.rows(QStringLiteral("SELECT fileId, resourceType, resourceId FROM resource")),
             QStringList { "2|wallpaper|3" });
}

void tst_DbManager::deleteDirectoryTrigger()
{
    startUp({ Fine });
    TestDatabase db;
    // 1 ─ 2 ─ 3, and a separate root 4; file n lives in directory n.
    db.exec({ QStringLiteral("INSERT INTO directory (id, parentId, path, scope) VALUES (1, NULL, '/a', 0), (2, 1, '/a/b', 0), (3, 2, '/a/b/c', 0), (4, NULL, '/z', 0);"),
              QStringLiteral("INSERT INTO file (id, directoryId, fileName, permissions) VALUES (1, 1, 'f', 3), (2, 2, 'f', 3), (3, 3, 'f', 3), (4, 4, 'f', 3);"),
              QStringLiteral("INSERT INTO themelet (fileId) VALUES (1), (2);") });

    db.exec(QStringLiteral("DELETE FROM directory WHERE id = 1;"));

    // The file trigger still runs for the directory's own files; the
    // directory trigger doesn't run again for the child it removed.
    QCOMPARE(db.rows(QStringLiteral("SELECT id FROM directory ORDER BY id")), QStringList({ "3", "4" }));
    QCOMPARE(db.rows(QStringLiteral("SELECT id FROM file ORDER BY id")), QStringList({ "2", "3", "4" }));
    QCOMPARE(db.rows(QStringLiteral("SELECT fileId FROM themelet")), QStringList { "2" });
}

QTEST_GUILESS_MAIN(tst_DbManager)
#include "tst_dbmanager.moc"
