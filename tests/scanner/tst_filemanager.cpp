#include "dbmanager.h"
#include "filemanager.h"
#include "filemanagerfixture.h"
#include "signalrecorder.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QRegularExpression>
#include <QtTest>

using namespace FileManagerFixture;

// Scans and registration: what a scan of one directory does to its rows, how
// the walk descends, and appendDirectory/insertFile.
class tst_FileManager : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();

    void scanByScope_data();
    void scanByScope();
    void mergeOrder_data();
    void mergeOrder();
    void hiddenAndLinks();
    void breadthFirst();
    void directoryVanishesBeforeItsScan();
    void knownSubdirectoryIsNotAdopted();
    void appendDirectory();
    void appendDirectoryNewScope();
    void appendDirectoryScanAlways_data();
    void appendDirectoryScanAlways();
    void insertFile();
    void managerFromType();

private:
    DbManager &db() { return DbManager::instance(); }
};

void tst_FileManager::initTestCase()
{
    QVERIFY(db().isOpen());
}

void tst_FileManager::init()
{
    resetIndex();
    SignalRecorder::clear();
}

void tst_FileManager::scanByScope_data()
{
    QTest::addColumn<int>("scope");
    QTest::addColumn<QStringList>("rootRows");
    QTest::addColumn<bool>("newDirectoryInserted");

    // Disk: a (new), b (unchanged), c (touched since), known/k, fresh/.
    // Rows: b, c, d (gone), known/ and vanished/ with a file.
    QTest::newRow("user") << 0 << QStringList { "a|0", "b|1", "c|0" } << true;
    QTest::newRow("install") << 1 << QStringList { "b|1", "c|0" } << false;
    QTest::newRow("package") << 2 << QStringList { "b|1", "c|1" } << false;
    QTest::newRow("index") << 3 << QStringList { "b|1", "c|1" } << false;
}

void tst_FileManager::scanByScope()
{
    QFETCH(int, scope);
    QFETCH(QStringList, rootRows);
    QFETCH(bool, newDirectoryInserted);

    const QString root = makeTree();
    for (const char *name : { "a", "b", "c" })
        writeFile(root + '/' + name);
    QDir(root).mkpath("known");
    QDir(root).mkpath("fresh");
    writeFile(root + "/known/k");

    const qint64 rootId = addDirectoryRow(root, scope);
    addFileRow(rootId, "b", QFileInfo(root + "/b").lastModified());
    addFileRow(rootId, "c", QFileInfo(root + "/c").lastModified().addSecs(-60));
    addFileRow(rootId, "d", QDateTime::currentDateTime());
    addDirectoryRow(root + "/known", 0, rootId);
    addFileRow(addDirectoryRow(root + "/vanished", 0, rootId), "v", QDateTime::currentDateTime());

    FileManager manager(db(), nullptr);
    QVERIFY(settle(manager));

    QCOMPARE(fileRows(root), rootRows);
    // A known subdirectory is walked in every scope; its own scope rules there.
    QCOMPARE(fileRows(root + "/known"), QStringList { "k|0" });
    QCOMPARE(directoryId(root + "/vanished"), 0);
    QCOMPARE(rows("SELECT COUNT(*) FROM file WHERE fileName = 'v';"), QStringList { "0" });
    QCOMPARE(rows("SELECT scope, parentId FROM directory WHERE path = ?;", { root + "/fresh" }),
             newDirectoryInserted ? QStringList { "0|" + QString::number(rootId) } : QStringList());
    QCOMPARE(rows("SELECT permissions FROM file WHERE fileName = 'k';"), QStringList { "3" });
    QVERIFY(SignalRecorder::calls().contains(0));
}

void tst_FileManager::mergeOrder_data()
{
    QTest::addColumn<QStringList>("disk");
    QTest::addColumn<QStringList>("before");
    QTest::addColumn<QStringList>("after");

    // Rows that exist before the scan are current (1); rows it inserts are not.
    QTest::newRow("no files, two rows") << QStringList() << QStringList { "a", "b" } << QStringList();
    QTest::newRow("list runs out on a match")
            << QStringList { "a", "b" } << QStringList { "a", "b", "c" } << QStringList { "a|1", "b|1" };
    QTest::newRow("rows b, c") << QStringList { "a", "b" } << QStringList { "b", "c" }
                               << QStringList { "a|0", "b|1" };
    // The row fetched when the list runs out stays until the next scan.
    QTest::newRow("gap at the end of the list")
            << QStringList { "a", "b" } << QStringList { "c" } << QStringList { "a|0", "b|0", "c|1" };
    QTest::newRow("only the first row after the list stays")
            << QStringList { "a" } << QStringList { "c", "d" } << QStringList { "a|0", "c|1" };
    // U+FF21 sorts before U+1F600 in UTF-8 but after it in UTF-16.
    const QString wide = QString::fromUtf8("\xef\xbc\xa1");
    const QString emoji = QString::fromUtf8("\xf0\x9f\x98\x80");
    QTest::newRow("utf-8 byte order") << QStringList { emoji, wide, "Z", "a" }
                                      << QStringList { wide, emoji, "a" }
                                      << QStringList { "Z|0", "a|1", wide + "|1", emoji + "|1" };
}

