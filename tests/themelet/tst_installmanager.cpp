#include "packagefixture.h"
#include "testdatabase.h"

#include <QTimer>
#include <QtTest>

#include <memory>
#include <sys/stat.h>

using namespace PackageFixture;

class tst_InstallManager : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void scanMerge_data();
    void scanMerge();
    void install_data();
    void install();
    void reinstall();
    void setFavorite_data();
    void setFavorite();
    void manyPackages();
    void packageRoad();

private:
    static QString testPath() { return uniquePath(qEnvironmentVariable("THEMELET_SANDBOX") + QStringLiteral("/packages")); }
    QString directoryId(const QString &path)
    {
        return m_db->value(QStringLiteral("SELECT id FROM directory WHERE path = '%1'").arg(path)).toString();
    }
    QStringList fileRows(const QString &package, const QString &columns)
    {
        return m_db->rows(QStringLiteral("SELECT %1 FROM file LEFT JOIN zefid ON zefid.fileId = file.id "
                                         "WHERE directoryId = '%2' ORDER BY fileName").arg(columns, directoryId(package)));
    }

    std::unique_ptr<TestDatabase> m_db;
};

void tst_InstallManager::initTestCase()
{
    QVERIFY(installer());
    m_db = std::make_unique<TestDatabase>();
}

void tst_InstallManager::scanMerge_data()
{
    QTest::addColumn<QStringList>("disk");
    QTest::addColumn<QStringList>("rows");
    QTest::addColumn<QStringList>("afterFirst");
    QTest::addColumn<QStringList>("afterSecond");

    // "r" stands for a package known as a root of its own: it is adopted.
    QTest::newRow("new and known") << QStringList { "a", "b", "r" } << QStringList { "b" } << QStringList { "a", "b", "r" }
                                   << QStringList { "a", "b", "r" };
    QTest::newRow("row without directory") << QStringList { "c" } << QStringList { "b", "c" } << QStringList { "c" }
                                           << QStringList { "c" };
    QTest::newRow("no subdirectories") << QStringList() << QStringList { "a", "b" } << QStringList() << QStringList();
    // New directories that use up the list in front of a row leave that row
    // for the next scan; the rows after it go at once.
    QTest::newRow("gap") << QStringList { "a" } << QStringList { "y", "z" } << QStringList { "a", "y" } << QStringList { "a" };
    QTest::newRow("byte order") << QStringList { "B", "a", "\u00e4" } << QStringList { "\u00e4" }
                                << QStringList { "B", "a", "\u00e4" } << QStringList { "B", "a", "\u00e4" };
}

void tst_InstallManager::scanMerge()
{
    QFETCH(QStringList, disk);
    QFETCH(QStringList, rows);
    QFETCH(QStringList, afterFirst);
    QFETCH(QStringList, afterSecond);

    const QString installDir = testPath();
    QVERIFY(QDir().mkpath(installDir));
    for (const QString &name : disk)
        QVERIFY(write(installDir + QLatin1Char('/') + name + QStringLiteral("/x.index"), "{}"));
    // Rows as an earlier run left them.
    QVERIFY(m_db->exec(QStringLiteral("INSERT INTO directory (path, scope) VALUES ('%1', 1)").arg(installDir)));
    const QString parentId = directoryId(installDir);
    for (const QString &name : rows)
        QVERIFY(m_db->exec(QStringLiteral("INSERT INTO directory (parentId, path, scope) VALUES (%1, '%2/%3', 2)")
                                   .arg(parentId, installDir, name)));
    QVERIFY(m_db->exec(QStringLiteral("INSERT INTO directory (path, scope) VALUES ('%1/r', 0)").arg(installDir)));
    QHash<QString, QString> ids;
    for (const QString &name : rows + QStringList("r"))
        ids.insert(name, directoryId(installDir + QLatin1Char('/') + name));

    // Each row as its name, with the scope only when it isn't that of a package.
    const QString children = QStringLiteral("SELECT substr(path, %1) || '|' || scope FROM directory WHERE parentId = %2 ORDER BY path")
                                     .arg(installDir.size() + 2).arg(parentId);
    installer()->appendDirectory(installDir);
    QVERIFY(waitIdle());
    QCOMPARE(m_db->rows(children).replaceInStrings("|2", ""), afterFirst);
    for (const QString &name : afterFirst)
        QVERIFY(!ids.contains(name) || ids.value(name) == directoryId(installDir + QLatin1Char('/') + name));
    // Every package on disk is installed, new or known.
    QCOMPARE(m_db->value(QStringLiteral("SELECT count(*) FROM file JOIN directory ON directory.id = file.directoryId "
                                        "WHERE parentId = %1").arg(parentId)).toInt(), disk.size());

    installer()->appendDirectory(installDir);
    QVERIFY(waitIdle());
    QCOMPARE(m_db->rows(children).replaceInStrings("|2", ""), afterSecond);
}

