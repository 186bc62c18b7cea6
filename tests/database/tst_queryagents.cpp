// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "dbmanager.h"
#include "filequeryagent.h"
#include "photoqueryagent.h"
#include "messagelog.h"
#include "testdatabase.h"
#include "themeletqueryagent.h"

#include <QtTest>

#include <memory>
#include <numeric>

namespace {

// Keeps the batches and role 5 of each item, the display name in every role table.
struct Batches : QueryAgent::Recipient
{
    void contentQueried(const QVector<Content> &content) override
    {
        sizes << content.size();
        for (const Content &item : content)
            names << item.data()->data(5).toString();
        all << content;
    }
    QList<int> sizes;
    QVector<Content> all;
    QStringList names;
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
                                    "SELECT id, '%2', '%3', '%4', 3, NULLIF('%5', '') FROM directory WHERE path = '%1'")
                             .arg(file.path(), mimeType, file.fileName(), file.completeBaseName(), category) });
        return m_db->value("SELECT max(id) FROM file").toLongLong();
    }

    qint64 addThemelet(const QString &name, bool favorite, int timestamp)
    {
        const qint64 id = addFile("/t/" + name + ".themelet", "application/x-vorka-themelet");
        m_db->exec(QStringLiteral("INSERT INTO themelet (fileId, favorite, timestamp) VALUES (%1, %2, '%3')")
                           .arg(id).arg(favorite ? 1 : 0).arg(timestamp, 3, 10, QLatin1Char('0')));
        return id;
    }

