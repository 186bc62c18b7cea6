#include "dbmanager.h"
#include "filequeryagent.h"
#include "messagelog.h"
#include "photoqueryagent.h"
#include "queryagentdatabase.h"
#include "testdatabase.h"
#include "themeletqueryagent.h"

#include <QCoreApplication>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QProcess>
#include <QScopedPointer>
#include <QSemaphore>
#include <QStandardPaths>
#include <QThread>
#include <QtTest>

#include <functional>
#include <unistd.h>

namespace {

const char *const s_childVariable = "TST_QUERYACTOR_READONLY_CHILD";

// Opened as agentFor opens it, on the sandbox's index.
bool openIndex(QueryAgentDatabase &database)
{
    database.setConnectOptions(QStringLiteral("QSQLITE_OPEN_URI"));
    database.setDatabaseName(QueryAgent::databaseUrl(0).toString());
    return database.open();
}

void runOnThread(const std::function<void()> &body)
{
    QScopedPointer<QThread> thread(QThread::create(body));
    thread->start();
    thread->wait();
}

// Moves the index directory away for the life of the object.
class DirectoryAside
{
public:
    explicit DirectoryAside(const QString &directory)
        : m_directory(directory), m_aside(directory + QLatin1String(".aside"))
    {
        m_moved = QDir().rename(m_directory, m_aside);
    }
    ~DirectoryAside()
    {
        if (!m_moved)
            return;
        QDir(m_directory).removeRecursively();
        QDir().rename(m_aside, m_directory);
    }
    bool moved() const { return m_moved; }

private:
    QString m_directory;
    QString m_aside;
    bool m_moved = false;
};

class Collector : public QueryAgent::Recipient
{
public:
    void contentQueried(const QVector<Content> &content) override
    {
        for (const Content &item : content)
            names << static_cast<FileData *>(item.data())->fileName;
    }
    QStringList names;
};

// Runs as an unprivileged user on a copy of the index that it may read but not
// write beside: lists the files that the thread's file agent sees.
int readOnlyChild()
{
    QueryAgent *agent = QueryAgent::agentFor(ThemeletContent::File);
    if (!agent)
        return 2;
    Collector collector;
    if (!agent->query(&collector, FileQueryAgent::FileParameters()))
        return 3;
    const QString path = QueryAgent::databaseUrl(0).toLocalFile();
    QTextStream(stdout) << collector.names.join(QLatin1Char(',')) << ';'
                        << (QFile::exists(path + QLatin1String("-shm")) ? "shm" : "noshm") << '\n';
    return 0;
}

}

class TestQueryActor : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void databaseUrl_data();
    void databaseUrl();
    void threadIds();
    void statementCache();
    void invalidStatement();
    void rollback();
    void agentForOneThread();
    void agentForTwoThreads();
    void agentForMissingDirectory();
    void agentForMissingFile();
    void agentForReadOnlyFallback();

private:
    QString m_indexPath;
};

void TestQueryActor::initTestCase()
{
    m_indexPath = TestDatabase::indexPath();
    QVERIFY(m_indexPath.startsWith(qEnvironmentVariable("THEMELET_SANDBOX")));
    DbManager manager;
    QVERIFY(manager.isOpen());
}

void TestQueryActor::databaseUrl_data()
{
    QTest::addColumn<int>("flags");
    QTest::addColumn<QString>("suffix");
    QTest::newRow("read-write") << 0 << QString();
    QTest::newRow("read-only") << 1 << QStringLiteral("?mode=ro&immutable=1");
}

void TestQueryActor::databaseUrl()
{
    QFETCH(int, flags);
    QFETCH(QString, suffix);
    const QString expected = QLatin1String("file://") + qEnvironmentVariable("XDG_DATA_HOME")
            + QLatin1String("/system/privileged/Themeletd/themeletd.sqlite") + suffix;
    QCOMPARE(QueryAgent::databaseUrl(flags).toString(), expected);
}

void TestQueryActor::threadIds()
{
    QueryAgentDatabase first;
    QueryAgentDatabase second;
    QCOMPARE(second.threadId(), first.threadId() + 1);
    QVERIFY(!first.isOpen());
}

void TestQueryActor::statementCache()
{
    QueryAgentDatabase database;
    QVERIFY(openIndex(database));
    QueryActor actor(database);

    // Held handles keep every result alive, so result pointers identify statements.
    QVector<QSqlQuery> held;
    for (int i = 0; i < 20; ++i) {
        held << actor.prepareQuery(QStringLiteral("SELECT %1;").arg(i));
        QVERIFY(held.last().isForwardOnly());
    }
    QCOMPARE(actor.prepareQuery(QStringLiteral("SELECT 0;")).result(), held.at(0).result());
    held << actor.prepareQuery(QStringLiteral("SELECT 20;"));

    // "SELECT 1;" was the least recently used: it alone is gone.
    QCOMPARE(actor.prepareQuery(QStringLiteral("SELECT 0;")).result(), held.at(0).result());
    for (int i = 2; i <= 20; ++i)
        QCOMPARE(actor.prepareQuery(QStringLiteral("SELECT %1;").arg(i)).result(), held.at(i).result());
    QSqlQuery again = actor.prepareQuery(QStringLiteral("SELECT 1;"));
    QVERIFY(again.result() != held.at(1).result());
    QCOMPARE(actor.prepareQuery(QStringLiteral("SELECT 1;")).result(), again.result());

    QSqlQuery &evicted = held[1];
    QVERIFY(evicted.exec());
    QVERIFY(evicted.next());
    QCOMPARE(evicted.value(0).toInt(), 1);
}

