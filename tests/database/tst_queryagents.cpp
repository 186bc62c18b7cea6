#include "dbmanager.h"
#include "filequeryagent.h"
#include "messagelog.h"
#include "testdatabase.h"
#include "themeletqueryagent.h"

#include <QtTest>

#include <memory>
#include <unistd.h>

namespace {

const char *const s_childVariable = "TST_QUERYAGENTS_READONLY_CHILD";

// Keeps the batches; names() gives role 5, the display name in every role table.
class Batches : public QueryAgent::Recipient
{
public:
    void contentQueried(const QVector<Content> &content) override
    {
        sizes << content.size();
        all << content;
    }
    QString names() const
    {
        QStringList names;
        for (const Content &item : all)
            names << item.data()->data(5).toString();
        return names.join(' ');
    }
    QVariantMap resources(int i) const { return all.at(i).data()->data(ThemeletData::ResourcesRole).toMap(); }

    QList<int> sizes;
    QVector<Content> all;
};

QString roles(const Content &content, int count)
{
    QStringList values;
    for (int role = 0; role < count; ++role)
        values << content.data()->data(role).toString();
    return values.join('|');
}

QVariantMap resource(const QString &path)
{
    const QFileInfo file(path);
    return { { "url", QUrl::fromLocalFile(path) }, { "fileName", file.fileName() }, { "displayName", file.completeBaseName() } };
}

// Run as an unprivileged user on an index that it may read but not write
// beside: what the file agent of its thread sees, and whether "-shm" appeared.
int readOnlyChild()
{
    QueryAgent *agent = QueryAgent::agentFor(ThemeletContent::File);
    Batches batches;
    if (!agent || !agent->query(&batches, FileQueryAgent::FileParameters()))
        return 2;
    const bool shm = QFile::exists(QueryAgent::databaseUrl(0).toLocalFile() + QLatin1String("-shm"));
    QTextStream(stdout) << batches.names() << (shm ? ";shm" : ";noshm") << '\n';
    return 0;
}

}

class tst_QueryAgents : public QObject
{
    Q_OBJECT

    std::unique_ptr<TestDatabase> m_db;
    std::unique_ptr<QueryAgentDatabase> m_database;

    // A file whose display name is its name without the extension.
    qint64 addFile(const QString &path, const QString &mimeType = "audio/ogg", const QString &category = QString())
    {
        const QFileInfo file(path);
        m_db->exec({ QStringLiteral("INSERT OR IGNORE INTO directory (path, scope) VALUES ('%1', 0)").arg(file.path()),
                     QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, displayName, permissions, category) "
                                    "SELECT id, '%2', '%3', '%4', 3, %5 FROM directory WHERE path = '%1'")
                             .arg(file.path(), mimeType, file.fileName(), file.completeBaseName(),
                                  category.isNull() ? QStringLiteral("NULL") : "'" + category + "'") });
        return m_db->value("SELECT max(id) FROM file").toLongLong();
    }

    qint64 addThemelet(const QString &name, bool favorite, int timestamp)
    {
        const qint64 id = addFile("/t/" + name + ".themelet", "application/x-vorka-themelet");
        m_db->exec(QStringLiteral("INSERT INTO themelet (fileId, favorite, timestamp) VALUES (%1, %2, '%3')")
                           .arg(id).arg(favorite ? 1 : 0).arg(timestamp, 3, 10, QLatin1Char('0')));
        return id;
    }

    void addResource(qint64 themelet, const char *type, qint64 target)
    {
        m_db->exec(QStringLiteral("INSERT INTO resource VALUES (%1, '%2', %3)").arg(themelet).arg(type).arg(target));
    }

