#include "dbmanager.h"
#include "filequeryagent.h"
#include "messagelog.h"
#include "photoqueryagent.h"
#include "queryagentdatabase.h"
#include "testdatabase.h"
#include "themeletqueryagent.h"

#include <QScopedPointer>
#include <QSemaphore>
#include <QThread>
#include <QtTest>

namespace {

class Batches : public QueryAgent::Recipient
{
public:
    void contentQueried(const QVector<Content> &content) override
    {
        sizes << content.size();
        all << content;
    }

    QStringList fileNames() const
    {
        QStringList names;
        for (const Content &item : all)
            names << static_cast<const FileData *>(item.data())->fileName;
        return names;
    }

    const ThemeletData *themelet(int i) const { return static_cast<const ThemeletData *>(all.at(i).data()); }

    QList<int> sizes;
    QVector<Content> all;
};

QString quoted(const QString &text)
{
    return text.isNull() ? QStringLiteral("NULL") : QLatin1Char('\'') + text + QLatin1Char('\'');
}

QVariantMap resource(const QString &path, const QString &displayName)
{
    return { { QStringLiteral("url"), QUrl::fromLocalFile(path) },
             { QStringLiteral("fileName"), path.mid(path.lastIndexOf(QLatin1Char('/')) + 1) },
             { QStringLiteral("displayName"), displayName } };
}

const QString s_fileSelect = QStringLiteral(
        "SELECT file.id, directory.path || '/' || file.fileName, file.mimeType, file.fileName, "
        "file.displayName, file.category, file.permissions FROM file INNER JOIN directory on "
        "file.directoryId = directory.id ");

const QString s_photoSelect = QStringLiteral(
        "SELECT file.id, directory.path || '/' || file.fileName, file.mimeType, file.fileName, "
        "file.displayName, file.permissions, image.dateTaken, image.width, image.height, image.orientation "
        "FROM file INNER JOIN directory on file.directoryId = directory.id ");

}

class TestQueryAgents : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void cleanup();
    void cleanupTestCase();

    void fileBatches_data();
    void fileBatches();
    void fileStatement_data();
    void fileStatement();
    void fileFilters_data();
    void fileFilters();
    void fileCategories_data();
    void fileCategories();
    void fileLookups();

    void photoList();
    void photoLookups_data();
    void photoLookups();

    void themeletFilters_data();
    void themeletFilters();
    void themeletBatches();
    void themeletResources();
    void themeletWithoutFile();
    void themeletTableLeftOver();
    void themeletLookups();
    void themeletsOnTwoThreads();

private:
    qint64 addFile(const QString &path, const QString &mimeType = QStringLiteral("audio/ogg"),
                   const QString &displayName = QString(), const QString &category = QString());
    qint64 addThemelet(const QString &name, bool favorite, const QString &timestamp);
    void addResource(qint64 themelet, const QString &type, qint64 target);

    QScopedPointer<TestDatabase> m_db;
    QScopedPointer<QueryAgentDatabase> m_database;
};

void TestQueryAgents::initTestCase()
{
    { DbManager schema; QVERIFY(schema.isOpen()); }
    m_db.reset(new TestDatabase);
    QVERIFY(m_db->isOpen());
}

void TestQueryAgents::init()
{
    QVERIFY(m_db->exec({ QStringLiteral("DELETE FROM directory"), QStringLiteral("DELETE FROM file"),
                         QStringLiteral("DELETE FROM image"), QStringLiteral("DELETE FROM themelet"),
                         QStringLiteral("DELETE FROM zefId"), QStringLiteral("DELETE FROM download"),
                         QStringLiteral("DELETE FROM resource") }));
    m_database.reset(new QueryAgentDatabase);
    m_database->setConnectOptions(QStringLiteral("QSQLITE_OPEN_URI"));
    m_database->setDatabaseName(QueryAgent::databaseUrl(0).toString());
    QVERIFY(m_database->open());
}

void TestQueryAgents::cleanup()
{
    m_database.reset();
}

void TestQueryAgents::cleanupTestCase()
{
    m_db.reset();
}

