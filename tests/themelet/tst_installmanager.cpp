#include "eventloopidle.h"
#include "fixturefiles.h"
#include "installmanager.h"
#include "sysroot.h"
#include "testdatabase.h"

#include <QTimer>
#include <QtTest>

#include <memory>
#include <sys/stat.h>

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
    void zefIds();
    void setFavorite_data();
    void setFavorite();
    void manyPackages();
    void packageRoad();

private:
    static InstallManager *installer()
    {
        return static_cast<InstallManager *>(ContentManager::managerFromType(6));
    }
    // A directory of its own for each test function and data row.
    static QString testPath()
    {
        QString name = QString::fromLatin1(QTest::currentTestFunction());
        if (QTest::currentDataTag())
            name += QLatin1Char('-') + QString::fromLatin1(QTest::currentDataTag()).replace(QLatin1Char(' '), QLatin1Char('-'));
        return qEnvironmentVariable("THEMELET_SANDBOX") + QStringLiteral("/packages/") + name;
    }
    QVariant directoryId(const QString &path)
    {
        return m_db->value(QStringLiteral("SELECT id FROM directory WHERE path = '%1'").arg(path));
    }
    QStringList fileRows(const QString &path)
    {
        return m_db->rows(QStringLiteral("SELECT fileName, mimeType, permissions, metadataCurrent FROM file "
                                         "WHERE directoryId = (SELECT id FROM directory WHERE path = '%1') ORDER BY fileName")
                                  .arg(path));
    }

    std::unique_ptr<TestDatabase> m_db;
};

void tst_InstallManager::initTestCase()
{
    QVERIFY(installer());
    m_db = std::make_unique<TestDatabase>();
    QVERIFY(m_db->isOpen());
    QVERIFY(EventLoopIdle::wait());
}

void tst_InstallManager::scanMerge_data()
{
    QTest::addColumn<QStringList>("disk");
    QTest::addColumn<QStringList>("rows");
    QTest::addColumn<QString>("root");
    QTest::addColumn<QStringList>("afterFirst");
    QTest::addColumn<QStringList>("afterSecond");

    QTest::newRow("new and known") << QStringList { "a", "b" } << QStringList { "b" } << ""
                                   << QStringList { "a", "b" } << QStringList { "a", "b" };
    QTest::newRow("row without directory") << QStringList { "c" } << QStringList { "b", "c" } << ""
                                           << QStringList { "c" } << QStringList { "c" };
    QTest::newRow("no subdirectories") << QStringList() << QStringList { "a", "b" } << "" << QStringList()
                                       << QStringList();
    // A new directory that uses up the list in front of a row leaves that row
    // for the next scan; the rows after it go at once.
    QTest::newRow("gap") << QStringList { "a" } << QStringList { "z" } << "" << QStringList { "a", "z" }
                         << QStringList { "a" };
    QTest::newRow("gap, later rows go") << QStringList { "a" } << QStringList { "y", "z" } << ""
                                        << QStringList { "a", "y" } << QStringList { "a" };
    QTest::newRow("byte order") << QStringList { "B", "a", "\u00e4" } << QStringList { "\u00e4" } << ""
                                << QStringList { "B", "a", "\u00e4" } << QStringList { "B", "a", "\u00e4" };
    QTest::newRow("root adopted") << QStringList { "a", "r" } << QStringList() << "r" << QStringList { "a", "r" }
                                  << QStringList { "a", "r" };
}