void tst_InstallManager::install_data()
{
    QTest::addColumn<QStringList>("files");
    QTest::addColumn<bool>("exists");
    QTest::addColumn<QStringList>("expected");

    QTest::newRow("no package files") << QStringList { "readme.txt", "images/a.themelet" } << true << QStringList();
    QTest::newRow("suffixes") << QStringList { "a.themelet", "b.index", "x.THEMELET", "c.index.txt", "y.themelet/z.index", ".h.themelet" }
                              << true << QStringList { "a.themelet|application/x-vorka-themelet|1|0", "b.index|application/x-vorka-index|1|0" };
    QTest::newRow("missing directory") << QStringList() << false << QStringList();
}

void tst_InstallManager::install()
{
    QFETCH(QStringList, files);
    QFETCH(bool, exists);
    QFETCH(QStringList, expected);

    const QString package = testPath();
    QVERIFY(!exists || QDir().mkpath(package));
    for (const QString &name : files)
        QVERIFY(write(package + QLatin1Char('/') + name, "{}"));

    QCOMPARE(installer()->install(package, QString(), false), exists);
    QCOMPARE(fileRows(package, "fileName, mimeType, permissions, metadataCurrent"), expected);
    QCOMPARE(m_db->value(QStringLiteral("SELECT scope FROM directory WHERE path = '%1'").arg(package)).toInt(), exists ? 2 : 0);
    QVERIFY(waitIdle());
}

void tst_InstallManager::reinstall()
{
    const QString package = testPath();
    for (const char *name : { "/t1.themelet", "/t2.themelet", "/tones.index" })
        QVERIFY(write(package + QLatin1String(name), "{}"));
    QVERIFY(installer()->install(package, QString(), false));
    const QStringList ids = fileRows(package, "id");
    QVERIFY(waitIdle());
    const QString columns = QStringLiteral("fileName, permissions, metadataCurrent, zefId");
    // As if read, and as if a writable row had been left behind.
    const QString markRead = QStringLiteral("UPDATE file SET metadataCurrent = 1, permissions = 3 WHERE directoryId = %1")
                                     .arg(directoryId(package));

    // Unchanged: nothing to update, but the ZEF id is bound.
    QVERIFY(m_db->exec(markRead));
    QVERIFY(installer()->install(package, QStringLiteral("Z1"), false));
    QCOMPARE(fileRows(package, columns), (QStringList { "t1.themelet|3|1|Z1", "t2.themelet|3|1|Z1", "tones.index|3|1|NULL" }));

    QFile changed(package + QStringLiteral("/t2.themelet"));
    QVERIFY(changed.open(QIODevice::ReadWrite) && touch(changed));
    QVERIFY(installer()->install(package, QString(), false));
    QCOMPARE(fileRows(package, columns), (QStringList { "t1.themelet|3|1|Z1", "t2.themelet|1|0|Z1", "tones.index|3|1|NULL" }));
    QCOMPARE(fileRows(package, "modificationTime").value(1), QFileInfo(changed).lastModified().toString(Qt::ISODateWithMs));

    QVERIFY(m_db->exec(markRead));
    QVERIFY(installer()->install(package, QStringLiteral("Z2"), true));
    QCOMPARE(fileRows(package, columns), (QStringList { "t1.themelet|1|0|Z2", "t2.themelet|1|0|Z2", "tones.index|1|0|NULL" }));
    QCOMPARE(fileRows(package, "id"), ids);
    QVERIFY(waitIdle());
}