qint64 TestQueryAgents::addFile(const QString &path, const QString &mimeType, const QString &displayName,
                                const QString &category)
{
    const int slash = path.lastIndexOf(QLatin1Char('/'));
    const QString directory = quoted(path.left(slash));
    const QString name = quoted(path.mid(slash + 1));
    m_db->exec({ QStringLiteral("INSERT OR IGNORE INTO directory (path, scope) VALUES (%1, 0)").arg(directory),
                 QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, displayName, permissions, "
                                "metadataCurrent, category) SELECT id, %2, %3, %4, 3, 1, %5 FROM directory "
                                "WHERE path = %1")
                         .arg(directory, quoted(mimeType), name,
                              quoted(displayName.isNull() ? path.mid(slash + 1) : displayName),
                              quoted(category)) });
    return m_db->value(QStringLiteral("SELECT max(id) FROM file")).toLongLong();
}

qint64 TestQueryAgents::addThemelet(const QString &name, bool favorite, const QString &timestamp)
{
    const qint64 id = addFile(QStringLiteral("/t/") + name + QLatin1String(".themelet"),
                              QStringLiteral("application/x-vorka-themelet"), name);
    m_db->exec(QStringLiteral("INSERT INTO themelet (fileId, favorite, timestamp, ringerVolume) "
                              "VALUES (%1, %2, %3, 50)")
                       .arg(id).arg(favorite ? 1 : 0).arg(quoted(timestamp)));
    return id;
}

void TestQueryAgents::addResource(qint64 themelet, const QString &type, qint64 target)
{
    m_db->exec(QStringLiteral("INSERT INTO resource (fileId, resourceType, resourceId) VALUES (%1, %2, %3)")
                       .arg(themelet).arg(quoted(type)).arg(target));
}

void TestQueryAgents::fileBatches_data()
{
    QTest::addColumn<int>("rows");
    QTest::addColumn<QList<int>>("sizes");
    QTest::newRow("empty") << 0 << QList<int> { 0 };
    QTest::newRow("49") << 49 << QList<int> { 49 };
    QTest::newRow("50") << 50 << QList<int> { 50, 0 };
    QTest::newRow("51") << 51 << QList<int> { 50, 1 };
    QTest::newRow("100") << 100 << QList<int> { 50, 50, 0 };
}

void TestQueryAgents::fileBatches()
{
    QFETCH(int, rows);
    QFETCH(QList<int>, sizes);
    QStringList expected;
    m_db->exec(QStringLiteral("BEGIN"));
    for (int i = rows; i > 0; --i) {
        expected.prepend(QStringLiteral("f%1.ogg").arg(i, 3, 10, QLatin1Char('0')));
        addFile(QLatin1String("/d/") + expected.first());
    }
    m_db->exec(QStringLiteral("COMMIT"));

    FileQueryAgent agent(*m_database);
    Batches batches;
    QVERIFY(agent.query(&batches, FileQueryAgent::FileParameters()));
    QCOMPARE(batches.sizes, sizes);
    QCOMPARE(batches.fileNames(), expected);
}

void TestQueryAgents::fileStatement_data()
{
    QTest::addColumn<QString>("mimeType");
    QTest::addColumn<QStringList>("directories");
    QTest::addColumn<QStringList>("categories");
    QTest::addColumn<QString>("tail");
    QTest::addColumn<QVariantList>("values");

    QTest::newRow("default") << QString() << QStringList() << QStringList()
                             << " ORDER BY  file.displayName ASC;" << QVariantList();
    QTest::newRow("exact mime") << "audio/ogg" << QStringList() << QStringList()
                                << "WHERE file.mimeType = ? ORDER BY  file.displayName ASC;"
                                << QVariantList { "audio/ogg" };
    QTest::newRow("mime glob") << "audio/*" << QStringList() << QStringList()
                               << "WHERE file.mimeType GLOB ? ORDER BY  file.displayName ASC;"
                               << QVariantList { "audio/*" };
    QTest::newRow("one directory") << QString() << QStringList { "/a" } << QStringList()
                                   << "WHERE (directory.path GLOB ?) ORDER BY  file.displayName ASC;"
                                   << QVariantList { "/a/*" };
    QTest::newRow("mime and two directories")
            << "audio/*" << QStringList { "/a", "/b" } << QStringList()
            << "WHERE file.mimeType GLOB ?\n     AND (directory.path GLOB ?\n         OR directory.path GLOB ?)"
               " ORDER BY  file.displayName ASC;"
            << QVariantList { "audio/*", "/a/*", "/b/*" };
    QTest::newRow("one category") << QString() << QStringList() << QStringList { "Ringtone" }
                                  << " ORDER BY \n   CASE file.category\n     WHEN 'Ringtone' THEN 0"
                                     "\n     ELSE 1\n   END, file.displayName ASC;"
                                  << QVariantList();
    QTest::newRow("tone list")
            << "audio/*" << QStringList { "/a", "/b" } << QStringList { "Ringtone", "Customer", "Default" }
            << "WHERE file.mimeType GLOB ?\n     AND (directory.path GLOB ?\n         OR directory.path GLOB ?)"
               " ORDER BY \n   CASE file.category\n     WHEN 'Ringtone' THEN 0\n     WHEN 'Customer' THEN 1"
               "\n     WHEN 'Default' THEN 2\n     ELSE 3\n   END, file.displayName ASC;"
            << QVariantList { "audio/*", "/a/*", "/b/*" };
}

