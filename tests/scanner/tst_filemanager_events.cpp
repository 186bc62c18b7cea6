#include "dbmanager.h"
#include "filemanager.h"
#include "filemanagerfixture.h"
#include "signalrecorder.h"

#include <QDir>
#include <QFile>
#include <QRegularExpression>
#include <QtTest>

#include <fcntl.h>
#include <sys/inotify.h>
#include <unistd.h>

using namespace FileManagerFixture;

// inotify events on watched directories. Every operation of a case happens
// before the event loop runs again, so its events arrive in one read.
class tst_FileManagerEvents : public QObject
{
    Q_OBJECT

public:
    enum Operation {
        Move,
        MoveOntoKnown,
        CreateDeleteCreate,
        CreateThenDelete,
        MoveAwayAndRecreate,
        CreateAndModify,
        ModifyUnknown,
        ManyFiles,
        UnknownWatch,
        HiddenFile,
        InvalidName,
        CreateDirectory,
        RemoveDirectory,
        MoveDirectoryAway,
        RemoveRoot
    };
    Q_ENUM(Operation)

private slots:
    void init();

    void files_data();
    void files();
    void directories_data();
    void directories();

private:
    void apply(Operation operation, const QString &root, FileManager &manager);
};

void tst_FileManagerEvents::init()
{
    resetIndex();
    SignalRecorder::clear();
}

