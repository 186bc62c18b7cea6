// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexfixture.h"

#include "imagemanager.h"

#include <sys/stat.h>

using namespace Fixture;

static const QString s_insert = "INSERT INTO file (directoryId, mimeType, fileName, permissions, metadataCurrent) ";

class TestImageManager : public QObject
{
    Q_OBJECT

    TestDatabase m_sql { serviceIndex() };
    QString m_dir;

    int stale() { return m_sql.value("SELECT COUNT(*) FROM file WHERE metadataCurrent = 0;").toInt(); }

private slots:
    void init()
    {
        QVERIFY(QDir().mkpath(m_dir = uniquePath()));
        m_sql.exec({ "DROP TRIGGER IF EXISTS refuse;", "DELETE FROM directory;", "DELETE FROM file;",
                     QString("INSERT INTO directory (id, path, scope) VALUES (1, '%1', 0);").arg(m_dir) });
        SignalRecorder::clear();
    }

    void step_data()
    {
        QTest::addColumn<QString>("damage");
        QTest::addColumn<QString>("image");
        QTest::addColumn<QStringList>("warnings");

        QTest::newRow("exif first, xmp fills in") << "" << "64|48|2015-06-02T08:30:00.000|6" << QStringList();
        // Unreadable files are read like any other: they get a row and become current.
        QTest::newRow("corrupt") << "corrupt" << "-1|-1|NULL|NULL" << QStringList();
        QTest::newRow("fifo, not waited for") << "fifo" << "-1|-1|NULL|NULL" << QStringList();
        // A failed step leaves its rows stale for the next one.
        QTest::newRow("failed reset") << "UPDATE ON file" << "1|1|old|1"
                << failure("virtual bool ImageManager::updateMetaData()", "Failed to execute m_modifiedReset.",
                           "UPDATE file SET metadataCurrent = 1 WHERE id = ?;");
        QTest::newRow("failed image write") << "INSERT ON image" << "1|1|old|1"
                << failure("virtual bool ImageManager::updateMetaData()", "Failed to execute m_imageUpdate.",
                           "INSERT OR REPLACE INTO image ( fileId, dateTaken, width, height, orientation) VALUES (?, ?, ?, ?, ?);");
    }

    void step()
    {
        QFETCH(QString, damage);
        QFETCH(QString, image);
        QFETCH(QStringList, warnings);
        const QString path = m_dir + "/picture.jpg";
        if (damage == "corrupt")
            QVERIFY(write(path, QByteArray(2048, 'x')));
        else if (damage == "fifo")
            QVERIFY(::mkfifo(QFile::encodeName(path).constData(), 0644) == 0);
        else
            QVERIFY(writeJpeg(path, { "set Xmp.exif.DateTimeOriginal 2015-06-02T08:30:00", "set Xmp.tiff.Orientation 3",
                                      "set Exif.Image.Orientation 6" }));
        m_sql.exec({ "INSERT INTO file (id, directoryId, mimeType, fileName, permissions, metadataCurrent) "
                     "VALUES (1, 1, 'image/jpeg', 'picture.jpg', 3, 0);",
                     "INSERT INTO image VALUES (1, 'old', 1, 1, 1);" });
        if (damage.contains(" ON "))
            m_sql.exec(QString("CREATE TRIGGER refuse BEFORE %1 BEGIN SELECT RAISE(ABORT, 'no'); END;").arg(damage));

        MessageLog log(false);
        ImageManager manager(DbManager::instance());
        QVERIFY(!manager.updateMetaData());
        compareWarnings(log, warnings);
        QCOMPARE(m_sql.rows("SELECT width, height, dateTaken, orientation FROM image;"), QStringList { image });
        QCOMPARE(stale(), warnings.isEmpty() ? 0 : 1);
        QCOMPARE(SignalRecorder::calls(), warnings.isEmpty() ? QList<int> { 2 } : QList<int>());
    }

    void batches()
    {
        const int count = 101;
        QVERIFY(writeJpeg(m_dir + "/0.jpg"));
        for (int i = 1; i <= count; ++i)
            QVERIFY(QFile::copy(m_dir + "/0.jpg", m_dir + QString("/%1.jpg").arg(i)));
        // Never selected: no "image/" in front (GLOB is case-sensitive), or current already.
        m_sql.exec({ QString("WITH RECURSIVE n(i) AS (SELECT 1 UNION ALL SELECT i + 1 FROM n WHERE i < %1) ").arg(count)
                              + s_insert + "SELECT 1, 'image/jpeg', i || '.jpg', 3, 0 FROM n;",
                      s_insert + "VALUES (1, 'audio/ogg', 'a', 3, 0), (1, 'imagejpeg', 'b', 3, 0), (1, 'image', 'c', 3, 0),"
                                 " (1, 'application/image', 'd', 3, 0), (1, 'Image/jpeg', 'e', 3, 0), (1, 'image/png', 'f', 3, 1);" });

        ImageManager manager(DbManager::instance());
        QList<int> calls;
        for (int step : { 100, 1 }) { // made current by each step; a full batch asks for more
            const int before = stale();
            QCOMPARE(manager.updateMetaData(), step == 100);
            QCOMPARE(before - stale(), step);
            calls << 2;
            QCOMPARE(SignalRecorder::calls(), calls);
        }
        QCOMPARE(stale(), 5);
        QCOMPARE(m_sql.value("SELECT COUNT(*) FROM image WHERE width = 64 AND height = 48;").toInt(), count);
    }
};

QTEST_GUILESS_MAIN(TestImageManager)
#include "tst_imagemanager.moc"