void TestQueryAgents::fileStatement()
{
    QFETCH(QString, mimeType);
    QFETCH(QStringList, directories);
    QFETCH(QStringList, categories);
    QFETCH(QString, tail);
    QFETCH(QVariantList, values);

    FileQueryAgent::FileParameters parameters;
    parameters.mimeType = mimeType;
    parameters.directories = directories;
    parameters.categories = categories;
    QVariantList bound;
    const QString statement = FileQueryAgent::listStatement(parameters, &bound);
    QCOMPARE(statement, s_fileSelect + tail);
    QCOMPARE(bound, values);

    // The statement runs as it stands.
    FileQueryAgent agent(*m_database);
    Batches batches;
    QVERIFY(agent.query(&batches, parameters));
    QCOMPARE(batches.sizes, QList<int> { 0 });
}

void TestQueryAgents::fileFilters_data()
{
    QTest::addColumn<QString>("mimeType");
    QTest::addColumn<QStringList>("directories");
    QTest::addColumn<QStringList>("expected");

    QTest::newRow("all") << QString() << QStringList() << QStringList { "a.ogg", "b.mp3", "c.jpg", "d.ogg", "e.ogg" };
    QTest::newRow("exact") << "audio/ogg" << QStringList() << QStringList { "a.ogg", "d.ogg" };
    QTest::newRow("exact prefix") << "audio" << QStringList() << QStringList();
    QTest::newRow("glob") << "audio/*" << QStringList() << QStringList { "a.ogg", "b.mp3", "d.ogg", "e.ogg" };
    QTest::newRow("glob suffix") << "*ogg" << QStringList() << QStringList { "a.ogg", "d.ogg", "e.ogg" };
    // The directory itself doesn't match its pattern, nor does a sibling sharing its prefix.
    QTest::newRow("subtree") << QString() << QStringList { "/d" } << QStringList { "b.mp3", "c.jpg" };
    QTest::newRow("two subtrees") << QString() << QStringList { "/d", "/e" }
                                  << QStringList { "b.mp3", "c.jpg", "e.ogg" };
    QTest::newRow("glob in subtrees") << "audio/*" << QStringList { "/d", "/e" } << QStringList { "b.mp3", "e.ogg" };
}

void TestQueryAgents::fileFilters()
{
    QFETCH(QString, mimeType);
    QFETCH(QStringList, directories);
    QFETCH(QStringList, expected);

    addFile(QStringLiteral("/d/a.ogg"), QStringLiteral("audio/ogg"));
    addFile(QStringLiteral("/d/sub/b.mp3"), QStringLiteral("audio/mpeg"));
    addFile(QStringLiteral("/d/sub/deep/c.jpg"), QStringLiteral("image/jpeg"));
    addFile(QStringLiteral("/dx/d.ogg"), QStringLiteral("audio/ogg"));
    addFile(QStringLiteral("/e/sub/e.ogg"), QStringLiteral("audio/x-vorbis+ogg"));

    FileQueryAgent agent(*m_database);
    FileQueryAgent::FileParameters parameters;
    parameters.mimeType = mimeType;
    parameters.directories = directories;
    Batches batches;
    QVERIFY(agent.query(&batches, parameters));
    QCOMPARE(batches.fileNames(), expected);
}

void TestQueryAgents::fileCategories_data()
{
    QTest::addColumn<QStringList>("categories");
    QTest::addColumn<QStringList>("expected");
    QTest::newRow("none") << QStringList() << QStringList { "A", "B", "C", "D", "E", "F" };
    QTest::newRow("one") << QStringList { "Customer" } << QStringList { "D", "A", "B", "C", "E", "F" };
    // Unlisted and NULL categories share the last place, by name.
    QTest::newRow("tone list") << QStringList { "Ringtone", "Customer", "Default" }
                               << QStringList { "B", "F", "D", "A", "C", "E" };
}