void tst_InstallManager::setFavorite_data()
{
    QTest::addColumn<QString>("url");
    QTest::addColumn<bool>("favorite");
    QTest::addColumn<QStringList>("expected");

    QTest::newRow("shared wallpaper") << "/w/shared.jpg" << true << QStringList { "1", "1", "0", "1" };
    QTest::newRow("own wallpaper") << "/w/own.jpg" << false << QStringList { "0", "0", "0", "0" };
    QTest::newRow("unknown wallpaper") << "/w/none.jpg" << true << QStringList();
}

void tst_InstallManager::setFavorite()
{
    QFETCH(QString, url);
    QFETCH(bool, favorite);
    QFETCH(QStringList, expected);

    QVERIFY(m_db->exec(QStringList { "DELETE FROM directory WHERE path = '/w'", "INSERT INTO directory (path, scope) VALUES ('/w', 2)" }));
    const QStringList wallpapers { "shared", "shared", "other", "own" };
    for (int i = 0; i < wallpapers.size(); ++i) {
        QVERIFY(m_db->exec(QStringLiteral("INSERT INTO file (directoryId, fileName, permissions) VALUES (%1, '%2.themelet', 1)")
                                   .arg(directoryId("/w")).arg(i)));
        QVERIFY(m_db->exec(QStringLiteral("INSERT INTO themelet (fileId, favorite, homeWallpaper) VALUES (%1, %2, '/w/%3.jpg')")
                                   .arg(m_db->value("SELECT max(id) FROM file").toString()).arg(i == 3).arg(wallpapers.at(i))));
    }
    if (expected.isEmpty()) {
        QTest::ignoreMessage(QtWarningMsg, "bool InstallManager::setFavorite(const QString&, bool)");
        QTest::ignoreMessage(QtWarningMsg, qPrintable(QStringLiteral("No themelet found with url '%1'").arg(url)));
    }

    QCOMPARE(installer()->setFavorite(url, favorite), !expected.isEmpty());
    QCOMPARE(m_db->rows(QStringLiteral("SELECT favorite FROM themelet JOIN file ON file.id = themelet.fileId "
                                       "WHERE directoryId = %1 ORDER BY file.id").arg(directoryId("/w"))),
             expected.isEmpty() ? QStringList({ "0", "0", "0", "1" }) : expected);
}

void tst_InstallManager::manyPackages()
{
    const QString installDir = testPath();
    const int count = 2000;
    for (int i = 0; i < count; ++i)
        QVERIFY(write(installDir + QStringLiteral("/p%1/p.index").arg(i, 4, 10, QLatin1Char('0')), "{}"));
    // A name that isn't UTF-8, a broken index, a package with nothing to
    // install, and a file where a package should be.
    QVERIFY(::mkdir((QFile::encodeName(installDir) + "/bad\xff\xfe").constData(), 0755) == 0);
    QVERIFY(write(installDir + QStringLiteral("/broken/broken.index"), "{\"files\": ["));
    QVERIFY(write(installDir + QStringLiteral("/empty/readme"), "x"));
    QVERIFY(write(installDir + QStringLiteral("/stray.index"), "{}"));
    const QString vanishing = installDir + QStringLiteral("/p1999");

    // One package a step: a timer gets its turn between any two packages, and
    // a queued package can vanish before its turn comes.
    const QString installed = QStringLiteral("SELECT count(*) FROM file WHERE fileName = 'p.index'");
    const int before = m_db->value(installed).toInt();
    QSet<int> seenByTimer;
    bool vanished = false;
    QTimer timer;
    connect(&timer, &QTimer::timeout, this, [&] {
        seenByTimer.insert(m_db->value(installed).toInt());
        if (!vanished && !directoryId(vanishing).isEmpty())
            vanished = QDir(vanishing).removeRecursively();
    });
    timer.start(0);
    QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^Error parsing index from file .*broken.index"));
    installer()->appendDirectory(installDir);
    QVERIFY(waitIdle());
    timer.stop();

    QVERIFY(vanished);
    QVERIFY2(seenByTimer.size() > count / 2, qPrintable(QString::number(seenByTimer.size())));
    QCOMPARE(m_db->value(installed).toInt() - before, count - 1);
    QCOMPARE(m_db->value("SELECT count(*) FROM file WHERE mimeType = 'application/x-vorka-index' AND metadataCurrent = 0").toInt(), 0);
}