private slots:
    void initTestCase()
    {
        QCOMPARE(QueryAgent::databaseUrl(1).toString(), "file://" + qEnvironmentVariable("XDG_DATA_HOME")
                 + "/system/privileged/Themeletd/themeletd.sqlite?mode=ro&immutable=1");
        MessageLog log(QStringList { "debug: DbManager::DbManager() Themelet DB Fine..." });
        QVERIFY(DbManager().isOpen());
        m_db.reset(new TestDatabase);
    }

    void init()
    {
        m_db->exec("DELETE FROM directory"); // the triggers take every other row along
        m_database.reset(new QueryAgentDatabase);
        m_database->setConnectOptions(QStringLiteral("QSQLITE_OPEN_URI"));
        m_database->setDatabaseName(QueryAgent::databaseUrl(0).toString());
        QVERIFY(m_database->open());
    }

    void statementCache()
    {
        QueryActor actor(*m_database);
        auto prepare = [&actor](int i) { return actor.prepareQuery(QStringLiteral("SELECT %1;").arg(i)); };
        // Held handles keep every result alive, so result pointers tell statements apart.
        QVector<QSqlQuery> held;
        for (int i = 0; i < 20; ++i)
            held << prepare(i);
        QVERIFY(held.first().isForwardOnly());
        QCOMPARE(prepare(0).result(), held.at(0).result()); // a use: "SELECT 1;" is now the least recent
        held << prepare(20);
        for (int i : { 2, 3, 19, 20, 0 })
            QCOMPARE(prepare(i).result(), held.at(i).result());
        const QSqlQuery again = prepare(1);
        QVERIFY(again.result() != held.at(1).result());
        QCOMPARE(prepare(1).result(), again.result());
        QVERIFY(held[1].exec() && held[1].next() && held[1].value(0).toInt() == 1); // the evicted one still works
    }

    void invalidStatement()
    {
        QueryActor actor(*m_database);
        const QStringList report = MessageLog::warningRecords(
                { "QSqlQuery QueryActor::prepareQuery(const QString&)", "Failed to prepare query",
                  TestDatabase::errorText("1", "no such table: nosuchtable"), "\"SELECT * FROM nosuchtable;\"" });
        for (int i = 0; i < 2; ++i) { // twice the full report: the statement is never cached
            MessageLog log(report);
            QSqlQuery query = actor.prepareQuery(QStringLiteral("SELECT * FROM nosuchtable;"));
            QCOMPARE(log.records(), report);
            QVERIFY(query.lastQuery().isEmpty() && !query.exec());
        }
    }

    void agentFor()
    {
        // On each of two threads, per call: the connection's number and the size
        // of the agent's role table; then whether a second call gives the same agent.
        QStringList seen[2];
        for (QStringList &calls : seen) {
            std::unique_ptr<QThread> thread(QThread::create([&calls] {
                for (int type : { 0, 1, 2, 3, 4 }) {
                    QueryAgent *agent = QueryAgent::agentFor(ThemeletContent::Type(type));
                    calls << (agent ? agent->threadId() + ':' + QString::number(agent->roleNames().size()) : "-");
                }
                calls << QString::number(QueryAgent::agentFor(ThemeletContent::File) == QueryAgent::agentFor(ThemeletContent::File));
            }));
            thread->start();
            thread->wait();
            QCOMPARE(calls.join(' '), QStringLiteral("%1:8 %1:24 %1:12 - - 1").arg(calls.first().section(':', 0, 0)));
        }
        QVERIFY(seen[0].first() != seen[1].first());
    }

    void agentForMissingDirectory()
    {
        const QString directory = QFileInfo(TestDatabase::indexPath()).absolutePath();
        QVERIFY(QDir().rename(directory, directory + ".aside"));
        // Each call tries to open again and fails the same way.
        const QStringList report = MessageLog::warningRecords(
                { "Database not opened", TestDatabase::errorText("14", "unable to open database file", "Error opening database") });
        MessageLog log(report + report);
        QVector<QueryAgent *> agents;
        std::unique_ptr<QThread> thread(QThread::create([&agents] {
            agents << QueryAgent::agentFor(ThemeletContent::File) << QueryAgent::agentFor(ThemeletContent::File);
        }));
        thread->start();
        thread->wait();
        QVERIFY(QDir().rename(directory + ".aside", directory));
        QCOMPARE(log.records(), report + report);
        QCOMPARE(agents, QVector<QueryAgent *>(2, nullptr));
    }

    void agentForReadOnlyFallback()
    {
        if (geteuid() != 0)
            QSKIP("needs root to switch to an unprivileged user");
        // A copy of the index made while a writer held a row in the write-ahead
        // log, in a directory that the user can't write.
        const QString sandbox = qEnvironmentVariable("THEMELET_SANDBOX");
        const QString staging = sandbox + "/staging.sqlite";
        const QString target = sandbox + "/rodata/system/privileged/Themeletd/themeletd.sqlite";
        addFile("/d/main.ogg");
        QVERIFY(m_db->exec(QStringLiteral("VACUUM INTO '%1'").arg(staging)));
        TestDatabase writer(staging);
        QVERIFY(writer.exec({ "PRAGMA journal_mode = WAL", "UPDATE file SET id = 2, displayName = 'wal'" }));
        QVERIFY(QFileInfo(staging + "-wal").size() > 0 && QDir().mkpath(QFileInfo(target).absolutePath()));
        for (const char *suffix : { "", "-wal" })
            QVERIFY(QFile::copy(staging + suffix, target + suffix) && QFile::setPermissions(target + suffix, QFileDevice::Permissions(0x6444)));
        QProcess child;
        QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
        environment.insert(s_childVariable, "1");
        environment.insert("XDG_DATA_HOME", sandbox + "/rodata");
        child.setProcessEnvironment(environment);
        child.start("setpriv", { "--reuid=nobody", "--regid=nogroup", "--clear-groups", "--", QCoreApplication::applicationFilePath() });
        QVERIFY(child.waitForFinished(30000));
        QVERIFY2(child.exitCode() == 0, child.readAllStandardError().constData());
        QCOMPARE(child.readAllStandardOutput(), QByteArray("main;noshm\n"));
    }

    void fileList_data()
    {
        QTest::addColumn<QString>("mimeType");
        QTest::addColumn<QStringList>("directories");
        QTest::addColumn<QStringList>("categories");
        QTest::addColumn<QString>("tail"); // of the statement
        QTest::addColumn<QString>("names");
        const QString byName = " ORDER BY  file.displayName ASC;";
        const QStringList none;
        QTest::newRow("default") << QString() << none << none << byName << "a b c d e";
        QTest::newRow("exact mime") << "audio/ogg" << none << none << "WHERE file.mimeType = ?" + byName << "a d";
        QTest::newRow("mime glob") << "audio/*" << none << none << "WHERE file.mimeType GLOB ?" + byName << "a b d e";
        // "/d" takes in neither /d itself nor /dx.
        QTest::newRow("two directories") << "audio/*" << QStringList { "/d", "/e" } << none
                << "WHERE file.mimeType GLOB ?\n     AND (directory.path GLOB ?\n         OR directory.path GLOB ?)" + byName << "b e";
        QTest::newRow("categories") << QString() << none << QStringList { "Ringtone", "Customer", "Default" }
                << " ORDER BY \n   CASE file.category\n     WHEN 'Ringtone' THEN 0\n     WHEN 'Customer' THEN 1"
                   "\n     WHEN 'Default' THEN 2\n     ELSE 3\n   END, file.displayName ASC;" << "b d a c e";
    }

    void fileList()
    {
        QFETCH(QString, mimeType);
        QFETCH(QStringList, directories);
        QFETCH(QStringList, categories);
        QFETCH(QString, tail);
        QFETCH(QString, names);
        addFile("/d/a.ogg", "audio/ogg", "Default");
        addFile("/d/sub/b.mp3", "audio/mpeg", "Ringtone");
        addFile("/d/sub/deep/c.jpg", "image/jpeg");
        addFile("/dx/d.ogg", "audio/ogg", "Customer");
        addFile("/e/sub/e.ogg", "audio/x-vorbis+ogg", "Other");
        FileQueryAgent::FileParameters parameters;
        parameters.mimeType = mimeType;
        parameters.directories = directories;
        parameters.categories = categories;
        QVariantList bound;
        QCOMPARE(FileQueryAgent::listStatement(parameters, &bound),
                 "SELECT file.id, directory.path || '/' || file.fileName, file.mimeType, file.fileName, file.displayName, "
                 "file.category, file.permissions FROM file INNER JOIN directory on file.directoryId = directory.id " + tail);
        Batches batches;
        QVERIFY(FileQueryAgent(*m_database).query(&batches, parameters));
        QCOMPARE(batches.names(), names);
    }

    void fileLookups()
    {
        addFile("/d/other.ogg");
        const qint64 id = addFile("/d/sub dir/tone #1.ogg", "audio/ogg", "Ringtone");
        m_db->exec({ QStringLiteral("UPDATE file SET permissions = 1 WHERE id = %1").arg(id),
                     QStringLiteral("INSERT INTO download VALUES (%1, 'http://example.com/t.ogg')").arg(id) });
        FileQueryAgent agent(*m_database);
        const QUrl url = QUrl::fromLocalFile("/d/sub dir/tone #1.ogg");
        for (const Content &found : { agent.queryById(id), agent.queryByUrl(url), agent.queryByUrl(QUrl("http://example.com/t.ogg")) })
            QCOMPARE(roles(found, 8), QStringLiteral("%1|%2|audio/ogg|tone #1.ogg|/d/sub dir/tone #1.ogg|tone #1|true|Ringtone")
                                              .arg(id).arg(url.toString()));
        QVERIFY(!agent.queryByUrl(QUrl("http://example.com/other.ogg")).isValid());
        QVERIFY(!agent.queryByUrl(QUrl::fromLocalFile("/d/missing.ogg")).isValid());
    }

    void themeletFilters_data()
    {
        QTest::addColumn<int>("filter");
        QTest::addColumn<QString>("names");
        QTest::newRow("all") << 0 << "T4 T2 T3 T1"; // favourites first, then by time
        QTest::newRow("favourites") << 1 << "T4 T2";
        QTest::newRow("others") << 2 << "T3 T1";
    }

    void themeletFilters()
    {
        QFETCH(int, filter);
        QFETCH(QString, names);
        addThemelet("T1", false, 2);
        addThemelet("T2", true, 3);
        addThemelet("T3", false, 1);
        addThemelet("T4", true, 0);
        ThemeletQueryAgent agent(*m_database);
        ThemeletQueryAgent::ThemeletParameters parameters;
        parameters.filter = filter;
        for (int run = 0; run < 2; ++run) { // the temporary table of the first run is gone
            Batches batches;
            QVERIFY(agent.query(&batches, parameters));
            QCOMPARE(batches.sizes, QList<int> { names.count(' ') + 1 });
            QCOMPARE(batches.names(), names);
        }
    }

    void batches_data()
    {
        QTest::addColumn<int>("rows");
        QTest::addColumn<QList<int>>("sizes");
        QTest::newRow("0") << 0 << QList<int> { 0 };
        QTest::newRow("49") << 49 << QList<int> { 49 };
        QTest::newRow("50") << 50 << QList<int> { 50, 0 };
        QTest::newRow("51") << 51 << QList<int> { 50, 1 };
        QTest::newRow("100") << 100 << QList<int> { 50, 50, 0 };
    }

    void batches()
    {
        // Resources on the 50th and 51st: the first batch ends with the 50th's,
        // the second starts with the cursor on the 51st's. A resource whose file
        // is gone doesn't stop the merge.
        QFETCH(int, rows);
        QFETCH(QList<int>, sizes);
        QStringList names;
        QVector<qint64> ids { 0 };
        m_db->exec("BEGIN");
        for (int i = 1; i <= rows; ++i)
            ids << addThemelet((names << QStringLiteral("T%1").arg(i)).last(), false, i);
        if (rows >= 50)
            addResource(ids[50], "ringerTone", addFile("/r/50.ogg"));
        if (rows >= 51) {
            addResource(ids[51], "ringerTone", 9999);
            addResource(ids[51], "messageTone", addFile("/r/51.ogg"));
            addResource(ids[51], "homeWallpaper", addFile("/r/51.jpg", "image/jpeg"));
        }
        m_db->exec("COMMIT");
        Batches batches;
        QVERIFY(ThemeletQueryAgent(*m_database).query(&batches, ThemeletQueryAgent::ThemeletParameters()));
        QCOMPARE(batches.sizes, sizes);
        QCOMPARE(batches.names(), names.join(' '));
        const QVariantMap at50 { { "ringerTone", resource("/r/50.ogg") } };
        const QVariantMap at51 { { "messageTone", resource("/r/51.ogg") }, { "homeWallpaper", resource("/r/51.jpg") } };
        for (int i = 0; i < rows; ++i)
            QCOMPARE(batches.resources(i), i == 49 ? at50 : i == 50 ? at51 : QVariantMap());
    }

    void themeletLookups()
    {
        addThemelet("Other", false, 0);
        const qint64 id = addThemelet("Sea", true, 1);
        m_db->exec({ QStringLiteral("UPDATE themelet SET homeWallpaper = '/h.jpg', applicationWallpaper = '/a.jpg', "
                                    "highlightColor = '#112233', secondaryHighlightColor = '#80445566', primaryColor = '#778899', "
                                    "secondaryColor = '#aabbcc', ringerVolume = NULL, enabledSounds = 5, version = 3 WHERE fileId = %1").arg(id),
                     QStringLiteral("INSERT INTO zefId VALUES (%1, 'zef')").arg(id),
                     QStringLiteral("INSERT INTO download VALUES (%1, 'http://example.com/sea.themelet')").arg(id) });
        addResource(id, "ringerTone", addFile("/r/sea.ogg"));
        ThemeletQueryAgent agent(*m_database);
        const QUrl url = QUrl::fromLocalFile("/t/Sea.themelet");
        for (const Content &found : { agent.queryById(id), agent.queryByUrl(url), agent.queryByUrl(QUrl("http://example.com/sea.themelet")) }) {
            QCOMPARE(roles(found, 24), QStringLiteral("%1|%2|application/x-vorka-themelet|Sea.themelet|/t/Sea.themelet|Sea|true|"
                                                      "file:///h.jpg|file:///a.jpg|#778899|#aabbcc|#112233|#80445566|0|"
                                                      "true|false|true|false|false|false|false||zef|3").arg(id).arg(url.toString()));
            QCOMPARE(found.data()->data(ThemeletData::ResourcesRole).toMap(), QVariantMap({ { "ringerTone", resource("/r/sea.ogg") } }));
        }
        QVERIFY(!agent.queryByUrl(QUrl("http://example.com/none.themelet")).isValid());
    }
};

int main(int argc, char *argv[])
{
    QCoreApplication app(argc, argv);
    if (qEnvironmentVariableIsSet(s_childVariable))
        return readOnlyChild();
    tst_QueryAgents test;
    return QTest::qExec(&test, argc, argv);
}

#include "tst_queryagents.moc"