void TestQueryAgents::fileCategories()
{
    QFETCH(QStringList, categories);
    QFETCH(QStringList, expected);
    const QStringList fileCategories = { "Default", "Ringtone", QString(), "Customer", "Other", "Ringtone" };
    for (int i = 0; i < fileCategories.size(); ++i) {
        const QString name = QString(QLatin1Char('A' + i));
        addFile(QLatin1String("/s/") + name.toLower() + QLatin1String(".ogg"), QStringLiteral("audio/ogg"), name,
                fileCategories.at(i));
    }

    FileQueryAgent agent(*m_database);
    FileQueryAgent::FileParameters parameters;
    parameters.categories = categories;
    Batches batches;
    QVERIFY(agent.query(&batches, parameters));
    QStringList names;
    for (const Content &item : qAsConst(batches.all))
        names << static_cast<const FileData *>(item.data())->displayName;
    QCOMPARE(names, expected);
}

void TestQueryAgents::fileLookups()
{
    addFile(QStringLiteral("/d/other.ogg"));
    const qint64 id = addFile(QStringLiteral("/d/sub dir/tone #1.ogg"), QStringLiteral("audio/ogg"),
                              QStringLiteral("Tone"), QStringLiteral("Ringtone"));
    m_db->exec(QStringLiteral("UPDATE file SET permissions = 1 WHERE id = %1").arg(id));
    m_db->exec(QStringLiteral("INSERT INTO download (fileId, source) VALUES (%1, 'http://example.com/t.ogg')")
                       .arg(id));
    FileQueryAgent agent(*m_database);

    const Content byId = agent.queryById(id);
    QVERIFY(byId.isValid());
    const FileData *file = static_cast<const FileData *>(byId.data());
    QCOMPARE(file->id, id);
    QCOMPARE(file->url, QUrl::fromLocalFile(QStringLiteral("/d/sub dir/tone #1.ogg")));
    QCOMPARE(file->mimeType, QStringLiteral("audio/ogg"));
    QCOMPARE(file->fileName, QStringLiteral("tone #1.ogg"));
    QCOMPARE(file->displayName, QStringLiteral("Tone"));
    QCOMPARE(file->category, QStringLiteral("Ringtone"));
    QCOMPARE(file->permissions, 1);

    const Content byUrl = agent.queryByUrl(QUrl::fromLocalFile(QStringLiteral("/d/sub dir/tone #1.ogg")));
    QVERIFY(byUrl.isValid());
    QCOMPARE(byUrl.data()->id, id);
    const Content bySource = agent.queryByUrl(QUrl(QStringLiteral("http://example.com/t.ogg")));
    QVERIFY(bySource.isValid());
    QCOMPARE(bySource.data()->id, id);

    QVERIFY(!agent.queryByUrl(QUrl(QStringLiteral("http://example.com/other.ogg"))).isValid());
    QVERIFY(!agent.queryByUrl(QUrl::fromLocalFile(QStringLiteral("/d/missing.ogg"))).isValid());
    QVERIFY(!agent.queryById(id + 100).isValid());
}

void TestQueryAgents::photoList()
{
    PhotoQueryAgent agent(*m_database);
    Batches empty;
    QVERIFY(agent.query(&empty, QueryAgent::Parameters()));
    QCOMPARE(empty.sizes, QList<int> { 0 });

    const qint64 may = addFile(QStringLiteral("/p/may.jpg"), QStringLiteral("image/jpeg"));
    const qint64 january = addFile(QStringLiteral("/p/january.jpg"), QStringLiteral("image/jpeg"));
    addFile(QStringLiteral("/p/unread.jpg"), QStringLiteral("image/jpeg"));
    const qint64 june = addFile(QStringLiteral("/p/june.png"), QStringLiteral("image/png"));
    m_db->exec({ QStringLiteral("INSERT INTO image VALUES (%1, '2014-05-01T12:00:00', 640, 480, 6)").arg(may),
                 QStringLiteral("INSERT INTO image VALUES (%1, '2014-01-01T08:00:00', 1, 2, 0)").arg(january),
                 QStringLiteral("INSERT INTO image VALUES (%1, '2014-06-01T08:00:00', 1, 2, 0)").arg(june) });

    Batches batches;
    QVERIFY(agent.query(&batches, QueryAgent::Parameters()));
    QCOMPARE(batches.fileNames(), QStringList({ "january.jpg", "may.jpg", "june.png" }));
    const PhotoData *photo = static_cast<const PhotoData *>(batches.all.at(1).data());
    QCOMPARE(photo->type, int(ThemeletContent::Photo));
    QCOMPARE(photo->id, may);
    QCOMPARE(photo->url, QUrl::fromLocalFile(QStringLiteral("/p/may.jpg")));
    QCOMPARE(photo->mimeType, QStringLiteral("image/jpeg"));
    QCOMPARE(photo->permissions, 3);
    QCOMPARE(photo->dateTaken, QDateTime(QDate(2014, 5, 1), QTime(12, 0)));
    QCOMPARE(photo->width, 640);
    QCOMPARE(photo->height, 480);
    QCOMPARE(photo->orientation, 6);
    QVERIFY(photo->category.isEmpty());
}

