#include "dbmanager.h"
#include "filemanager.h"
#include "signalrecorder.h"
#include "testdatabase.h"

#include <QDir>
#include <QImage>
#include <QProcess>
#include <QtTest>

#include <sys/ioctl.h>

// A picture that lands in a watched directory, followed by the loop alone:
// the event gives a stale file row, the next step reads the picture.
class tst_RoadOfChange : public QObject
{
    Q_OBJECT

private slots:
    void pictureLandsInWatchedDirectory();

protected:
    bool eventFilter(QObject *watched, QEvent *event) override;

private:
    QStringList m_rowsAtFirstStep;
    bool m_sawSocketEvent = false;
};

namespace {

int pendingBytes(const FileManager &manager)
{
    int size = 0;
    ioctl(int(manager.socket()), FIONREAD, &size);
    return size;
}

bool settle(FileManager &manager)
{
    QElapsedTimer timer;
    timer.start();
    while (pendingBytes(manager) > 0 || manager.isUpdateQueued()) {
        if (timer.hasExpired(5000))
            return false;
        QCoreApplication::processEvents();
    }
    return true;
}

}

bool tst_RoadOfChange::eventFilter(QObject *, QEvent *event)
{
    // The state between the inotify read and the first pipeline step after it.
    if (event->type() == QEvent::SockAct) {
        m_sawSocketEvent = true;
    } else if (event->type() == QEvent::UpdateRequest && m_sawSocketEvent && m_rowsAtFirstStep.isEmpty()) {
        TestDatabase sql;
        m_rowsAtFirstStep = sql.rows(QStringLiteral(
                "SELECT fileName, mimeType, permissions, metadataCurrent FROM file"));
        m_rowsAtFirstStep << sql.rows(QStringLiteral("SELECT COUNT(*) FROM image"));
    }
    return false;
}

void tst_RoadOfChange::pictureLandsInWatchedDirectory()
{
    const QString sandbox = qEnvironmentVariable("THEMELET_SANDBOX");
    const QString pictures = sandbox + QStringLiteral("/pictures");
    const QString staging = sandbox + QStringLiteral("/staging");
    QVERIFY(QDir().mkpath(pictures));
    QVERIFY(QDir().mkpath(staging));

    auto *manager = static_cast<FileManager *>(ContentManager::managerFromType(ThemeletContent::File));
    QVERIFY(manager);
    QVERIFY(manager->appendDirectory(pictures, FileManager::UserScope, FileManager::ScanNew) > 0);
    QVERIFY(settle(*manager));
    SignalRecorder::clear();

    QImage image(64, 48, QImage::Format_RGB32);
    image.fill(Qt::darkCyan);
    const QString shot = staging + QStringLiteral("/shot.jpg");
    QVERIFY(image.save(shot, "JPG"));
    QCOMPARE(QProcess::execute(QStringLiteral("exiv2"),
                               { QStringLiteral("-M"), QStringLiteral("set Exif.Photo.DateTimeOriginal 2014:05:01 12:00:00"),
                                 QStringLiteral("-M"), QStringLiteral("set Exif.Image.Orientation 6"), shot }),
             0);

    manager->installEventFilter(this);
    QVERIFY(QFile::rename(shot, pictures + QStringLiteral("/shot.jpg")));
    QTRY_VERIFY(pendingBytes(*manager) > 0 || !m_rowsAtFirstStep.isEmpty());
    QVERIFY(settle(*manager));
    manager->removeEventFilter(this);

    QCOMPARE(m_rowsAtFirstStep, QStringList({ QStringLiteral("shot.jpg|image/jpeg|3|0"), QStringLiteral("0") }));
    QCOMPARE(SignalRecorder::calls(), QList<int>({ 0, 2 }));

    TestDatabase sql;
    QCOMPARE(sql.rows(QStringLiteral("SELECT permissions, metadataCurrent FROM file")),
             QStringList { QStringLiteral("3|1") });
    const QStringList picture = sql.rows(QStringLiteral("SELECT width, height, dateTaken, orientation FROM image"));
    QCOMPARE(picture.size(), 1);
    QVERIFY2(picture.first().startsWith(QStringLiteral("64|48|2014-05-01T12:00:00")), qPrintable(picture.first()));
    QVERIFY(picture.first().endsWith(QStringLiteral("|6")));
}

QTEST_GUILESS_MAIN(tst_RoadOfChange)
#include "tst_roadofchange.moc"
