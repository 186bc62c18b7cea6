#include "dbmanager.h"
#include "filemanager.h"
#include "signalrecorder.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QUuid>
#include <QtTest>

#include <fcntl.h>
#include <sys/inotify.h>
#include <sys/ioctl.h>
#include <unistd.h>

// FileManager against real inotify in the sandbox, the sandbox index through
// the service's own connection and the event loop run until the manager is idle.
class tst_FileManager : public QObject
{
    Q_OBJECT

public:
    enum Operation { Move, MoveOntoKnown, CreateDeleteCreate, CreateThenDelete, MoveAwayAndRecreate,
                     CreateAndModify, ModifyUnknown, ManyFiles, UnknownWatch, HiddenFile, InvalidName,
                     CreateDirectory, RemoveDirectory, MoveDirectoryAway, RemoveRoot };
    Q_ENUM(Operation)

private slots:
    void init();
    void scan_data();
    void scan();
    void breadthFirst();
    void directoryVanishesBeforeItsScan();
    void knownSubdirectoryIsNotAdopted();
    void events_data();
    void events();
    void appendDirectory();
    void appendDirectoryNewScope();
    void appendDirectoryScanAlways_data();
    void appendDirectoryScanAlways();
    void insertFile();
    void managerFromType();

private:
    void apply(Operation operation, const QString &root, FileManager &manager);
};

namespace {

QString makeTree()
{
    const QString path = qEnvironmentVariable("THEMELET_SANDBOX") + "/tree-" + QUuid::createUuid().toString(QUuid::Id128);
    QDir().mkpath(path);
    return path;
}

void writeFile(const QString &path, const QByteArray &content = QByteArray())
{
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly | QIODevice::Append) || file.write(content) != content.size())
        qFatal("cannot write %s", qPrintable(path));
}

// Entries "name" (file), "name/" (directory), "link@target" (symbolic link).
void makeDisk(const QString &root, const QStringList &entries)
{
    for (const QString &entry : entries) {
        const QString path = root + '/' + entry.section('@', 0, 0);
        QDir().mkpath(QFileInfo(path).absolutePath());
        if (entry.contains('@'))
            QFile::link(root + '/' + entry.section('@', 1), path);
        else if (entry.endsWith('/'))
            QDir().mkpath(path);
        else
            writeFile(path);
    }
}

QSqlQuery run(const QString &statement, const QVariantList &values)
{
    QSqlQuery query(DbManager::instance());
    query.prepare(statement);
    for (const QVariant &value : values)
        query.addBindValue(value);
    if (!query.exec())
        qFatal("%s", qPrintable(statement));
    return query;
}

QStringList rows(const QString &statement, const QVariantList &values = QVariantList())
{
    QSqlQuery query = run(statement, values);
    QStringList result;
    while (query.next()) {
        QStringList columns;
        for (int i = 0; i < query.record().count(); ++i)
            columns << (query.isNull(i) ? "NULL" : query.value(i).toString());
        result << columns.join('|');
    }
    return result;
}

qint64 addDirectoryRow(const QString &path, int scope, qint64 parentId = 0)
{
    return run("INSERT INTO directory (parentId, path, scope) VALUES (?, ?, ?);",
               { parentId ? QVariant(parentId) : QVariant(QVariant::LongLong), path, scope })
            .lastInsertId().toLongLong();
}

// Current rows: "name" with the file's time, "name~" an older time, "dir/" a child directory.
void addRows(const QString &root, qint64 rootId, const QStringList &entries)
{
    for (QString entry : entries) {
        const bool old = entry.endsWith('~');
        entry.remove('~');
        const QString path = root + '/' + entry;
        if (entry.endsWith('/')) {
            addDirectoryRow(path.chopped(1), 0, rootId);
            continue;
        }
        const QString directory = QFileInfo(path).absolutePath();
        const QVariant directoryId = rows("SELECT id FROM directory WHERE path = ?;", { directory }).value(0);
        run("INSERT INTO file (directoryId, fileName, modificationTime, permissions, metadataCurrent) VALUES (?, ?, ?, 3, 1);",
            { directoryId, QFileInfo(path).fileName(), QFileInfo(path).lastModified().addSecs(old ? -60 : 0) });
    }
}