void TestQueryAgents::photoLookups_data()
{
    QTest::addColumn<QUrl>("url");
    QTest::addColumn<QString>("statement");
    QTest::newRow("by id") << QUrl()
                           << s_photoSelect + "INNER JOIN photo ON file.id = photo.fileId WHERE file.id = ?;";
    QTest::newRow("by path") << QUrl::fromLocalFile(QStringLiteral("/p/may.jpg"))
                             << s_photoSelect + "LEFT JOIN photo ON file.id = photo.fileId "
                                                "WHERE directory.path = ? AND file.fileName = ?;";
    QTest::newRow("by source") << QUrl(QStringLiteral("http://example.com/may.jpg"))
                               << s_photoSelect + "LEFT JOIN photo ON file.id = photo.fileId "
                                                  "WHERE file.id IN (SELECT fileId FROM download WHERE source = ?);";
}

void TestQueryAgents::photoLookups()
{
    QFETCH(QUrl, url);
    QFETCH(QString, statement);
    const qint64 id = addFile(QStringLiteral("/p/may.jpg"), QStringLiteral("image/jpeg"));
    m_db->exec({ QStringLiteral("INSERT INTO image VALUES (%1, '2014-05-01T12:00:00', 640, 480, 6)").arg(id),
                 QStringLiteral("INSERT INTO download VALUES (%1, 'http://example.com/may.jpg')").arg(id) });

    // The lookups name a table the schema lacks: they always fail with two reports.
    PhotoQueryAgent agent(*m_database);
    MessageLog log;
    const Content photo = url.isEmpty() ? agent.queryById(id) : agent.queryByUrl(url);
    QVERIFY(!photo.isValid());
    QCOMPARE(log.warnings(), QStringList({
        "QSqlQuery QueryActor::prepareQuery(const QString&)",
        "Failed to prepare query",
        "QSqlError(\"1\", \"Unable to execute statement\", \"no such table: photo\")",
        QLatin1Char('"') + statement + QLatin1Char('"'),
        "Content PhotoQueryAgent::querySinglePhoto(QSqlQuery&)",
        "Failed to query photo",
        "QSqlError(\"\", \"Driver not loaded\", \"Driver not loaded\")",
        "\"\"" }));
}

void TestQueryAgents::themeletFilters_data()
{
    QTest::addColumn<int>("filter");
    QTest::addColumn<bool>("favourites");
    QTest::addColumn<QStringList>("expected");
    QTest::newRow("all") << 0 << true << QStringList { "T4", "T2", "T3", "T1" };
    QTest::newRow("favourites") << 1 << true << QStringList { "T4", "T2" };
    QTest::newRow("others") << 2 << true << QStringList { "T3", "T1" };
    QTest::newRow("all, no favourites") << 0 << false << QStringList { "T4", "T3", "T1", "T2" };
    QTest::newRow("favourites, none") << 1 << false << QStringList();
}

void TestQueryAgents::themeletFilters()
{
    QFETCH(int, filter);
    QFETCH(bool, favourites);
    QFETCH(QStringList, expected);
    addThemelet(QStringLiteral("T1"), false, QStringLiteral("2"));
    addThemelet(QStringLiteral("T2"), favourites, QStringLiteral("3"));
    addThemelet(QStringLiteral("T3"), false, QStringLiteral("1"));
    addThemelet(QStringLiteral("T4"), favourites, QStringLiteral("0"));

    ThemeletQueryAgent agent(*m_database);
    ThemeletQueryAgent::ThemeletParameters parameters;
    parameters.filter = filter;
    // Twice: the temporary table of the first run must be gone.
    for (int run = 0; run < 2; ++run) {
        Batches batches;
        QVERIFY(agent.query(&batches, parameters));
        QCOMPARE(batches.sizes, QList<int> { expected.size() });
        QStringList names;
        for (int i = 0; i < batches.all.size(); ++i)
            names << batches.themelet(i)->displayName;
        QCOMPARE(names, expected);
    }
}

