#include "managertestcase.h"

#include "contentmanager.h"
#include "imagemanager.h"

#include <QImage>
#include <QProcess>
#include <QTemporaryDir>

namespace {

const char *const InsertFile = "INSERT INTO file (id, directoryId, mimeType, fileName, permissions, metadataCurrent)"
                               " VALUES (%1, %2, '%3', '%4', 3, %5);";

enum Damage { Intact, Corrupt, Truncated, Vanished, NoDirectoryRow };

}

Q_DECLARE_METATYPE(Damage)

class TestImageManager : public QObject, private ManagerTestCase
{
    Q_OBJECT

private slots:
    void init();
    void cleanup() { closeIndex(); }
    void readsPicture_data();
    void readsPicture();
    void batches_data();
    void batches();
    void failedStepKeepsRowsStale_data();
    void failedStepKeepsRowsStale();
    void managerFromType();

private:
    QString writeJpeg(const QString &name, const QStringList &tags = QStringList());
    int stale() { return m_sql->value("SELECT COUNT(*) FROM file WHERE metadataCurrent = 0;").toInt(); }

    std::unique_ptr<QTemporaryDir> m_dir;
};

void TestImageManager::init()
{
    m_dir.reset(new QTemporaryDir);
    openFreshIndex();
    m_sql->exec(QStringLiteral("INSERT INTO directory (id, path, scope) VALUES (1, '%1', 0);").arg(m_dir->path()));
}

// A 64x48 JPEG; tags are exiv2 modify commands.
QString TestImageManager::writeJpeg(const QString &name, const QStringList &tags)
{
    const QString path = m_dir->filePath(name);
    QImage image(64, 48, QImage::Format_RGB32);
    image.fill(Qt::darkCyan);
    QStringList arguments;
    for (const QString &tag : tags)
        arguments << QStringLiteral("-M") << tag;
    if (!image.save(path, "JPG")
        || (!tags.isEmpty() && QProcess::execute(QStringLiteral("exiv2"), arguments << path) != 0))
        return QString();
    return path;
}

void TestImageManager::readsPicture_data()
{
    QTest::addColumn<QStringList>("tags");
    QTest::addColumn<Damage>("damage");
    QTest::addColumn<QString>("expected");

    const QStringList exif { "set Exif.Photo.DateTimeOriginal 2014:05:01 12:00:00", "set Exif.Image.Orientation 6" };
    const QStringList xmp { "set Xmp.exif.DateTimeOriginal 2015-06-02T08:30:00", "set Xmp.tiff.Orientation 3" };
    const QString unread = QStringLiteral("-1|-1|NULL|NULL");

    QTest::newRow("exif") << exif << Intact << "64|48|2014-05-01T12:00:00.000|6";
    QTest::newRow("xmp only") << xmp << Intact << "64|48|2015-06-02T08:30:00.000|3";
    QTest::newRow("exif first, xmp fills in") << (xmp + QStringList { exif.last() }) << Intact << "64|48|2015-06-02T08:30:00.000|6";
    QTest::newRow("corrupt") << exif << Corrupt << unread;
    QTest::newRow("truncated") << exif << Truncated << unread;
    QTest::newRow("vanished") << exif << Vanished << unread;
    QTest::newRow("no directory row") << exif << NoDirectoryRow << unread;
}

// Unreadable files are read like any other: they get a row and become current.
void TestImageManager::readsPicture()
{
    QFETCH(QStringList, tags);
    QFETCH(Damage, damage);
    QFETCH(QString, expected);

    QFile file(writeJpeg(QStringLiteral("picture.jpg"), tags));
    QVERIFY(file.exists());
    if (damage == Corrupt)
        QVERIFY(file.open(QIODevice::WriteOnly) && file.write(QByteArray(2048, 'x')) == 2048);
    if (damage == Truncated) {
        QTest::ignoreMessage(QtWarningMsg, "JPEG datastream contains no image");
        QVERIFY(file.resize(40));
    }
    if (damage == Vanished)
        QVERIFY(file.remove());
    file.close();
    m_sql->exec({ QString(InsertFile).arg(1).arg(damage == NoDirectoryRow ? 9 : 1).arg("image/jpeg", "picture.jpg").arg(0),
                  QStringLiteral("INSERT INTO image VALUES (1, 'old', 1, 1, 1);") });

    ImageManager manager(*m_db);
    QVERIFY(!manager.updateMetaData());
    QCOMPARE(m_sql->rows("SELECT width, height, dateTaken, orientation FROM image;"), QStringList { expected });
    QCOMPARE(stale(), 0);
    QCOMPARE(SignalRecorder::calls(), QList<int> { 2 });
}