void TestQueryActor::invalidStatement()
{
    QueryAgentDatabase database;
    QVERIFY(openIndex(database));
    QueryActor actor(database);
    const QString statement = QStringLiteral("SELECT * FROM nosuchtable;");

    // Twice the full report: the failed statement is never cached.
    const QStringList report = {
        QStringLiteral("QSqlQuery QueryActor::prepareQuery(const QString&)"),
        QStringLiteral("Failed to prepare query"),
        QStringLiteral("QSqlError(\"1\", \"Unable to execute statement\", \"no such table: nosuchtable\")"),
        QStringLiteral("\"SELECT * FROM nosuchtable;\"")
    };
    for (int i = 0; i < 2; ++i) {
        MessageLog log;
        QSqlQuery query = actor.prepareQuery(statement);
        QCOMPARE(log.warnings(), report);
        QVERIFY(query.lastQuery().isEmpty());
        QVERIFY(!query.exec());
    }
}

void TestQueryActor::rollback()
{
    QueryAgentDatabase database;
    QVERIFY(openIndex(database));
    QueryActor actor(database);
    QVERIFY(actor.transaction());
    QSqlQuery insert = actor.prepareQuery(QStringLiteral("INSERT INTO directory (path, scope) VALUES ('/r', 0);"));
    QVERIFY(insert.exec());

    MessageLog log;
    actor.rollback(insert, nullptr, "Failed to insert");
    QCOMPARE(log.warnings(), QStringList({ QString(), "Failed to insert", "QSqlError(\"\", \"\", \"\")",
                                           "\"INSERT INTO directory (path, scope) VALUES ('/r', 0);\"" }));
    TestDatabase check;
    QCOMPARE(check.value(QStringLiteral("SELECT count(*) FROM directory")).toInt(), 0);
}

void TestQueryActor::agentForOneThread()
{
    QueryAgent *file = nullptr;
    QueryAgent *fileAgain = nullptr;
    QueryAgent *themelet = nullptr;
    QueryAgent *photo = nullptr;
    QueryAgent *video = nullptr;
    QueryAgent *download = nullptr;
    bool rightTypes = false;
    runOnThread([&]() {
        video = QueryAgent::agentFor(ThemeletContent::Video);
        file = QueryAgent::agentFor(ThemeletContent::File);
        themelet = QueryAgent::agentFor(ThemeletContent::Themelet);
        photo = QueryAgent::agentFor(ThemeletContent::Photo);
        download = QueryAgent::agentFor(ThemeletContent::Download);
        fileAgain = QueryAgent::agentFor(ThemeletContent::File);
        rightTypes = dynamic_cast<FileQueryAgent *>(file) && dynamic_cast<ThemeletQueryAgent *>(themelet)
                && dynamic_cast<PhotoQueryAgent *>(photo) && file->threadId() == photo->threadId();
    });
    QVERIFY(file);
    QCOMPARE(fileAgain, file);
    QVERIFY(rightTypes);
    QVERIFY(!video);
    QVERIFY(!download);
}

void TestQueryActor::agentForTwoThreads()
{
    // Both threads stay alive until both have answered, so the pointers can't be reused.
    QSemaphore ready;
    QSemaphore done;
    QueryAgent *agents[2] = { nullptr, nullptr };
    QString threadIds[2];
    auto body = [&](int i) {
        agents[i] = QueryAgent::agentFor(ThemeletContent::Themelet);
        if (agents[i])
            threadIds[i] = agents[i]->threadId();
        ready.release();
        done.acquire();
    };
    QScopedPointer<QThread> first(QThread::create(body, 0));
    QScopedPointer<QThread> second(QThread::create(body, 1));
    first->start();
    second->start();
    ready.acquire(2);
    done.release(2);
    first->wait();
    second->wait();

    QVERIFY(agents[0]);
    QVERIFY(agents[1]);
    QVERIFY(agents[0] != agents[1]);
    QVERIFY(!threadIds[0].isEmpty());
    QVERIFY(threadIds[0] != threadIds[1]);
}

void TestQueryActor::agentForMissingDirectory()
{
    DirectoryAside aside(QFileInfo(m_indexPath).absolutePath());
    QVERIFY(aside.moved());

    QVector<QueryAgent *> agents;
    // Each call tries to open again and fails the same way.
    for (int i = 0; i < 2; ++i) {
        QTest::ignoreMessage(QtWarningMsg, "Database not opened");
        QTest::ignoreMessage(QtWarningMsg,
                             "QSqlError(\"14\", \"Error opening database\", \"unable to open database file\")");
    }
    runOnThread([&]() {
        agents << QueryAgent::agentFor(ThemeletContent::File);
        agents << QueryAgent::agentFor(ThemeletContent::File);
    });
    QCOMPARE(agents, QVector<QueryAgent *>({ nullptr, nullptr }));
}