void TestQueryAgents::themeletBatches()
{
    QVector<qint64> ids;
    m_db->exec(QStringLiteral("BEGIN"));
    for (int i = 1; i <= 51; ++i)
        ids << addThemelet(QStringLiteral("T%1").arg(i), false, QStringLiteral("%1").arg(i, 3, 10, QLatin1Char('0')));
    addResource(ids.at(49), QStringLiteral("ringerTone"), addFile(QStringLiteral("/r/50.ogg"), "audio/ogg", "R50"));
    addResource(ids.at(50), QStringLiteral("ringerTone"), addFile(QStringLiteral("/r/51.ogg"), "audio/ogg", "R51"));
    addResource(ids.at(50), QStringLiteral("homeWallpaper"), addFile(QStringLiteral("/r/51.jpg"), "image/jpeg", "W51"));
    m_db->exec(QStringLiteral("COMMIT"));

    ThemeletQueryAgent agent(*m_database);
    Batches batches;
    QVERIFY(agent.query(&batches, ThemeletQueryAgent::ThemeletParameters()));
    QCOMPARE(batches.sizes, QList<int>({ 50, 1 }));
    for (int i = 0; i < 49; ++i)
        QVERIFY(batches.themelet(i)->resources.isEmpty());
    QCOMPARE(batches.themelet(49)->id, ids.at(49));
    QCOMPARE(batches.themelet(49)->resources,
             QVariantMap({ { "ringerTone", resource(QStringLiteral("/r/50.ogg"), QStringLiteral("R50")) } }));
    QCOMPARE(batches.themelet(50)->id, ids.at(50));
    QCOMPARE(batches.themelet(50)->resources,
             QVariantMap({ { "ringerTone", resource(QStringLiteral("/r/51.ogg"), QStringLiteral("R51")) },
                           { "homeWallpaper", resource(QStringLiteral("/r/51.jpg"), QStringLiteral("W51")) } }));
}

void TestQueryAgents::themeletResources()
{
    const qint64 a = addThemelet(QStringLiteral("A"), false, QStringLiteral("1"));
    addThemelet(QStringLiteral("B"), false, QStringLiteral("2"));
    const qint64 c = addThemelet(QStringLiteral("C"), false, QStringLiteral("3"));
    const qint64 d = addThemelet(QStringLiteral("D"), false, QStringLiteral("4"));
    addResource(a, QStringLiteral("ringerTone"), addFile(QStringLiteral("/r/a.ogg"), "audio/ogg", "A tone"));
    addResource(a, QStringLiteral("homeWallpaper"), addFile(QStringLiteral("/r/a.jpg"), "image/jpeg", "A picture"));
    addResource(c, QStringLiteral("ringerTone"), 9999); // its file is gone
    addResource(c, QStringLiteral("messageTone"), addFile(QStringLiteral("/r/c.ogg"), "audio/ogg", "C tone"));
    addResource(d, QStringLiteral("ringerTone"), addFile(QStringLiteral("/r/d.ogg"), "audio/ogg", "D tone"));
    m_db->exec(QStringLiteral("INSERT INTO zefId VALUES (%1, 'zef-d')").arg(d));

    ThemeletQueryAgent agent(*m_database);
    Batches batches;
    QVERIFY(agent.query(&batches, ThemeletQueryAgent::ThemeletParameters()));
    QCOMPARE(batches.all.size(), 4);
    QCOMPARE(batches.themelet(0)->resources,
             QVariantMap({ { "ringerTone", resource(QStringLiteral("/r/a.ogg"), QStringLiteral("A tone")) },
                           { "homeWallpaper", resource(QStringLiteral("/r/a.jpg"), QStringLiteral("A picture")) } }));
    QVERIFY(batches.themelet(1)->resources.isEmpty());
    QCOMPARE(batches.themelet(2)->resources,
             QVariantMap({ { "messageTone", resource(QStringLiteral("/r/c.ogg"), QStringLiteral("C tone")) } }));
    QCOMPARE(batches.themelet(3)->resources,
             QVariantMap({ { "ringerTone", resource(QStringLiteral("/r/d.ogg"), QStringLiteral("D tone")) } }));
    QVERIFY(batches.themelet(0)->zefId.isNull());
    QCOMPARE(batches.themelet(3)->zefId, QStringLiteral("zef-d"));
}