void tst_InstallManager::scanMerge()
{
    QFETCH(QStringList, disk);
    QFETCH(QStringList, rows);
    QFETCH(QString, root);
    QFETCH(QStringList, afterFirst);
    QFETCH(QStringList, afterSecond);

    const QString installDir = testPath();
    QVERIFY(QDir().mkpath(installDir));
    for (const QString &name : disk)
        QVERIFY(FixtureFiles::write(installDir + QLatin1Char('/') + name + QStringLiteral("/x.index"), "{}"));

    // Rows as an earlier run left them: the install directory, its packages,
    // and one package that is known as a root of its own.
    QVERIFY(m_db->exec(QStringLiteral("INSERT INTO directory (path, scope) VALUES ('%1', 1)").arg(installDir)));
    const QString parentId = directoryId(installDir).toString();
    for (const QString &name : rows)
        QVERIFY(m_db->exec(QStringLiteral("INSERT INTO directory (parentId, path, scope) VALUES (%1, '%2/%3', 2)")
                                   .arg(parentId, installDir, name)));
    if (!root.isEmpty())
        QVERIFY(m_db->exec(QStringLiteral("INSERT INTO directory (path, scope) VALUES ('%1/%2', 0)").arg(installDir, root)));
    QHash<QString, QVariant> ids;
    for (const QString &name : rows + QStringList(root))
        ids.insert(name, directoryId(installDir + QLatin1Char('/') + name));

    const QString children = QStringLiteral("SELECT substr(path, %1), scope FROM directory WHERE parentId = %2 ORDER BY path")
                                     .arg(installDir.size() + 2)
                                     .arg(parentId);
    const auto withScope = [](const QStringList &names) {
        QStringList result;
        for (const QString &name : names)
            result << name + QStringLiteral("|2");
        return result;
    };

    installer()->appendDirectory(installDir);
    QVERIFY(EventLoopIdle::wait());
    QCOMPARE(m_db->rows(children), withScope(afterFirst));
    for (auto it = ids.cbegin(); it != ids.cend(); ++it) {
        if (afterFirst.contains(it.key()))
            QCOMPARE(directoryId(installDir + QLatin1Char('/') + it.key()), it.value());
    }
    // Every package on disk was installed, known or new.
    QCOMPARE(m_db->value(QStringLiteral("SELECT count(*) FROM file JOIN directory ON directory.id = file.directoryId "
                                        "WHERE directory.parentId = %1 AND fileName = 'x.index'")
                                 .arg(parentId))
                     .toInt(),
             disk.size());

    installer()->appendDirectory(installDir);
    QVERIFY(EventLoopIdle::wait());
    QCOMPARE(m_db->rows(children), withScope(afterSecond));
}

void tst_InstallManager::install_data()
{
    QTest::addColumn<QStringList>("files");
    QTest::addColumn<bool>("exists");
    QTest::addColumn<QStringList>("expected");

    QTest::newRow("no package files") << QStringList { "readme.txt", "images/a.themelet" } << true << QStringList();
    QTest::newRow("suffixes") << QStringList { "a.themelet", "b.index", "x.THEMELET", "c.index.txt",
                                               "y.themelet/z.index", ".hidden.themelet" }
                              << true
                              << QStringList { "a.themelet|application/x-vorka-themelet|1|0",
                                               "b.index|application/x-vorka-index|1|0" };
    QTest::newRow("missing directory") << QStringList() << false << QStringList();
}

void tst_InstallManager::install()
{
    QFETCH(QStringList, files);
    QFETCH(bool, exists);
    QFETCH(QStringList, expected);

    const QString package = testPath();
    if (exists)
        QVERIFY(QDir().mkpath(package));
    for (const QString &name : files)
        QVERIFY(FixtureFiles::write(package + QLatin1Char('/') + name, "{}"));

    QCOMPARE(installer()->install(package, QString(), false), exists);
    QCOMPARE(fileRows(package), expected);
    if (exists)
        QCOMPARE(m_db->value(QStringLiteral("SELECT scope FROM directory WHERE path = '%1'").arg(package)).toInt(), 2);
    QVERIFY(EventLoopIdle::wait());
}