// The index below root: "dir/" for directories ("/" is root), "path|metadataCurrent" for files.
QStringList tree(const QString &root)
{
    QStringList result;
    for (const QString &path : rows("SELECT path FROM directory WHERE path = ? OR path LIKE ?;", { root, root + "/%" }))
        result << path.mid(root.size() + 1) + '/';
    result << rows("SELECT substr(directory.path || '/' || file.fileName, ?), file.metadataCurrent FROM file INNER JOIN directory ON directory.id = file.directoryId WHERE directory.path = ? OR directory.path LIKE ?;",
                   { root.size() + 2, root, root + "/%" });
    result.sort();
    return result;
}

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

void expectRollback(const char *function, const char *message, const char *statement)
{
    QTest::ignoreMessage(QtWarningMsg, function);
    QTest::ignoreMessage(QtWarningMsg, message);
    QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^QSqlError\\(.*UNIQUE"));
    QTest::ignoreMessage(QtWarningMsg, QRegularExpression(QString("^\"") + statement));
}

}

void tst_FileManager::init()
{
    rows("DELETE FROM file;");
    rows("DELETE FROM directory;");
    SignalRecorder::clear();
}

void tst_FileManager::scan_data()
{
    QTest::addColumn<int>("scope");
    QTest::addColumn<QStringList>("disk");
    QTest::addColumn<QStringList>("before");
    QTest::addColumn<QStringList>("after");

    const QStringList disk { "a", "b", "c", "fresh/", "k/x" };
    const QStringList before { "b", "c~", "d", "gone/", "gone/v", "k/" };
    // A known subdirectory is walked in every scope, under its own scope (0).
    QTest::newRow("user") << 0 << disk << before << QStringList { "/", "a|0", "b|1", "c|0", "fresh/", "k/", "k/x|0" };
    QTest::newRow("install") << 1 << disk << before << QStringList { "/", "b|1", "c|0", "k/", "k/x|0" };
    QTest::newRow("package") << 2 << disk << before << QStringList { "/", "b|1", "c|1", "k/", "k/x|0" };
    QTest::newRow("index") << 3 << disk << before << QStringList { "/", "b|1", "c|1", "k/", "k/x|0" };

    QTest::newRow("no files, two rows") << 0 << QStringList() << QStringList { "a", "b" } << QStringList { "/" };
    QTest::newRow("list runs out on a match")
            << 0 << QStringList { "a", "b" } << QStringList { "a", "b", "c" } << QStringList { "/", "a|1", "b|1" };
    // The row fetched when the list runs out stays until the next scan.
    QTest::newRow("gap at the end of the list")
            << 0 << QStringList { "a", "b" } << QStringList { "c" } << QStringList { "/", "a|0", "b|0", "c|1" };
    QTest::newRow("only the first row after the list stays")
            << 0 << QStringList { "a" } << QStringList { "c", "d" } << QStringList { "/", "a|0", "c|1" };
    // U+FF21 sorts before U+1F600 in UTF-8, after it in UTF-16.
    const QString wide = QString::fromUtf8("\xef\xbc\xa1"), emoji = QString::fromUtf8("\xf0\x9f\x98\x80");
    QTest::newRow("utf-8 byte order") << 0 << QStringList { emoji, wide, "Z", "a" } << QStringList { wide, emoji, "a" }
                                      << QStringList { "/", "Z|0", "a|1", emoji + "|1", wide + "|1" };
    QTest::newRow("hidden entries and links")
            << 0 << QStringList { "t", ".h", ".hd/i", "d/", "lf@t", "ld@d" } << QStringList()
            << QStringList { "/", "d/", "lf|0", "t|0" };
}

void tst_FileManager::scan()
{
    QFETCH(int, scope);
    QFETCH(QStringList, disk);
    QFETCH(QStringList, before);
    QFETCH(QStringList, after);

    const QString root = makeTree();
    makeDisk(root, disk);
    addRows(root, addDirectoryRow(root, scope), before);

    FileManager manager(DbManager::instance(), nullptr); // queues the roots
    QVERIFY(settle(manager));

    QCOMPARE(tree(root), after);
    QVERIFY(SignalRecorder::calls().contains(0));
}