void TestQueryActor::agentForMissingFile()
{
    // SQLite creates an empty file: the agent exists, its queries fail.
    const QString directory = QFileInfo(m_indexPath).absolutePath();
    DirectoryAside aside(directory);
    QVERIFY(aside.moved());
    QVERIFY(QDir().mkpath(directory));

    bool agentMade = false;
    bool queried = true;
    const char *const report[] = {
        "QSqlQuery QueryActor::prepareQuery(const QString&)",
        "Failed to prepare query",
        "QSqlError(\"1\", \"Unable to execute statement\", \"no such table: file\")",
        "\"SELECT file.id, directory.path || '/' || file.fileName, file.mimeType, file.fileName, "
        "file.displayName, file.category, file.permissions FROM file INNER JOIN directory on "
        "file.directoryId = directory.id  ORDER BY  file.displayName ASC;\"",
        "virtual bool FileQueryAgent::query(QueryAgent::Recipient*, const QueryAgent::Parameters&)",
        "Failed to execute file query",
        "QSqlError(\"\", \"Driver not loaded\", \"Driver not loaded\")",
        "\"\""
    };
    for (const char *record : report)
        QTest::ignoreMessage(QtWarningMsg, record);
    runOnThread([&]() {
        QueryAgent *agent = QueryAgent::agentFor(ThemeletContent::File);
        agentMade = agent;
        Collector collector;
        if (agent)
            queried = agent->query(&collector, FileQueryAgent::FileParameters());
    });
    QVERIFY(agentMade);
    QVERIFY(QFile::exists(m_indexPath));
    QVERIFY(!queried);
}

void TestQueryActor::agentForReadOnlyFallback()
{
    if (geteuid() != 0)
        QSKIP("needs root to switch to an unprivileged user");
    if (QStandardPaths::findExecutable(QStringLiteral("setpriv")).isEmpty())
        QSKIP("setpriv is missing");

    // A copy of the index taken while a writer holds rows in the write-ahead log.
    const QString dataHome = qEnvironmentVariable("THEMELET_SANDBOX") + QLatin1String("/rodata");
    const QString target = dataHome + QLatin1String("/system/privileged/Themeletd/themeletd.sqlite");
    const QString staging = qEnvironmentVariable("THEMELET_SANDBOX") + QLatin1String("/staging.sqlite");
    QVERIFY(QDir().mkpath(QFileInfo(target).absolutePath()));
    QVERIFY(QFile::copy(m_indexPath, staging));
    {
        TestDatabase setup(staging);
        QVERIFY(setup.exec({ QStringLiteral("INSERT INTO directory (id, path, scope) VALUES (1, '/d', 0)"),
                             QStringLiteral("INSERT INTO file (directoryId, fileName, displayName, permissions) "
                                            "VALUES (1, 'main.ogg', 'a', 3)") }));
    }
    TestDatabase writer(staging);
    QVERIFY(writer.exec(QStringLiteral("INSERT INTO file (directoryId, fileName, displayName, permissions) "
                                       "VALUES (1, 'wal.ogg', 'b', 3)")));
    QVERIFY(QFileInfo(staging + QLatin1String("-wal")).size() > 0);
    QVERIFY(QFile::copy(staging, target));
    QVERIFY(QFile::copy(staging + QLatin1String("-wal"), target + QLatin1String("-wal")));
    for (const QString &path : { target, target + QLatin1String("-wal") })
        QVERIFY(QFile::setPermissions(path, QFile::ReadOwner | QFile::WriteOwner | QFile::ReadGroup
                                                    | QFile::ReadOther));

    QProcess child;
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    environment.insert(QString::fromLatin1(s_childVariable), QStringLiteral("1"));
    environment.insert(QStringLiteral("XDG_DATA_HOME"), dataHome);
    child.setProcessEnvironment(environment);
    child.start(QStringLiteral("setpriv"),
                { QStringLiteral("--reuid=nobody"), QStringLiteral("--regid=nogroup"),
                  QStringLiteral("--clear-groups"), QStringLiteral("--"),
                  QCoreApplication::applicationFilePath() });
    QVERIFY(child.waitForFinished(30000));
    const QByteArray errors = child.readAllStandardError();
    QVERIFY2(child.exitCode() == 0, errors.constData());
    QCOMPARE(child.readAllStandardOutput(), QByteArray("main.ogg;noshm\n"));
}

int main(int argc, char *argv[])
{
    QCoreApplication app(argc, argv);
    if (qEnvironmentVariableIsSet(s_childVariable))
        return readOnlyChild();
    TestQueryActor test;
    return QTest::qExec(&test, argc, argv);
}

#include "tst_queryactor.moc"