void tst_FileManager::mergeOrder()
{
    QFETCH(QStringList, disk);
    QFETCH(QStringList, before);
    QFETCH(QStringList, after);

    const QString root = makeTree();
    for (const QString &name : disk)
        writeFile(root + '/' + name);
    const qint64 rootId = addDirectoryRow(root, 0);
    for (const QString &name : before)
        addFileRow(rootId, name, QFileInfo(root + '/' + name).lastModified());

    FileManager manager(db(), nullptr);
    QVERIFY(settle(manager));

    // SQLite's ORDER BY is byte order too.
    QCOMPARE(fileRows(root), after);
}

void tst_FileManager::hiddenAndLinks()
{
    const QString root = makeTree();
    const QString outside = makeTree();
    writeFile(root + "/target");
    writeFile(root + "/.hidden");
    QDir(root).mkpath(".hiddendir");
    writeFile(root + "/.hiddendir/inside");
    QVERIFY(QFile::link(root + "/target", root + "/linkfile"));
    QVERIFY(QFile::link(outside, root + "/linkdir"));
    writeFile(outside + "/behindlink");
    addDirectoryRow(root, 0);

    FileManager manager(db(), nullptr);
    QVERIFY(settle(manager));

    QCOMPARE(fileRows(root), (QStringList { "linkfile|0", "target|0" }));
    QCOMPARE(rows("SELECT path FROM directory;"), QStringList { root });
    QCOMPARE(rows("SELECT COUNT(*) FROM file;"), QStringList { "2" });
}

void tst_FileManager::breadthFirst()
{
    const QString root = makeTree();
    QDir(root).mkpath("A/C");
    QDir(root).mkpath("B");
    writeFile(root + "/r");
    writeFile(root + "/A/a");
    writeFile(root + "/B/b");
    writeFile(root + "/A/C/c");
    addDirectoryRow(root, 0);

    FileManager manager(db(), nullptr);
    // Each posted update is one step: one directory, in the order R, A, B, C.
    const QStringList expected { "r", "a r", "a b r", "a b c r" };
    for (const QString &files : expected) {
        QVERIFY(manager.isUpdateQueued());
        QCoreApplication::sendPostedEvents(&manager, QEvent::UpdateRequest);
        QCOMPARE(rows("SELECT fileName FROM file ORDER BY fileName;").join(' '), files);
    }
    QCOMPARE(rows("SELECT COUNT(*) FROM directory WHERE scope = 0;"), QStringList { "4" });
    QCoreApplication::sendPostedEvents(&manager, QEvent::UpdateRequest);
    QVERIFY(!manager.isUpdateQueued());
    QCOMPARE(SignalRecorder::calls(), (QList<int> { 0, 0, 0, 0 }));
}

void tst_FileManager::directoryVanishesBeforeItsScan()
{
    const QString root = makeTree();
    QDir(root).mkpath("S");
    writeFile(root + "/S/f");
    addDirectoryRow(root, 0);

    FileManager manager(db(), nullptr);
    QCoreApplication::sendPostedEvents(&manager, QEvent::UpdateRequest);
    QVERIFY(directoryId(root + "/S"));
    QVERIFY(QDir(root + "/S").removeRecursively());

    // The failed watch is reported and the scan goes on, finding nothing.
    QTest::ignoreMessage(QtWarningMsg, qPrintable("Failed to add listener -1 \"" + root + "/S\""));
    QVERIFY(settle(manager));
    QVERIFY(directoryId(root + "/S"));
    QCOMPARE(rows("SELECT COUNT(*) FROM file;"), QStringList { "0" });
}

void tst_FileManager::knownSubdirectoryIsNotAdopted()
{
    const QString root = makeTree();
    QDir(root).mkpath("S");
    writeFile(root + "/r");
    addDirectoryRow(root, 0);
    addDirectoryRow(root + "/S", 1);

    // S is already a root of its own: inserting it as a child fails, and the
    // scan of its parent rolls back.
    QTest::ignoreMessage(QtWarningMsg, "bool FileManager::scanDirectory()");
    QTest::ignoreMessage(QtWarningMsg, "Failed to execute m_directoryInsert.");
    QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^QSqlError\\("));
    QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^\"INSERT INTO directory"));
    FileManager manager(db(), nullptr);
    QVERIFY(settle(manager));

    QCOMPARE(fileRows(root), QStringList());
    QCOMPARE(rows("SELECT parentId, scope FROM directory WHERE path = ?;", { root + "/S" }),
             QStringList { "NULL|1" });
}