void tst_InstallManager::packageRoad()
{
    const QString package = InstallManager::installPaths().at(0) + QStringLiteral("/sunset");
    for (const char *name : { "/images/sunset.jpg", "/images/dawn.jpg", "/sounds/dusk.ogg" })
        QVERIFY(write(package + QLatin1String(name), "x"));
    QVERIFY(write(package + QStringLiteral("/sunset.themelet"), R"({"wallpaper": "sunset.jpg", "displayName": "Sunset",
        "ringerVolume": 60, "ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));

    // What the service does at its start.
    for (const QString &path : InstallManager::installPaths()) {
        QVERIFY(QDir().mkpath(path));
        installer()->appendDirectory(path);
    }
    QVERIFY(waitIdle());

    const QString fileId = fileRows(package, "file.id").value(0);
    const QString fileState = QStringLiteral("SELECT permissions, mimeType, metadataCurrent, displayName, scope, parentId = %1 "
                                             "FROM file JOIN directory ON directory.id = file.directoryId WHERE file.id = %2")
                                      .arg(directoryId(InstallManager::installPaths().at(0)), fileId);
    const QString themeletState = QStringLiteral("SELECT homeWallpaper, ringerVolume, resourceType, tone.fileName FROM themelet "
                                                 "JOIN resource USING (fileId) JOIN file AS tone ON tone.id = resourceId WHERE fileId = %1")
                                          .arg(fileId);
    QCOMPARE(m_db->rows(fileState), QStringList { "1|application/x-vorka-themelet|1|Sunset|2|1" });
    QCOMPARE(m_db->rows(themeletState), QStringList { package + "/images/sunset.jpg|60|ringerToneFile|dusk.ogg" });

    // A changed file is read again at the next install, into the same rows.
    QVERIFY(write(package + QStringLiteral("/sunset.themelet"), R"({"wallpaper": "dawn.jpg", "displayName": "Dawn",
        "ringerVolume": 10, "ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));
    installer()->appendDirectory(InstallManager::installPaths().at(0));
    QVERIFY(waitIdle());
    QCOMPARE(m_db->rows(fileState), QStringList { "1|application/x-vorka-themelet|1|Dawn|2|1" });
    QCOMPARE(m_db->rows(themeletState), QStringList { package + "/images/dawn.jpg|60|ringerToneFile|dusk.ogg" });

    // A package that is gone takes its rows along.
    QVERIFY(QDir(package).removeRecursively());
    installer()->appendDirectory(InstallManager::installPaths().at(0));
    QVERIFY(waitIdle());
    QVERIFY(directoryId(package).isEmpty());
    QCOMPARE(m_db->value(QStringLiteral("SELECT (SELECT count(*) FROM file WHERE id = %1) + (SELECT count(*) FROM themelet "
                                        "WHERE fileId = %1) + (SELECT count(*) FROM resource WHERE fileId = %1)").arg(fileId)).toInt(), 0);
}

QTEST_GUILESS_MAIN(tst_InstallManager)
#include "tst_installmanager.moc"
