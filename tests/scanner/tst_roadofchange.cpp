#include "filemanagerloop.h"
#include "managertestcase.h"

#include <QDir>
#include <QtTest>

// A picture that lands in a watched directory, followed by the service's own
// loop: the event gives a stale file row, a later step reads the picture.
class tst_RoadOfChange : public QObject, private ManagerTestCase
{
    Q_OBJECT

private slots:
    void pictureLandsInWatchedDirectory();
};

void tst_RoadOfChange::pictureLandsInWatchedDirectory()
{
    const QString pictures = qEnvironmentVariable("THEMELET_SANDBOX") + "/pictures";
    const QString shot = qEnvironmentVariable("THEMELET_SANDBOX") + "/shot.jpg";
    QVERIFY(QDir().mkpath(pictures));
    QVERIFY(writeJpeg(shot, { "set Exif.Photo.DateTimeOriginal 2014:05:01 12:00:00", "set Exif.Image.Orientation 6" }));

    auto *manager = static_cast<FileManager *>(ContentManager::managerFromType(ThemeletContent::File));
    QVERIFY(manager->appendDirectory(pictures, FileManager::UserScope, FileManager::ScanNew) > 0);
    QVERIFY(settle(*manager));
    SignalRecorder::clear();

    // The read alone, as the loop would deliver it: the steps it posts haven't run yet.
    QVERIFY(QFile::rename(shot, pictures + "/shot.jpg"));
    QVERIFY(pendingBytes(*manager) > 0);
    QEvent read(QEvent::SockAct);
    QCoreApplication::sendEvent(manager, &read);
    TestDatabase sql;
    QCOMPARE(sql.rows("SELECT fileName, mimeType, permissions, metadataCurrent FROM file;"),
             QStringList { "shot.jpg|image/jpeg|3|0" });
    QCOMPARE(sql.value("SELECT COUNT(*) FROM image;").toInt(), 0);

    QVERIFY(settle(*manager));
    QCOMPARE(SignalRecorder::calls(), QList<int>({ 0, 2 }));
    QCOMPARE(sql.rows("SELECT metadataCurrent, width, height, dateTaken, orientation FROM file JOIN image ON fileId = id;"),
             QStringList { "1|64|48|2014-05-01T12:00:00.000|6" });
}

QTEST_GUILESS_MAIN(tst_RoadOfChange)
#include "tst_roadofchange.moc"