void TestQueryAgents::themeletWithoutFile()
{
    // A themelet row without its file row: its resources block the cursor, so
    // the themelets after it get none. Kept so; the triggers prevent such rows.
    const qint64 w = addThemelet(QStringLiteral("W"), false, QStringLiteral("1"));
    const qint64 y = addThemelet(QStringLiteral("Y"), false, QStringLiteral("3"));
    m_db->exec(QStringLiteral("INSERT INTO themelet (fileId, favorite, timestamp) VALUES (500, 0, '2')"));
    addResource(w, QStringLiteral("ringerTone"), addFile(QStringLiteral("/r/w.ogg")));
    addResource(500, QStringLiteral("ringerTone"), addFile(QStringLiteral("/r/x.ogg")));
    addResource(y, QStringLiteral("ringerTone"), addFile(QStringLiteral("/r/y.ogg")));

    ThemeletQueryAgent agent(*m_database);
    MessageLog log;
    for (int run = 0; run < 2; ++run) {
        Batches batches;
        QVERIFY(agent.query(&batches, ThemeletQueryAgent::ThemeletParameters()));
        QCOMPARE(batches.all.size(), 2);
        QCOMPARE(batches.themelet(0)->id, w);
        QCOMPARE(batches.themelet(0)->resources.keys(), QStringList { "ringerTone" });
        QCOMPARE(batches.themelet(1)->id, y);
        QVERIFY(batches.themelet(1)->resources.isEmpty());
    }
    QCOMPARE(log.warnings(), QStringList());
}

void TestQueryAgents::themeletTableLeftOver()
{
    // A temporary table left by a failed drop makes the next query fail at once.
    addThemelet(QStringLiteral("A"), false, QStringLiteral("1"));
    ThemeletQueryAgent agent(*m_database);
    const QString table = QLatin1String("themelet_") + agent.threadId();
    QVERIFY(agent.prepareQuery(QStringLiteral("CREATE TEMPORARY TABLE %1 (x)").arg(table)).exec());

    Batches batches;
    ThemeletQueryAgent::ThemeletParameters parameters;
    parameters.filter = ThemeletQueryAgent::FavoritesOnly;
    MessageLog log;
    QVERIFY(!agent.query(&batches, parameters));
    QVERIFY(batches.sizes.isEmpty());
    // The table's existence already fails the prepare; the create then reports the substitute.
    QCOMPARE(log.warnings(), QStringList({
        "QSqlQuery QueryActor::prepareQuery(const QString&)",
        "Failed to prepare query",
        QStringLiteral("QSqlError(\"1\", \"Unable to execute statement\", \"table %1 already exists\")").arg(table),
        QStringLiteral("\"CREATE TEMPORARY TABLE %1 AS SELECT * FROM themelet\\n"
                       "WHERE themelet.favorite = ? ORDER BY themelet.timestamp ASC;\"").arg(table),
        "virtual bool ThemeletQueryAgent::query(QueryAgent::Recipient*, const QueryAgent::Parameters&)",
        "Failed to create themelet table",
        "QSqlError(\"\", \"Driver not loaded\", \"Driver not loaded\")",
        "\"\"" }));
}