void tst_InstallManager::reinstall()
{
    const QString package = testPath();
    QVERIFY(FixtureFiles::write(package + QStringLiteral("/a.themelet"), "{}"));
    QVERIFY(FixtureFiles::write(package + QStringLiteral("/b.index"), "{}"));
    QVERIFY(installer()->install(package, QString(), false));
    const QStringList ids = m_db->rows(QStringLiteral("SELECT id FROM file WHERE directoryId = %1 ORDER BY fileName")
                                               .arg(directoryId(package).toString()));
    QCOMPARE(ids.size(), 2);
    QVERIFY(EventLoopIdle::wait());

    // As if both had been read, and as if a writable row had been left behind.
    const QString markRead = QStringLiteral("UPDATE file SET metadataCurrent = 1, permissions = 3 WHERE directoryId = %1")
                                     .arg(directoryId(package).toString());
    QVERIFY(m_db->exec(markRead));
    QVERIFY(installer()->install(package, QString(), false));
    QCOMPARE(fileRows(package), (QStringList { "a.themelet|application/x-vorka-themelet|3|1",
                                               "b.index|application/x-vorka-index|3|1" }));

    QVERIFY(FixtureFiles::touch(package + QStringLiteral("/a.themelet")));
    QVERIFY(installer()->install(package, QString(), false));
    QCOMPARE(fileRows(package), (QStringList { "a.themelet|application/x-vorka-themelet|1|0",
                                               "b.index|application/x-vorka-index|3|1" }));
    QCOMPARE(m_db->value(QStringLiteral("SELECT modificationTime FROM file WHERE id = %1").arg(ids.at(0))).toDateTime(),
             QFileInfo(package + QStringLiteral("/a.themelet")).lastModified());

    QVERIFY(m_db->exec(markRead));
    QVERIFY(installer()->install(package, QString(), true));
    QCOMPARE(fileRows(package), (QStringList { "a.themelet|application/x-vorka-themelet|1|0",
                                               "b.index|application/x-vorka-index|1|0" }));
    QCOMPARE(m_db->rows(QStringLiteral("SELECT id FROM file WHERE directoryId = %1 ORDER BY fileName")
                                .arg(directoryId(package).toString())),
             ids);
    QVERIFY(EventLoopIdle::wait());
}

void tst_InstallManager::zefIds()
{
    const QString package = testPath();
    for (const char *name : { "/t1.themelet", "/t2.themelet", "/tones.index" })
        QVERIFY(FixtureFiles::write(package + QLatin1String(name), "{}"));
    const auto zefIds = [&] {
        return m_db->rows(QStringLiteral("SELECT file.fileName, zefid.zefId FROM zefid JOIN file ON file.id = zefid.fileId "
                                         "WHERE file.directoryId = %1 ORDER BY file.fileName")
                                  .arg(directoryId(package).toString()));
    };

    QVERIFY(installer()->install(package, QString(), false));
    QCOMPARE(zefIds(), QStringList());

    // Stored also when no file changed.
    QVERIFY(installer()->install(package, QStringLiteral("Z1"), false));
    QCOMPARE(zefIds(), (QStringList { "t1.themelet|Z1", "t2.themelet|Z1" }));
    QVERIFY(installer()->install(package, QStringLiteral("Z1"), false));
    QCOMPARE(zefIds(), (QStringList { "t1.themelet|Z1", "t2.themelet|Z1" }));

    QVERIFY(installer()->install(package, QStringLiteral("Z2"), false));
    QCOMPARE(zefIds(), (QStringList { "t1.themelet|Z2", "t2.themelet|Z2" }));
    QVERIFY(installer()->install(package, QString(), true));
    QCOMPARE(zefIds(), (QStringList { "t1.themelet|Z2", "t2.themelet|Z2" }));

    QVERIFY(FixtureFiles::write(package + QStringLiteral("/t3.themelet"), "{}"));
    QVERIFY(installer()->install(package, QStringLiteral("Z3"), false));
    QCOMPARE(zefIds(), (QStringList { "t1.themelet|Z3", "t2.themelet|Z3", "t3.themelet|Z3" }));
    QVERIFY(EventLoopIdle::wait());
}

void tst_InstallManager::setFavorite_data()
{
    QTest::addColumn<QString>("url");
    QTest::addColumn<bool>("favorite");
    QTest::addColumn<bool>("result");
    QTest::addColumn<QStringList>("expected");

    QTest::newRow("shared wallpaper") << "/w/shared.jpg" << true << true << QStringList { "1", "1", "0", "1" };
    QTest::newRow("own wallpaper") << "/w/own.jpg" << false << true << QStringList { "0", "0", "0", "0" };
    QTest::newRow("unknown wallpaper") << "/w/none.jpg" << true << false << QStringList { "0", "0", "0", "1" };
    QTest::newRow("file url is no path") << "file:///w/own.jpg" << true << false << QStringList { "0", "0", "0", "1" };
}