void tst_FileManagerEvents::apply(Operation operation, const QString &root, FileManager &manager)
{
    switch (operation) {
    case Move:
        QVERIFY(QFile::rename(root + "/a", root + "/b"));
        break;
    case MoveOntoKnown:
        QVERIFY(::rename(QFile::encodeName(root + "/a").constData(),
                         QFile::encodeName(root + "/b").constData()) == 0);
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
        // More than the stack buffer holds, in one read.
        QVERIFY(pendingBytes(manager) > 4096);
        break;
    case UnknownWatch: {
        // A watch that the manager didn't make, on its own descriptor.
        const QString other = makeTree();
        QVERIFY(inotify_add_watch(int(manager.socket()), QFile::encodeName(other).constData(), IN_CREATE) >= 0);
        writeFile(other + "/foreign");
        writeFile(root + "/mine");
        break;
    }
    case HiddenFile:
        writeFile(root + "/.hidden");
        break;
    case InvalidName: {
        const QByteArray bad = QFile::encodeName(root) + "/bad\xff";
        const int fd = ::open(bad.constData(), O_CREAT | O_WRONLY, 0644);
        QVERIFY(fd >= 0);
        ::close(fd);
        writeFile(root + "/ok");
        QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^Skipping a file name that is not valid UTF-8 .*bad\\\\xFF"));
        break;
    }
    case CreateDirectory:
        QVERIFY(QDir(root).mkpath("N"));
        writeFile(root + "/N/n");
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

void tst_FileManagerEvents::files_data()
{
    QTest::addColumn<int>("scope");
    QTest::addColumn<QStringList>("initial");
    QTest::addColumn<Operation>("operation");
    QTest::addColumn<QStringList>("after");
    QTest::addColumn<QStringList>("keptIds");

    const QStringList none;
    // Rows are "name|metadataCurrent"; rows present before are current, and
    // rows not in keptIds must have ids that are new.
    QTest::newRow("move within the directory")
            << 0 << QStringList { "a" } << Move << QStringList { "b|0" } << none;
    QTest::newRow("move onto a known file")
            << 0 << QStringList { "a", "b" } << MoveOntoKnown << QStringList { "b|0" } << QStringList { "b" };
    QTest::newRow("create, delete, create") << 0 << none << CreateDeleteCreate << none << none;
    // Batches run by kind, deletes last.
    QTest::newRow("create, delete") << 0 << none << CreateThenDelete << none << none;
    QTest::newRow("move away, create again") << 0 << QStringList { "a" } << MoveAwayAndRecreate << none << none;
    QTest::newRow("create and modify") << 0 << none << CreateAndModify << QStringList { "f|0" } << none;
    // Scope 1 doesn't index new files, and doesn't hear of them.
    QTest::newRow("modify a file without a row")
            << 1 << QStringList { "a" } << ModifyUnknown << none << none;
    QStringList many;
    for (int i = 0; i < 200; ++i)
        many << QString::asprintf("file-with-a-longer-name-%03d|0", i);
    QTest::newRow("more than 4096 bytes") << 0 << none << ManyFiles << many << none;
    QTest::newRow("unknown watch") << 0 << none << UnknownWatch << QStringList { "mine|0" } << none;
    QTest::newRow("hidden file") << 0 << none << HiddenFile << QStringList { ".hidden|0" } << none;
    QTest::newRow("name not in UTF-8") << 0 << none << InvalidName << QStringList { "ok|0" } << none;
}

void tst_FileManagerEvents::files()
{
    QFETCH(int, scope);
    QFETCH(QStringList, initial);
    QFETCH(Operation, operation);
    QFETCH(QStringList, after);
    QFETCH(QStringList, keptIds);

    const QString root = makeTree();
    for (const QString &name : initial)
        writeFile(root + '/' + name);
    FileManager manager(DbManager::instance(), nullptr);
    manager.appendDirectory(root, FileManager::DirectoryScope(scope), FileManager::ScanNew);
    QVERIFY(settle(manager));
    rows("UPDATE file SET metadataCurrent = 1;");
    const QStringList idsBefore = rows("SELECT fileName, id FROM file ORDER BY fileName;");
    const qint64 lastId = rows("SELECT MAX(id) FROM file;").value(0).toLongLong();
    SignalRecorder::clear();

    const bool rollsBack = operation == CreateDeleteCreate;
    if (rollsBack) {
        QTest::ignoreMessage(QtWarningMsg, "bool FileManager::readEvent()");
        QTest::ignoreMessage(QtWarningMsg, "Failed to execute m_fileInsert.");
        QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^QSqlError\\(.*UNIQUE"));
        QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^\"INSERT INTO file"));
    }
    apply(operation, root, manager);
    QVERIFY(settle(manager));

    QCOMPARE(fileRows(root), after);
    for (const QString &row : rows("SELECT fileName, id FROM file ORDER BY fileName;")) {
        const QString name = row.section('|', 0, 0);
        if (keptIds.contains(name))
            QVERIFY(idsBefore.contains(row));
        else
            QVERIFY2(row.section('|', 1).toLongLong() > lastId, qPrintable(row));
    }
    QCOMPARE(SignalRecorder::calls(), rollsBack ? QList<int>() : QList<int> { 0 });
}

void tst_FileManagerEvents::directories_data()
{
    QTest::addColumn<Operation>("operation");
    QTest::addColumn<QStringList>("directories");
    QTest::addColumn<QStringList>("files");

    // The tree before: root/r, root/S/s1, root/S/s2. Paths are relative to root.
    QTest::newRow("created") << CreateDirectory << QStringList { "|NULL", "/N|root", "/S|root" }
                             << QStringList { "/N/n", "/S/s1", "/S/s2", "/r" };
    QTest::newRow("removed") << RemoveDirectory << QStringList { "|NULL" } << QStringList { "/r" };
    QTest::newRow("moved away") << MoveDirectoryAway << QStringList { "|NULL" } << QStringList { "/r" };
    QTest::newRow("root removed") << RemoveRoot << QStringList() << QStringList();
}

void tst_FileManagerEvents::directories()
{
    QFETCH(Operation, operation);
    QFETCH(QStringList, directories);
    QFETCH(QStringList, files);

    const QString root = makeTree();
    QDir(root).mkpath("S");
    writeFile(root + "/r");
    writeFile(root + "/S/s1");
    writeFile(root + "/S/s2");
    FileManager manager(DbManager::instance(), nullptr);
    const qint64 rootId = manager.appendDirectory(root, FileManager::UserScope, FileManager::ScanNew);
    QVERIFY(settle(manager));

    apply(operation, root, manager);
    QVERIFY(settle(manager));

    QStringList directoryRows = rows("SELECT path, parentId FROM directory ORDER BY path;");
    directoryRows.replaceInStrings(root, QString()).replaceInStrings(QString::number(rootId), "root");
    QCOMPARE(directoryRows, directories);
    QStringList fileRows = rows("SELECT directory.path || '/' || file.fileName FROM file INNER JOIN directory ON directory.id = file.directoryId ORDER BY 1;");
    QCOMPARE(fileRows.replaceInStrings(root, QString()), files);
}

QTEST_GUILESS_MAIN(tst_FileManagerEvents)
#include "tst_filemanager_events.moc"