void TestQueryAgents::themeletLookups()
{
    addThemelet(QStringLiteral("Other"), false, QStringLiteral("0"));
    const qint64 id = addThemelet(QStringLiteral("Sea"), true, QStringLiteral("1"));
    m_db->exec({ QStringLiteral("UPDATE themelet SET homeWallpaper = 'images/home.jpg', "
                                "applicationWallpaper = 'images/app.jpg', highlightColor = '#ff112233', "
                                "secondaryHighlightColor = '#80445566', primaryColor = '#ffffffff', "
                                "secondaryColor = '#b3000000', ringerVolume = NULL, enabledSounds = 5, "
                                "partnerSpace = 'ps', version = 3 WHERE fileId = %1").arg(id),
                 QStringLiteral("INSERT INTO zefId VALUES (%1, 'zef')").arg(id),
                 QStringLiteral("INSERT INTO download VALUES (%1, 'http://example.com/sea.themelet')").arg(id) });
    addResource(id, QStringLiteral("ringerTone"), addFile(QStringLiteral("/r/sea.ogg"), "audio/ogg", "Waves"));
    addResource(id, QStringLiteral("homeWallpaper"), addFile(QStringLiteral("/r/sea.jpg"), "image/jpeg", "Shore"));
    const QVariantMap resources = {
        { "ringerTone", resource(QStringLiteral("/r/sea.ogg"), QStringLiteral("Waves")) },
        { "homeWallpaper", resource(QStringLiteral("/r/sea.jpg"), QStringLiteral("Shore")) }
    };

    ThemeletQueryAgent agent(*m_database);
    const Content lookups[] = { agent.queryById(id),
                                agent.queryByUrl(QUrl::fromLocalFile(QStringLiteral("/t/Sea.themelet"))),
                                agent.queryByUrl(QUrl(QStringLiteral("http://example.com/sea.themelet"))) };
    for (const Content &content : lookups) {
        QVERIFY(content.isValid());
        const ThemeletData *themelet = static_cast<const ThemeletData *>(content.data());
        QCOMPARE(themelet->id, id);
        QCOMPARE(themelet->url, QUrl::fromLocalFile(QStringLiteral("/t/Sea.themelet")));
        QCOMPARE(themelet->mimeType, QStringLiteral("application/x-vorka-themelet"));
        QCOMPARE(themelet->fileName, QStringLiteral("Sea.themelet"));
        QCOMPARE(themelet->permissions, 3);
        QCOMPARE(themelet->displayName, QStringLiteral("Sea"));
        QCOMPARE(themelet->zefId, QStringLiteral("zef"));
        QVERIFY(themelet->favorite);
        QCOMPARE(themelet->homeWallpaper, QStringLiteral("images/home.jpg"));
        QCOMPARE(themelet->applicationWallpaper, QStringLiteral("images/app.jpg"));
        QCOMPARE(themelet->highlightColor.name(QColor::HexArgb), QStringLiteral("#ff112233"));
        QCOMPARE(themelet->secondaryHighlightColor.name(QColor::HexArgb), QStringLiteral("#80445566"));
        QCOMPARE(themelet->primaryColor.name(QColor::HexArgb), QStringLiteral("#ffffffff"));
        QCOMPARE(themelet->secondaryColor.name(QColor::HexArgb), QStringLiteral("#b3000000"));
        QCOMPARE(themelet->ringerVolume, 0);
        QCOMPARE(themelet->enabledSounds, 5);
        QCOMPARE(themelet->partnerSpace, QStringLiteral("ps"));
        QCOMPARE(themelet->version, 3);
        QVERIFY(themelet->timestamp.isNull());
        QCOMPARE(themelet->resources, resources);
    }

    const Content other = agent.queryByUrl(QUrl::fromLocalFile(QStringLiteral("/t/Other.themelet")));
    QVERIFY(other.isValid());
    QVERIFY(static_cast<const ThemeletData *>(other.data())->resources.isEmpty());
    QVERIFY(static_cast<const ThemeletData *>(other.data())->zefId.isNull());
    QVERIFY(!agent.queryById(id + 100).isValid());
    QVERIFY(!agent.queryByUrl(QUrl(QStringLiteral("http://example.com/none.themelet"))).isValid());
}

void TestQueryAgents::themeletsOnTwoThreads()
{
    // Each thread's query holds its own temporary table while the other's is alive.
    for (int i = 0; i < 3; ++i)
        addThemelet(QStringLiteral("T%1").arg(i), i == 1, QString::number(i));

    class Meeting : public Batches
    {
    public:
        Meeting(QSemaphore &arrived, QSemaphore &met) : m_arrived(arrived), m_met(met) {}
        void contentQueried(const QVector<Content> &content) override
        {
            Batches::contentQueried(content);
            m_arrived.release();
            met = m_met.tryAcquire(1, 10000);
        }
        bool met = false;

    private:
        QSemaphore &m_arrived;
        QSemaphore &m_met;
    };

    QSemaphore arrived;
    QSemaphore met;
    Meeting first(arrived, met);
    Meeting second(arrived, met);
    bool results[2] = { false, false };
    auto run = [&results](int i, Meeting *meeting) {
        QueryAgent *agent = QueryAgent::agentFor(ThemeletContent::Themelet);
        ThemeletQueryAgent::ThemeletParameters parameters;
        results[i] = agent && agent->query(meeting, parameters);
    };
    QScopedPointer<QThread> one(QThread::create(run, 0, &first));
    QScopedPointer<QThread> two(QThread::create(run, 1, &second));
    one->start();
    two->start();
    QVERIFY(arrived.tryAcquire(2, 10000));
    met.release(2);
    QVERIFY(one->wait(10000));
    QVERIFY(two->wait(10000));
    QVERIFY(results[0] && results[1]);
    QVERIFY(first.met && second.met);
    QCOMPARE(first.all.size(), 3);
    QCOMPARE(second.all.size(), 3);
}

QTEST_GUILESS_MAIN(TestQueryAgents)

#include "tst_queryagents.moc"