void tst_InstallManager::setFavorite()
{
    QFETCH(QString, url);
    QFETCH(bool, favorite);
    QFETCH(bool, result);
    QFETCH(QStringList, expected);

    QVERIFY(m_db->exec(QStringList {
            "DELETE FROM directory WHERE path = '/w'",
            "INSERT INTO directory (path, scope) VALUES ('/w', 2)",
    }));
    const QString dir = directoryId(QStringLiteral("/w")).toString();
    const QStringList themelets { "s1", "s2", "other", "own" };
    const QStringList wallpapers { "/w/shared.jpg", "/w/shared.jpg", "/w/other.jpg", "/w/own.jpg" };
    for (int i = 0; i < themelets.size(); ++i) {
        QVERIFY(m_db->exec(QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, permissions, metadataCurrent) "
                                          "VALUES (%1, 'application/x-vorka-themelet', '%2.themelet', 1, 1)")
                                   .arg(dir, themelets.at(i))));
        QVERIFY(m_db->exec(QStringLiteral("INSERT INTO themelet (fileId, favorite, homeWallpaper) VALUES (%1, %2, '%3')")
                                   .arg(m_db->value(QStringLiteral("SELECT max(id) FROM file")).toString())
                                   .arg(i == 3 ? 1 : 0)
                                   .arg(wallpapers.at(i))));
    }

    if (!result) {
        QTest::ignoreMessage(QtWarningMsg, "bool InstallManager::setFavorite(const QString&, bool)");
        QTest::ignoreMessage(QtWarningMsg, qPrintable(QStringLiteral("No themelet found with url '%1'").arg(url)));
    }
    QCOMPARE(installer()->setFavorite(url, favorite), result);
    QCOMPARE(m_db->rows(QStringLiteral("SELECT themelet.favorite FROM themelet JOIN file ON file.id = themelet.fileId "
                                       "WHERE file.directoryId = %1 ORDER BY file.id")
                                .arg(dir)),
             expected);
}

void tst_InstallManager::manyPackages()
{
    const QString installDir = testPath();
    const int count = 2000;
    for (int i = 0; i < count; ++i)
        QVERIFY(FixtureFiles::write(installDir + QStringLiteral("/p%1/p.index").arg(i, 4, 10, QLatin1Char('0')), "{}"));
    // A name that isn't UTF-8, a broken index, a package without a single file
    // of its kind, and a file where a package should be.
    QVERIFY(::mkdir((QFile::encodeName(installDir) + "/bad\xff\xfe").constData(), 0755) == 0);
    QVERIFY(FixtureFiles::write(installDir + QStringLiteral("/broken/broken.index"), "{\"files\": ["));
    QVERIFY(FixtureFiles::write(installDir + QStringLiteral("/empty/readme"), "x"));
    QVERIFY(FixtureFiles::write(installDir + QStringLiteral("/stray.index"), "{}"));
    const QString vanishing = installDir + QStringLiteral("/p1999");

    // Each step is one directory or one package: a timer gets its turn between
    // any two packages, and a queued package can vanish before its turn comes.
    const QString installed = QStringLiteral("SELECT count(*) FROM file WHERE fileName = 'p.index'");
    const int installedBefore = m_db->value(installed).toInt();
    QSet<int> seenByTimer;
    bool vanished = false;
    QTimer timer;
    timer.setInterval(0);
    connect(&timer, &QTimer::timeout, this, [&] {
        seenByTimer.insert(m_db->value(installed).toInt() - installedBefore);
        if (!vanished && directoryId(vanishing).isValid())
            vanished = QDir(vanishing).removeRecursively();
    });
    timer.start();
    QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^Error parsing index from file .*broken.index"));
    installer()->appendDirectory(installDir);
    QVERIFY(EventLoopIdle::wait());
    timer.stop();

    QVERIFY(vanished);
    QVERIFY2(seenByTimer.size() > count / 2, qPrintable(QString::number(seenByTimer.size())));
    QCOMPARE(m_db->value(installed).toInt() - installedBefore, count - 1);
    QCOMPARE(m_db->value(QStringLiteral("SELECT count(*) FROM file WHERE mimeType = 'application/x-vorka-index' "
                                        "AND metadataCurrent = 0")).toInt(), 0);
}