private slots:
    void initTestCase()
    {
        QCOMPARE(QueryAgent::databaseUrl(1).toString(), "file://" + qEnvironmentVariable("XDG_DATA_HOME")
                 + "/system/privileged/Themeletd/themeletd.sqlite?mode=ro&immutable=1");
        QVERIFY(DbManager().isOpen());
        QueryAgent *const agent = QueryAgent::agentFor(ThemeletContent::File);
        QVERIFY(agent && agent == QueryAgent::agentFor(ThemeletContent::File)); // one per thread and type, made once
        m_db.reset(new TestDatabase);
        m_database.reset(new QueryAgentDatabase);
        m_database->setConnectOptions(QStringLiteral("QSQLITE_OPEN_URI"));
        m_database->setDatabaseName(QueryAgent::databaseUrl(0).toString());
        QVERIFY(m_database->open());
    }

    void init() { m_db->exec({ "DELETE FROM directory", "DELETE FROM themelet" }); } // the triggers take the other rows along

    void fileList_data()
    {
        QTest::addColumn<QString>("parameters"); // mime type; directories; categories
        QTest::addColumn<QString>("tail");       // of the statement
        QTest::addColumn<QString>("names");
        const QString byName = " ORDER BY  file.displayName ASC;";
        QTest::newRow("exact mime") << "audio/ogg;;" << "WHERE file.mimeType = ?" + byName << "a d";
        QTest::newRow("mime glob") << "audio/*;;" << "WHERE file.mimeType GLOB ?" + byName << "a b d e";
        // "/d" takes in neither /d itself nor /dx.
        QTest::newRow("two directories") << "audio/*;/d /e;"
                << "WHERE file.mimeType GLOB ?\n     AND (directory.path GLOB ?\n         OR directory.path GLOB ?)" + byName << "b e";
        QTest::newRow("categories") << ";;Ringtone Customer Default"
                << " ORDER BY \n   CASE file.category\n     WHEN 'Ringtone' THEN 0\n     WHEN 'Customer' THEN 1"
                   "\n     WHEN 'Default' THEN 2\n     ELSE 3\n   END, file.displayName ASC;" << "b d a c e";
    }

    void fileList()
    {
        QFETCH(QString, parameters);
        QFETCH(QString, tail);
        QFETCH(QString, names);
        for (const QString file : { "/d/a.ogg audio/ogg Default", "/d/sub/b.mp3 audio/mpeg Ringtone", "/d/sub/deep/c.jpg image/jpeg",
                                    "/dx/d.ogg audio/ogg Customer", "/e/sub/e.ogg audio/x-vorbis+ogg Other" })
            addFile(file.section(' ', 0, 0), file.section(' ', 1, 1), file.section(' ', 2, 2));
        FileQueryAgent::FileParameters list;
        list.mimeType = parameters.section(';', 0, 0);
        list.directories = parameters.section(';', 1, 1).split(' ', Qt::SkipEmptyParts);
        list.categories = parameters.section(';', 2, 2).split(' ', Qt::SkipEmptyParts);
        QVariantList bound;
        QCOMPARE(FileQueryAgent::listStatement(list, &bound),
                 "SELECT file.id, directory.path || '/' || file.fileName, file.mimeType, file.fileName, file.displayName, "
                 "file.category, file.permissions FROM file INNER JOIN directory on file.directoryId = directory.id " + tail);
        Batches batches;
        QVERIFY(FileQueryAgent(*m_database).query(&batches, list));
        QCOMPARE(batches.names.join(' '), names);
    }

    void queries()
    {
        const qint64 file = addFile("/d/sub dir/tone #1.ogg", "audio/ogg", "Ringtone");
        const qint64 themelet = addThemelet("Sea", true, 3);
        for (const QString other : { "T1 0 2", "T3 0 1", "T4 1 0" })
            addThemelet(other.section(' ', 0, 0), other.section(' ', 1, 1).toInt(), other.section(' ', 2, 2).toInt());
        m_db->exec({ QStringLiteral("UPDATE file SET permissions = 1 WHERE id = %1").arg(file),
                     QStringLiteral("INSERT INTO resource VALUES (%1, 'ringerTone', %2), (-1, 'ringerTone', %2)").arg(themelet)
                             .arg(addFile("/r/sea.ogg")),
                     "INSERT INTO themelet (fileId, favorite, timestamp) VALUES (-1, 1, '001')", // no file row
                     QStringLiteral("INSERT INTO download VALUES (%1, 'http://example.com/t.ogg'), (%2, 'http://example.com/sea.themelet')")
                             .arg(file).arg(themelet) });
        // Filters 0, 1 and 2: favourites first, then by time; each query's temporary table is gone before the next,
        // also when the resource cursor was left standing on the orphan's row ahead of Sea's: Sea gets none ("+").
        ThemeletQueryAgent themelets(*m_database);
        QStringList lists;
        for (int filter : { 0, 1, 2 }) {
            ThemeletQueryAgent::ThemeletParameters parameters;
            parameters.filter = filter;
            Batches batches;
            QVERIFY(themelets.query(&batches, parameters));
            for (int i = 0; i < batches.all.size(); ++i)
                batches.names[i] += batches.all.at(i).data()->data(ThemeletData::ResourcesRole).toMap().isEmpty() ? "" : "+";
            lists << batches.names.join(' ');
        }
        QCOMPARE(lists, (QStringList { "T4 Sea T3 T1", "T4 Sea", "T3 T1" }));

        // Lookups by id, by local url (with a space and a '#'), by the url it was downloaded from.
        FileQueryAgent files(*m_database);
        const QUrl url = QUrl::fromLocalFile("/d/sub dir/tone #1.ogg");
        for (const Content &found : { files.queryById(file), files.queryByUrl(url), files.queryByUrl(QUrl("http://example.com/t.ogg")) })
            QCOMPARE(roles(found, 8), QStringLiteral("%1|%2|audio/ogg|tone #1.ogg|/d/sub dir/tone #1.ogg|tone #1|true|Ringtone")
                                              .arg(file).arg(url.toString()));
        // Every field of a themelet record is compared in tst_ThemeletManager::format.
        for (const Content &found : { themelets.queryById(themelet), themelets.queryByUrl(QUrl::fromLocalFile("/t/Sea.themelet")),
                                      themelets.queryByUrl(QUrl("http://example.com/sea.themelet")) }) {
            QCOMPARE(roles(found, 6), QStringLiteral("%1|file:///t/Sea.themelet|application/x-vorka-themelet|Sea.themelet|/t/Sea.themelet|Sea")
                                              .arg(themelet));
            QCOMPARE(found.data()->data(ThemeletData::ResourcesRole).toMap(), QVariantMap({ { "ringerTone", resource("/r/sea.ogg") } }));
        }
        for (const Content &missing : { files.queryByUrl(QUrl("http://example.com/other.ogg")), files.queryByUrl(QUrl::fromLocalFile("/d/x.ogg")),
                                        themelets.queryByUrl(url), themelets.queryByUrl(QUrl("http://example.com/t.ogg")) })
            QVERIFY(!missing.isValid());
    }

    void photos()
    {
        // By date taken; a file without an image row is no photo. Past the first batch the rows are read from copies:
        // the same values, odd column types included.
        const qint64 late = addFile("/p/late.jpg", "image/jpeg"), early = addFile("/p/early.jpg", "image/jpeg");
        addFile("/p/unread.jpg", "image/jpeg");
        for (int i = 0; i < 60; ++i)
            addFile(QStringLiteral("/p/more/m%1.png").arg(i, 2, 10, QLatin1Char('0')), i % 2 ? "image/png" : "image/jpeg");
        m_db->exec({ QStringLiteral("INSERT INTO image VALUES (%1, '2014-05-02T00:00:00', 64, 48, 6), "
                                    "(%2, '2014-05-01T00:00:00', 1, 2, 0)").arg(late).arg(early),
                     "INSERT INTO image SELECT id, '2015-01-01T00:00:' || substr(fileName, 2, 2), 'wide', 2.5, x'07' FROM file "
                     "WHERE fileName GLOB 'm*'" });
        PhotoQueryAgent photos(*m_database);
        Batches batches;
        QVERIFY(photos.query(&batches, QueryAgent::Parameters()));
        QCOMPARE(batches.sizes, (QList<int> { 50, 12 }));
        QCOMPARE(batches.names.mid(0, 3), (QStringList { "early", "late", "m00" }));
        QCOMPARE(roles(batches.all.at(1), 12), QStringLiteral("%1|file:///p/late.jpg|image/jpeg|late.jpg|/p/late.jpg|late|false|"
                                                              "NULL|2014-05-02T00:00:00.000|64|48|6").arg(late).replace("NULL", QString()));
        QCOMPARE(roles(batches.all.last(), 12).section('|', 1),
                 QString("file:///p/more/m59.png|image/png|m59.png|/p/more/m59.png|m59|false||2015-01-01T00:00:59.000|0|3|0"));
    }

    void batches_data()
    {
        QTest::addColumn<QList<int>>("sizes"); // of the batches; the rows are their sum
        for (const QList<int> &sizes : QList<QList<int>> { { 0 }, { 49 }, { 50, 0 }, { 50, 1 }, { 50, 50, 0 } })
            QTest::addRow("%d", std::accumulate(sizes.cbegin(), sizes.cend(), 0)) << sizes;
    }

    void batches()
    {
        // Resources on the 50th and 51st: a batch ends with the 50th's, the next starts on the 51st's.
        // A resource whose file is gone doesn't stop the merge.
        QFETCH(QList<int>, sizes);
        const int rows = std::accumulate(sizes.cbegin(), sizes.cend(), 0);
        QStringList names;
        m_db->exec("BEGIN");
        for (int i = 1; i <= rows; ++i) {
            const qint64 id = addThemelet((names << QStringLiteral("T%1").arg(i)).last(), false, i);
            if (i == 50)
                m_db->exec(QStringLiteral("INSERT INTO resource VALUES (%1, 'ringerTone', %2)").arg(id).arg(addFile("/r/50.ogg")));
            if (i == 51)
                m_db->exec(QStringLiteral("INSERT INTO resource VALUES (%1, 'ringerTone', 9999), (%1, 'messageTone', %2), (%1, 'homeWallpaper', %3)")
                                   .arg(id).arg(addFile("/r/51.ogg")).arg(addFile("/r/51.jpg", "image/jpeg")));
        }
        m_db->exec("COMMIT");
        Batches batches;
        QVERIFY(ThemeletQueryAgent(*m_database).query(&batches, ThemeletQueryAgent::ThemeletParameters()));
        QCOMPARE(batches.sizes, sizes);
        QCOMPARE(batches.names, names);
        const QVariantMap at50 { { "ringerTone", resource("/r/50.ogg") } };
        const QVariantMap at51 { { "messageTone", resource("/r/51.ogg") }, { "homeWallpaper", resource("/r/51.jpg") } };
        for (int i = 0; i < rows; ++i)
            QCOMPARE(batches.all.at(i).data()->data(ThemeletData::ResourcesRole).toMap(), i == 49 ? at50 : i == 50 ? at51 : QVariantMap());
    }
};

QTEST_GUILESS_MAIN(tst_QueryAgents)
#include "tst_queryagents.moc"