void TestImageManager::batches_data()
{
    QTest::addColumn<int>("count");
    QTest::addColumn<QList<bool>>("results");
    QTest::addColumn<QList<int>>("marked");

    QTest::newRow("none") << 0 << QList<bool> { false } << QList<int> { 0 };
    QTest::newRow("99") << 99 << QList<bool> { false } << QList<int> { 99 };
    QTest::newRow("100") << 100 << QList<bool> { true, false } << QList<int> { 100, 0 };
    QTest::newRow("101") << 101 << QList<bool> { true, false } << QList<int> { 100, 1 };
}

void TestImageManager::batches()
{
    QFETCH(int, count);
    QFETCH(QList<bool>, results);
    QFETCH(QList<int>, marked);

    QFile source(writeJpeg(QStringLiteral("source.jpg")));
    QVERIFY(source.open(QIODevice::ReadOnly));
    const QByteArray bytes = source.readAll();
    QStringList rows;
    for (int i = 1; i <= count; ++i) {
        QFile copy(m_dir->filePath(QStringLiteral("p%1.jpg").arg(i)));
        QVERIFY(copy.open(QIODevice::WriteOnly) && copy.write(bytes) == bytes.size());
        rows << QString(InsertFile).arg(i).arg(1).arg("image/jpeg", copy.fileName().section('/', -1)).arg(0);
    }
    // Never selected: current already, or no "image/" in front (GLOB is case-sensitive).
    int id = 1000;
    for (const char *type : { "audio/ogg", "imagejpeg", "image", "application/image", "Image/jpeg" })
        rows << QString(InsertFile).arg(++id).arg(1).arg(type, QString::number(id)).arg(0);
    rows << QString(InsertFile).arg(++id).arg(1).arg("image/png", "current.png").arg(1);
    m_sql->exec(rows);

    ImageManager manager(*m_db);
    QList<int> calls;
    for (int step = 0; step < results.size(); ++step) {
        const int before = stale();
        QCOMPARE(manager.updateMetaData(), results.at(step));
        QCOMPARE(before - stale(), marked.at(step));
        if (marked.at(step))
            calls << 2;
        QCOMPARE(SignalRecorder::calls(), calls);
    }
    QCOMPARE(stale(), 5);
    QCOMPARE(m_sql->value("SELECT COUNT(*) FROM image WHERE width = 64 AND height = 48;").toInt(), count);
}

void TestImageManager::failedStepKeepsRowsStale_data()
{
    QTest::addColumn<QString>("table");
    QTest::addColumn<QByteArray>("message");
    QTest::addColumn<QString>("statement");

    QTest::newRow("reset") << "UPDATE ON file" << QByteArray("Failed to execute m_modifiedReset.")
                           << "UPDATE file SET metadataCurrent = 1 WHERE id = ?;";
    QTest::newRow("image") << "INSERT ON image" << QByteArray("Failed to execute m_imageUpdate.")
                           << "INSERT OR REPLACE INTO image ( fileId, dateTaken, width, height, orientation) VALUES (?, ?, ?, ?, ?);";
}

// The rows of a failed step stay stale, and the next step reads them again.
void TestImageManager::failedStepKeepsRowsStale()
{
    QFETCH(QString, table);
    QFETCH(QByteArray, message);
    QFETCH(QString, statement);

    QVERIFY(!writeJpeg(QStringLiteral("picture.jpg")).isEmpty());
    m_sql->exec({ QString(InsertFile).arg(1).arg(1).arg("image/jpeg", "picture.jpg").arg(0),
                  QStringLiteral("CREATE TRIGGER refuse BEFORE %1 BEGIN SELECT RAISE(ABORT, 'no'); END;").arg(table) });
    ImageManager manager(*m_db);

    expectQueryWarning("virtual bool ImageManager::updateMetaData()", message.constData(), statement);
    QVERIFY(!manager.updateMetaData());
    QCOMPARE(stale(), 1);
    QCOMPARE(m_sql->value("SELECT COUNT(*) FROM image;").toInt(), 0);
    QVERIFY(SignalRecorder::calls().isEmpty());

    m_sql->exec(QStringLiteral("DROP TRIGGER refuse;"));
    QVERIFY(!manager.updateMetaData());
    QCOMPARE(m_sql->rows("SELECT width, height, dateTaken, orientation FROM image;"), QStringList { "64|48|NULL|NULL" });
}

void TestImageManager::managerFromType()
{
    ContentManager *manager = ContentManager::managerFromType(2);
    QVERIFY(dynamic_cast<ImageManager *>(manager));
    QCOMPARE(ContentManager::scannerManagers(), QList<ContentManager *> { manager });
    QCOMPARE(manager->mimeType(), QStringLiteral("image/*"));
}

QTEST_GUILESS_MAIN(TestImageManager)

#include "tst_imagemanager.moc"