void tst_InstallManager::packageRoad()
{
    const QString package = InstallManager::installPaths().at(0) + QStringLiteral("/sunset");
    QVERIFY(FixtureFiles::write(package + QStringLiteral("/images/sunset.jpg"), "jpeg"));
    QVERIFY(FixtureFiles::write(package + QStringLiteral("/images/dawn.jpg"), "jpeg"));
    QVERIFY(FixtureFiles::write(package + QStringLiteral("/sounds/dusk.ogg"), "ogg"));
    QVERIFY(FixtureFiles::write(package + QStringLiteral("/sunset.themelet"), R"({"wallpaper": "sunset.jpg",
        "displayName": "Sunset", "ringerVolume": 60, "ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));

    // What the service does at its start.
    for (const QString &path : InstallManager::installPaths()) {
        QVERIFY(QDir().mkpath(path));
        installer()->appendDirectory(path);
    }
    QVERIFY(EventLoopIdle::wait());

    const QString fileId = m_db->value(QStringLiteral("SELECT file.id FROM file JOIN directory ON directory.id = file.directoryId "
                                                      "WHERE directory.path = '%1' AND fileName = 'sunset.themelet'")
                                               .arg(package))
                                   .toString();
    QVERIFY(!fileId.isEmpty());
    const QString fileState = QStringLiteral("SELECT file.permissions, file.mimeType, file.metadataCurrent, file.displayName, "
                                             "directory.scope, directory.parentId = (SELECT id FROM directory WHERE path = '%1') "
                                             "FROM file JOIN directory ON directory.id = file.directoryId WHERE file.id = %2")
                                      .arg(InstallManager::installPaths().at(0), fileId);
    const QString themeletState = QStringLiteral("SELECT themelet.homeWallpaper, themelet.ringerVolume, resource.resourceType, "
                                                 "tone.fileName FROM themelet JOIN resource ON resource.fileId = themelet.fileId "
                                                 "JOIN file AS tone ON tone.id = resource.resourceId WHERE themelet.fileId = %1")
                                          .arg(fileId);
    QCOMPARE(m_db->rows(fileState), QStringList { "1|application/x-vorka-themelet|1|Sunset|2|1" });
    QCOMPARE(m_db->rows(themeletState),
             QStringList { package + QStringLiteral("/images/sunset.jpg|60|ringerToneFile|dusk.ogg") });

    // A changed file is read again at the next install, into the same rows.
    QVERIFY(FixtureFiles::write(package + QStringLiteral("/sunset.themelet"), R"({"wallpaper": "dawn.jpg",
        "displayName": "Dawn", "ringerVolume": 10, "ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));
    installer()->appendDirectory(InstallManager::installPaths().at(0));
    QVERIFY(EventLoopIdle::wait());
    QCOMPARE(m_db->rows(fileState), QStringList { "1|application/x-vorka-themelet|1|Dawn|2|1" });
    QCOMPARE(m_db->rows(themeletState),
             QStringList { package + QStringLiteral("/images/dawn.jpg|60|ringerToneFile|dusk.ogg") });

    // A package that is gone takes its rows along.
    QVERIFY(QDir(package).removeRecursively());
    installer()->appendDirectory(InstallManager::installPaths().at(0));
    QVERIFY(EventLoopIdle::wait());
    QVERIFY(!directoryId(package).isValid());
    QCOMPARE(m_db->value(QStringLiteral("SELECT (SELECT count(*) FROM file WHERE id = %1) "
                                        "+ (SELECT count(*) FROM themelet WHERE fileId = %1) "
                                        "+ (SELECT count(*) FROM resource WHERE fileId = %1)")
                                 .arg(fileId))
                     .toInt(),
             0);
}

QTEST_GUILESS_MAIN(tst_InstallManager)
#include "tst_installmanager.moc"