void tst_FileManager::breadthFirst()
{
    const QString root = makeTree();
    makeDisk(root, { "r", "A/a", "B/b", "A/C/c" });
    addDirectoryRow(root, 0);

    FileManager manager(DbManager::instance(), nullptr);
    // Each posted update is one step, one directory: R, A, B, C.
    for (const QString &files : { "r", "a r", "a b r", "a b c r" }) {
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
    makeDisk(root, { "S/f" });
    addDirectoryRow(root, 0);

    FileManager manager(DbManager::instance(), nullptr);
    QCoreApplication::sendPostedEvents(&manager, QEvent::UpdateRequest);
    QVERIFY(QDir(root + "/S").removeRecursively());

    // The failed watch is reported and the scan goes on, finding nothing.
    QTest::ignoreMessage(QtWarningMsg, qPrintable("Failed to add listener -1 \"" + root + "/S\""));
    QVERIFY(settle(manager));
    QCOMPARE(tree(root), (QStringList { "/", "S/" }));
}

void tst_FileManager::knownSubdirectoryIsNotAdopted()
{
    const QString root = makeTree();
    makeDisk(root, { "r", "S/" });
    addDirectoryRow(root, 0);
    addDirectoryRow(root + "/S", 1);

    // S is a root of its own: inserting it as a child fails, and the whole
    // scan of its parent rolls back.
    expectRollback("bool FileManager::scanDirectory()", "Failed to execute m_directoryInsert.", "INSERT INTO directory");
    FileManager manager(DbManager::instance(), nullptr);
    QVERIFY(settle(manager));

    QCOMPARE(tree(root), (QStringList { "/", "S/" }));
    QCOMPARE(rows("SELECT parentId, scope FROM directory WHERE path = ?;", { root + "/S" }), QStringList { "NULL|1" });
}

void tst_FileManager::apply(Operation operation, const QString &root, FileManager &manager)
{
    switch (operation) {
    case Move:
        QVERIFY(QFile::rename(root + "/a", root + "/b"));
        break;
    case MoveOntoKnown:
        QCOMPARE(::rename(qPrintable(root + "/a"), qPrintable(root + "/b")), 0);
        break;
    case CreateDeleteCreate:
        writeFile(root + "/f");
        QVERIFY(QFile::remove(root + "/f"));
        writeFile(root + "/f");
        break;
    case CreateThenDelete:
        writeFile(root + "/f");
        QVERIFY(QFile::remove(root + "/f"));
        break;
    case MoveAwayAndRecreate:
        QVERIFY(QFile::rename(root + "/a", makeTree() + "/a"));
        writeFile(root + "/a");
        break;
    case CreateAndModify:
        writeFile(root + "/f", "content");
        break;
    case ModifyUnknown:
        writeFile(root + "/a", "changed");
        break;
    case ManyFiles:
        for (int i = 0; i < 200; ++i)
            writeFile(root + QString::asprintf("/file-with-a-longer-name-%03d", i));
        QVERIFY(pendingBytes(manager) > 4096);
        break;
    case UnknownWatch: {
        // A watch that the manager didn't make, on its own descriptor.
        const QString other = makeTree();
        QVERIFY(inotify_add_watch(int(manager.socket()), qPrintable(other), IN_CREATE) >= 0);
        writeFile(other + "/foreign");
        writeFile(root + "/mine");
        break;
    }
    case HiddenFile:
        writeFile(root + "/.hidden");
        break;
    case InvalidName: {
        const int fd = ::open((QFile::encodeName(root) + "/bad\xff").constData(), O_CREAT | O_WRONLY, 0644);
        QVERIFY(fd >= 0);
        ::close(fd);
        writeFile(root + "/ok");
        QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^Skipping a file name that is not valid UTF-8 .*bad\\\\xFF"));
        break;
    }
    case CreateDirectory:
        makeDisk(root, { "N/n" });
        break;
    case RemoveDirectory:
        QVERIFY(QDir(root + "/S").removeRecursively());
        break;
    case MoveDirectoryAway:
        QVERIFY(QDir().rename(root + "/S", makeTree() + "/S"));
        break;
    case RemoveRoot:
        QVERIFY(QDir(root).removeRecursively());
        break;
    }
}

void tst_FileManager::events_data()
{
    QTest::addColumn<int>("scope");
    QTest::addColumn<QStringList>("disk");
    QTest::addColumn<Operation>("operation");
    QTest::addColumn<QStringList>("after");
    QTest::addColumn<QStringList>("keptIds");

    // Rows present before are current (1); rows not in keptIds must have new ids.
    const QStringList none, a { "a" }, s { "r", "S/s1", "S/s2" }, top { "/" };
    QTest::newRow("move within the directory") << 0 << a << Move << QStringList { "/", "b|0" } << none;
    QTest::newRow("move onto a known file")
            << 0 << QStringList { "a", "b" } << MoveOntoKnown << QStringList { "/", "b|0" } << QStringList { "b" };
    QTest::newRow("create, delete, create: rolled back") << 0 << none << CreateDeleteCreate << top << none;
    // Batches run by kind, deletes last.
    QTest::newRow("create, delete") << 0 << none << CreateThenDelete << top << none;
    QTest::newRow("move away, create again") << 0 << a << MoveAwayAndRecreate << top << none;
    QTest::newRow("create and modify") << 0 << none << CreateAndModify << QStringList { "/", "f|0" } << none;
    // Scope 1 doesn't index new files, and doesn't hear of them.
    QTest::newRow("modify a file without a row") << 1 << a << ModifyUnknown << top << none;
    QStringList many = top;
    for (int i = 0; i < 200; ++i)
        many << QString::asprintf("file-with-a-longer-name-%03d|0", i);
    QTest::newRow("more than 4096 bytes") << 0 << none << ManyFiles << many << none;
    QTest::newRow("unknown watch") << 0 << none << UnknownWatch << QStringList { "/", "mine|0" } << none;
    QTest::newRow("hidden file") << 0 << none << HiddenFile << QStringList { ".hidden|0", "/" } << none;
    QTest::newRow("name not in UTF-8") << 0 << none << InvalidName << QStringList { "/", "ok|0" } << none;
    QTest::newRow("directory created") << 0 << s << CreateDirectory
                                       << QStringList { "/", "N/", "N/n|0", "S/", "S/s1|1", "S/s2|1", "r|1" } << s;
    QTest::newRow("directory removed") << 0 << s << RemoveDirectory << QStringList { "/", "r|1" } << s;
    QTest::newRow("directory moved away") << 0 << s << MoveDirectoryAway << QStringList { "/", "r|1" } << s;
    QTest::newRow("root removed") << 0 << s << RemoveRoot << QStringList() << s;
}

void tst_FileManager::events()
{
    QFETCH(int, scope);
    QFETCH(QStringList, disk);
    QFETCH(Operation, operation);
    QFETCH(QStringList, after);
    QFETCH(QStringList, keptIds);

    const QString root = makeTree();
    makeDisk(root, disk);
    FileManager manager(DbManager::instance(), nullptr);
    manager.appendDirectory(root, FileManager::DirectoryScope(scope), FileManager::ScanNew);
    QVERIFY(settle(manager));
    rows("UPDATE file SET metadataCurrent = 1;");
    const QStringList idsBefore = rows("SELECT fileName, id FROM file;");
    const qint64 lastId = rows("SELECT MAX(id) FROM file;").value(0).toLongLong();
    SignalRecorder::clear();

    const bool rollsBack = operation == CreateDeleteCreate;
    if (rollsBack)
        expectRollback("bool FileManager::readEvent()", "Failed to execute m_fileInsert.", "INSERT INTO file");
    // Everything happens before the loop runs again: one read.
    apply(operation, root, manager);
    QVERIFY(settle(manager));

    QCOMPARE(tree(root), after);
    for (const QString &row : rows("SELECT fileName, id FROM file;")) {
        if (keptIds.contains(row.section('|', 0, 0)) || keptIds.contains("S/" + row.section('|', 0, 0)))
            QVERIFY(idsBefore.contains(row));
        else
            QVERIFY2(row.section('|', 1).toLongLong() > lastId, qPrintable(row));
    }
    // One read signals once; a new directory adds its scan, a moved one the IN_IGNORED of its watch.
    const int signalCount = rollsBack ? 0 : operation == CreateDirectory || operation == MoveDirectoryAway ? 2 : 1;
    QCOMPARE(SignalRecorder::calls(), QVector<int>(signalCount, 0).toList());
}

void tst_FileManager::appendDirectory()
{
    const QString root = makeTree();
    writeFile(root + "/f");
    FileManager manager(DbManager::instance(), nullptr);
    QVERIFY(settle(manager));

    const qint64 id = manager.appendDirectory(root, FileManager::UserScope, FileManager::ScanNew);
    QVERIFY(id > 0);
    QVERIFY(settle(manager));
    QCOMPARE(rows("SELECT parentId, scope FROM directory;"), QStringList { "NULL|0" });
    QCOMPARE(tree(root), (QStringList { "/", "f|0" }));

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
    FileManager manager(DbManager::instance(), nullptr);
    const qint64 id = manager.appendDirectory(root, FileManager::UserScope, FileManager::ScanNew);
    QVERIFY(settle(manager));
    rows("UPDATE file SET metadataCurrent = 1;");

    QCOMPARE(manager.appendDirectory(root, FileManager::InstallScope, FileManager::NoScan), id);
    QVERIFY(!manager.isUpdateQueued());
    QCOMPARE(rows("SELECT scope FROM directory;"), QStringList { "1" });
    QVERIFY(settle(manager)); // the IN_IGNORED of the removed watch

    // Unwatched now: a change of a known file goes unheard.
    writeFile(root + "/f", "changed");
    QCOMPARE(pendingBytes(manager), 0);
}

void tst_FileManager::appendDirectoryScanAlways_data()
{
    QTest::addColumn<int>("scope");
    QTest::addColumn<QStringList>("after");

    // A live watch means the directory is trusted: the queued scan passes over it.
    QTest::newRow("watched") << int(FileManager::UserScope) << QStringList { "/", "absent|1", "f|0" };
    QTest::newRow("package, never watched") << int(FileManager::PackageScope) << QStringList { "/" };
}

void tst_FileManager::appendDirectoryScanAlways()
{
    QFETCH(int, scope);
    QFETCH(QStringList, after);

    const QString root = makeTree();
    writeFile(root + "/f");
    FileManager manager(DbManager::instance(), nullptr);
    const qint64 id = manager.appendDirectory(root, FileManager::DirectoryScope(scope), FileManager::ScanNew);
    QVERIFY(settle(manager));
    addRows(root, id, { "absent" });

    QCOMPARE(manager.appendDirectory(root, FileManager::DirectoryScope(scope), FileManager::ScanAlways), id);
    QVERIFY(manager.isUpdateQueued());
    QVERIFY(settle(manager));
    QCOMPARE(tree(root), after);
}

void tst_FileManager::insertFile()
{
    const QString root = makeTree();
    makeDisk(root, { "t.txt", "other" });
    FileManager manager(DbManager::instance(), nullptr);
    QVERIFY(settle(manager));

    QCOMPARE(manager.insertFile(root + "/missing"), 0);
    const qint64 id = manager.insertFile(root + "/t.txt");
    QVERIFY(id > 0);
    QCOMPARE(manager.insertFile(root + "/t.txt"), id);
    QCOMPARE(rows("SELECT parentId, scope FROM directory;"), QStringList { "NULL|1" });
    QCOMPARE(rows("SELECT mimeType, permissions FROM file;"), QStringList { "text/plain|3" });

    // Scanned in its scope, the other file stays out; from now on it is watched.
    QVERIFY(settle(manager));
    QCOMPARE(tree(root), (QStringList { "/", "t.txt|0" }));
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