void tst_FileManager::appendDirectory()
{
    const QString root = makeTree();
    writeFile(root + "/f");
    FileManager manager(db(), nullptr);
    QVERIFY(settle(manager));

    const qint64 id = manager.appendDirectory(root, FileManager::UserScope, FileManager::ScanNew);
    QVERIFY(id > 0);
    QVERIFY(manager.isUpdateQueued());
    QVERIFY(settle(manager));
    QCOMPARE(rows("SELECT parentId, scope FROM directory WHERE id = ?;", { id }), QStringList { "NULL|0" });
    QCOMPARE(fileRows(root), QStringList { "f|0" });

    QCOMPARE(manager.appendDirectory(root, FileManager::UserScope, FileManager::ScanNew), id);
    QVERIFY(!manager.isUpdateQueued());

    QCOMPARE(manager.appendDirectory(root + "/missing", FileManager::UserScope, FileManager::ScanAlways), 0);
    QVERIFY(!manager.isUpdateQueued());
    QCOMPARE(rows("SELECT COUNT(*) FROM directory;"), QStringList { "1" });
}

void tst_FileManager::appendDirectoryNewScope()
{
    const QString root = makeTree();
    writeFile(root + "/f");
    FileManager manager(db(), nullptr);
    const qint64 id = manager.appendDirectory(root, FileManager::UserScope, FileManager::ScanNew);
    QVERIFY(settle(manager));
    rows("UPDATE file SET metadataCurrent = 1;");

    QCOMPARE(manager.appendDirectory(root, FileManager::InstallScope, FileManager::NoScan), id);
    QVERIFY(!manager.isUpdateQueued());
    QCOMPARE(rows("SELECT scope FROM directory WHERE id = ?;", { id }), QStringList { "1" });
    QVERIFY(settle(manager)); // the IN_IGNORED of the removed watch

    // Unwatched now: a change of a known file goes unheard.
    writeFile(root + "/f", "changed");
    QCOMPARE(pendingBytes(manager), 0);
    QCOMPARE(fileRows(root), QStringList { "f|1" });
}

void tst_FileManager::appendDirectoryScanAlways_data()
{
    QTest::addColumn<int>("scope");
    QTest::addColumn<QStringList>("after");

    // A live watch means the directory is trusted: the queued scan passes over it.
    QTest::newRow("watched") << int(FileManager::UserScope) << QStringList { "absent|1", "f|0" };
    QTest::newRow("package, never watched") << int(FileManager::PackageScope) << QStringList();
}

void tst_FileManager::appendDirectoryScanAlways()
{
    QFETCH(int, scope);
    QFETCH(QStringList, after);

    const QString root = makeTree();
    writeFile(root + "/f");
    FileManager manager(db(), nullptr);
    const qint64 id = manager.appendDirectory(root, FileManager::DirectoryScope(scope), FileManager::ScanNew);
    QVERIFY(settle(manager));
    addFileRow(id, "absent", QDateTime::currentDateTime());

    QCOMPARE(manager.appendDirectory(root, FileManager::DirectoryScope(scope), FileManager::ScanAlways), id);
    QVERIFY(manager.isUpdateQueued());
    QVERIFY(settle(manager));
    QCOMPARE(fileRows(root), after);
}

void tst_FileManager::insertFile()
{
    const QString root = makeTree();
    writeFile(root + "/t.txt");
    writeFile(root + "/other");
    FileManager manager(db(), nullptr);
    QVERIFY(settle(manager));

    QCOMPARE(manager.insertFile(root + "/missing"), 0);
    QCOMPARE(rows("SELECT COUNT(*) FROM directory;"), QStringList { "0" });

    const qint64 id = manager.insertFile(root + "/t.txt");
    QVERIFY(id > 0);
    QCOMPARE(manager.insertFile(root + "/t.txt"), id);
    QCOMPARE(rows("SELECT parentId, scope FROM directory;"), QStringList { "NULL|1" });
    QCOMPARE(rows("SELECT mimeType, permissions, metadataCurrent FROM file WHERE id = ?;", { id }),
             QStringList { "text/plain|3|0" });

    // The directory is scanned in its scope: the other file stays unindexed,
    // and from now on the directory is watched.
    QVERIFY(settle(manager));
    QCOMPARE(fileRows(root), QStringList { "t.txt|0" });
    writeFile(root + "/t.txt", "changed");
    QVERIFY(pendingBytes(manager) > 0);
}

void tst_FileManager::managerFromType()
{
    ContentManager *manager = ContentManager::managerFromType(0);
    QVERIFY(dynamic_cast<FileManager *>(manager));
    QCOMPARE(ContentManager::managerFromType(0), manager);
}

QTEST_GUILESS_MAIN(tst_FileManager)
#include "tst_filemanager.moc"
