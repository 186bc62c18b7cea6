// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexfixture.h"

#include <sys/stat.h>

using namespace Fixture;

class tst_InstallManager : public QObject
{
    Q_OBJECT

    TestDatabase m_db { serviceIndex() };

private slots:
    void scanMerge()
    {
        // Packages a, b and r on disk; rows b, c, y and z from an earlier run, and r a root of its own, adopted with its id.
        const QString installDir = uniquePath();
        QVERIFY(writeTree(installDir, { "a/a.index", "b/b.index", "r/r.index" }, "{}"));
        QVERIFY(m_db.exec(QStringLiteral("INSERT INTO directory (path, scope) VALUES ('%1', 1), ('%1/r', 0)").arg(installDir)));
        const QString parentId = m_db.directoryId(installDir);
        QVERIFY(m_db.exec(QStringLiteral("INSERT INTO directory (parentId, path, scope) SELECT %1, '%2/' || column1, 2 "
                                         "FROM (VALUES ('b'), ('c'), ('y'), ('z'))").arg(parentId, installDir)));
        const QString knownIds = QStringLiteral("SELECT id FROM directory WHERE path IN ('%1/b', '%1/r') ORDER BY path").arg(installDir);
        const QStringList ids = m_db.rows(knownIds);
        const QString children = QStringLiteral("SELECT substr(path, %1), scope, (SELECT group_concat(metadataCurrent) FROM file "
                                                "WHERE directoryId = directory.id) FROM directory WHERE parentId = %2 ORDER BY path")
                                         .arg(installDir.size() + 2).arg(parentId);

        // New r uses up the list in front of row y, left for the next scan; z, behind it, goes at once. Also a name that
        // isn't UTF-8 and a package that vanishes while queued.
        QVERIFY(write(installDir + "/v/v.index", "{}"));
        QVERIFY(::mkdir((QFile::encodeName(installDir) + "/bad\xff\xfe").constData(), 0755) == 0);
        installer()->appendDirectory(installDir);
        QCoreApplication::sendPostedEvents(installer(), QEvent::UpdateRequest);
        QVERIFY(QDir(installDir + "/v").removeRecursively() && waitIdle());
        // No row for the name that isn't UTF-8; v, gone before its install, goes with the next scan like y.
        QCOMPARE(m_db.rows(children), (QStringList { "a|2|1", "b|2|1", "r|2|1", "v|2|NULL", "y|2|NULL" }));
        QCOMPARE(m_db.rows(knownIds), ids);
        QVERIFY(installFrom(installDir));
        QCOMPARE(m_db.rows(children), (QStringList { "a|2|1", "b|2|1", "r|2|1" }));
    }

    void install()
    {
        // Only .themelet and .index files right in the package count, by a case-sensitive suffix.
        const QString package = uniquePath();
        QVERIFY(writeTree(package, { "t1.themelet", "t2.themelet", "tones.index", "x.THEMELET", "c.index.txt", ".h.themelet",
                                     "y.themelet/z.index", "images/readme" }, "{}"));
        QVERIFY(installer()->install(package + "/images", QString(), false) && m_db.fileRows(package + "/images", "id").isEmpty());
        QVERIFY(!installer()->install(package + "/none", QString(), false) && installer()->install(package, QString(), false));
        const QString columns = QStringLiteral("fileName, permissions, metadataCurrent, zefId");
        QCOMPARE(m_db.fileRows(package, columns + ", mimeType"), (QStringList { "t1.themelet|1|0|NULL|application/x-vorka-themelet",
                "t2.themelet|1|0|NULL|application/x-vorka-themelet", "tones.index|1|0|NULL|application/x-vorka-index" }));
        const QStringList ids = m_db.fileRows(package, "id");
        QVERIFY(waitIdle());
        // As if read, and as if a writable row had been left behind.
        const QString markRead = "UPDATE file SET metadataCurrent = 1, permissions = 3 WHERE directoryId = " + m_db.directoryId(package);

        // Unchanged, also from another time zone: nothing to update, but the ZEF id is bound; an empty one keeps it.
        const QByteArray zone = qgetenv("TZ");
        setTimeZone("America/St_Johns");
        QVERIFY(m_db.exec(markRead) && installer()->install(package, QStringLiteral("Z1"), false));
        setTimeZone(zone);
        QVERIFY(write(package + QStringLiteral("/t2.themelet"), "{}") && installer()->install(package, QString(), false));
        QCOMPARE(m_db.fileRows(package, columns), (QStringList { "t1.themelet|3|1|Z1", "t2.themelet|1|0|Z1", "tones.index|3|1|NULL" }));
        QCOMPARE(m_db.fileRows(package, "modificationTime").value(1),
                 QFileInfo(package + QStringLiteral("/t2.themelet")).lastModified().toUTC().toString(Qt::ISODateWithMs));

        QVERIFY(m_db.exec(markRead) && installer()->install(package, QStringLiteral("Z2"), true));
        QCOMPARE(m_db.fileRows(package, columns), (QStringList { "t1.themelet|1|0|Z2", "t2.themelet|1|0|Z2", "tones.index|1|0|NULL" }));
        QVERIFY(m_db.fileRows(package, "id") == ids && waitIdle());
    }

    void setFavorite()
    {
        QVERIFY(m_db.exec("INSERT INTO themelet (fileId, homeWallpaper) VALUES (-1, '/w/shared.jpg'), (-2, '/w/shared.jpg'), "
                          "(-3, '/w/other.jpg')"));
        const QString favorites = "SELECT group_concat(favorite, '') FROM (SELECT favorite FROM themelet WHERE fileId < 0 "
                                  "ORDER BY fileId DESC)";

        MessageLog log(false);
        QVERIFY(installer()->setFavorite("/w/shared.jpg", true) && !installer()->setFavorite("/w/none.jpg", true));
        QCOMPARE(m_db.value(favorites).toString(), "110");
        QCOMPARE(log.warnings(), (QStringList { "bool InstallManager::setFavorite(const QString&, bool)",
                                                "No themelet found with url '/w/none.jpg'" }));
    }
};

QTEST_GUILESS_MAIN(tst_InstallManager)
#include "tst_installmanager.moc"
