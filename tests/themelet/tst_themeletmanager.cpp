// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "dconftest.h"
#include "indexfixture.h"
#include "profiledefaults.h"
#include "sysroot.h"
#include "themeletmanager.h"

using namespace Fixture;

static const QString s_resources = "SELECT resourceType, fileName FROM resource JOIN file ON resourceId = file.id ORDER BY resourceType";

static QString package(const QString &name) { return Sysroot::path(QStringLiteral("/usr/share/themelet/")) + name; }
static QString user(const QString &name) { return qEnvironmentVariable("THEMELET_SANDBOX") + "/user/" + name; }

// The timestamp column as an SQL expression, "now" for a time from `since` on.
static QString timestampSince(const QDateTime &since)
{
    return QStringLiteral("CASE WHEN timestamp BETWEEN '%1' AND '%2' THEN 'now' ELSE timestamp END")
            .arg(since.addSecs(-1).toString(Qt::ISODate), QDateTime::currentDateTimeUtc().toString(Qt::ISODate));
}

class tst_ThemeletManager : public QObject
{
    Q_OBJECT

    ThemeletManager *m_manager = nullptr;
    TestDatabase m_db { serviceIndex() };

    // Package <name>: images/w.jpg, sounds/dusk.ogg, a directory sounds/sounds, out.jpg and out.ogg linked outside.
    qint64 addThemelet(const QString &name, const QByteArray &json, bool read = false)
    {
        writeTree(package(name), { "images/w.jpg", "sounds/dusk.ogg", "sounds/sounds/dusk.ogg" });
        const QString outside = user("outside");
        write(outside);
        QFile::link(outside, package(name) + "/images/out.jpg");
        QFile::link(outside, package(name) + "/sounds/out.ogg");
        write(package(name) + '/' + name + ".themelet", json);
        m_db.exec({ QStringLiteral("INSERT INTO directory (path, scope) VALUES ('%1', 2)").arg(package(name)),
                    QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, permissions, metadataCurrent) SELECT MAX(id), "
                                   "'application/x-vorka-themelet', '%1.themelet', 1, 0 FROM directory").arg(name) });
        if (read) {
            m_manager->updateMetaData();
            SignalRecorder::clear();
        }
        return m_db.value(QStringLiteral("SELECT MAX(id) FROM file WHERE fileName = '%1.themelet'").arg(name)).toLongLong();
    }

private slots:
    void initTestCase()
    {
        QLocale::setDefault(QLocale(QStringLiteral("fi_FI")));
        // A themelet's locale catalogue is looked up without a suffix.
        const QString translations = Sysroot::path(QStringLiteral("/usr/share/translations/"));
        QVERIFY(QDir().mkpath(translations));
        QVERIFY(QFile::copy(THEMELET_TEST_CATALOGS "/themelet-sunset-fi.qm", translations + "themelet-sunset-fi"));
        const QString ringer = Sysroot::path(QStringLiteral("/usr/share/sounds/fallback-ringer.ogg"));
        QVERIFY(write(ringer) && write(ProfileDefaults::path(), "[fallback]\nringing.alert.tone=" + ringer.toUtf8() + '\n'));
        QVERIFY(m_manager = static_cast<ThemeletManager *>(ContentManager::managerFromType(1)));
    }
    void init()
    {
        m_db.exec({ "DELETE FROM resource", "DELETE FROM themelet", "DELETE FROM file", "DELETE FROM directory" });
        QVERIFY(QDir(package({})).removeRecursively() && QDir(user({})).removeRecursively());
        SignalRecorder::clear();
    }

    void format_data()
    {
        QTest::addColumn<QByteArray>("json");
        QTest::addColumn<QString>("row"); // name|favorite|ringerVolume|enabledSounds|version|the four colours|partner|timestamp
        QTest::addColumn<QStringList>("resources");
        const auto add = [](const char *tag, const char *keys, const char *row, const QStringList &resources = {}) {
            QTest::newRow(tag) << "{\"wallpaper\": " + QByteArray(keys) + '}' << QString(row) << resources;
        };
        const char *defaults = "NULL|1|80|-1|1|NULL|NULL|NULL|NULL|NULL|now";
        add("wallpaper linked out of the package", R"("out.jpg")", "");
        add("translated, volume 150, not favourite, timestamp normalised, surrogates", R"("w.jpg", "ringerVolume": 150, )"
            R"("favorite": false, "translationCatalog": "themelet-sunset", "displayName": "themelet-la-sunset", )"
            R"("timestamp": "2014-05-01T12:00:00.250Z", "partnerSpace": "a\ud800b\udc00", "highlightColor": "#112233", )"
            R"("secondaryHighlightColor": "#445566", "primaryColor": "#778899", "secondaryColors": "#80aabbcc")",
            "Auringonlasku|0|150|-1|1|#112233|#445566|#778899|#80aabbcc|a\uFFFDb\uFFFD|2014-05-01T12:00:00Z");
        // Only the ringer has a fallback tone.
        add("defaults, enabled false is no number, an empty file falls back", R"("w.jpg", "ringerToneFile": {"enabled": 1}, )"
            R"("messageToneFile": {"file": "dusk.ogg", "enabled": false})", defaults,
            { "messageToneFile|dusk.ogg", "ringerToneFile|fallback-ringer.ogg" });
        // A catalogue is no path.
        add("disabled: an empty file, a kept resource", R"("w.jpg", "ringerToneFile": {"file": "", "enabled": 0}, )"
            R"("messageToneFile": {"file": "dusk.ogg", "enabled": 0}, "translationCatalog": "../translations/themelet-sunset", )"
            R"("displayName": "themelet-la-sunset")", "themelet-la-sunset|1|80|-4|1|NULL|NULL|NULL|NULL|NULL|now",
            { "messageToneFile|dusk.ogg" });
        add("tone files .., a directory, a link out", R"("w.jpg", "ringerToneFile": {"file": ".."}, )"
            R"("messageToneFile": {"file": "sounds"}, "mailToneFile": {"file": "out.ogg"})", defaults);
        add("wrong types everywhere", R"("w.jpg", "displayName": 5, "translationCatalog": [], "favorite": "no", )"
            R"("highlightColor": {"a": 1}, "ringerVolume": 60.5, "partnerSpace": 7, "timestamp": "yesterday", "version": "3", )"
            R"("ringerToneFile": [1], "messageToneFile": {"file": 5, "enabled": "0"})", "NULL|1|80|-1|0||NULL|NULL|NULL|NULL|now");
    }

    void format()
    {
        QFETCH(QByteArray, json);
        QFETCH(QString, row);
        QFETCH(QStringList, resources);
        const QDateTime since = QDateTime::currentDateTimeUtc();
        addThemelet("edge", json);
        QCOMPARE(m_manager->updateMetaData(), false);
        QCOMPARE(SignalRecorder::calls(), QList<int> { 1 });
        QCOMPARE(m_db.rows("SELECT displayName, favorite, ringerVolume, enabledSounds, version, highlightColor, secondaryHighlightColor, "
                           "primaryColor, secondaryColor, partnerSpace, " + timestampSince(since) + " FROM themelet JOIN file ON fileId = id"),
                 row.isEmpty() ? QStringList() : QStringList { row });
        QCOMPARE(m_db.rows(s_resources), resources);
    }

    void malformed_data()
    {
        QTest::addColumn<QByteArray>("content");
        QTest::addColumn<QStringList>("warnings"); // patterns of the records, in order
        QTest::addColumn<QStringList>("files");    // fileName|ringerVolume|metadataCurrent afterwards
        const QString parse = "^Failed to parse themelet file \"" + QRegularExpression::escape(package("bad"))
                + "/bad\\.themelet\" , jsonError: %1 , jsonOffset: %2$";
        QTest::newRow("root array") << QByteArray(R"([{"wallpaper": "w.jpg"}])") << QStringList { parse.arg(0).arg(0) }
                << QStringList { "bad.themelet|NULL|1", "good.themelet|42|1" };
        // Too large to read, not malformed; with a row, the merge's later entries go to the inserts and fail on the key.
        QTest::newRow("too large, with a row") << QByteArray(R"({"wallpaper": "w.jpg"})").append(4 << 20, ' ')
                << QStringList { "^Skipping a file of more than 4194304 bytes \"" + QRegularExpression::escape(package("bad")) + "/bad\\.themelet\"$" }
                        + failure("virtual bool ThemeletManager::updateMetaData()", "Failed to execute m_insertThemelet.",
                                  "INSERT INTO themelet ( fileId,")
                << QStringList { "bad.themelet|41|0", "good.themelet|42|0" };
    }

    // Bad input doesn't hold up the file after it in the batch.
    void malformed()
    {
        QFETCH(QByteArray, content);
        QFETCH(QStringList, warnings);
        QFETCH(QStringList, files);
        const qint64 bad = addThemelet("bad", content);
        // The good file's row shows that the merge passes over a deleted one.
        const qint64 good = addThemelet("good", R"({"wallpaper": "w.jpg"})");
        m_db.exec(QStringLiteral("INSERT INTO themelet (fileId, ringerVolume) VALUES (%1, 41), (%2, 42)").arg(bad).arg(good));

        MessageLog log(false);
        QCOMPARE(m_manager->updateMetaData(), false);
        compareWarnings(log, warnings);
        QCOMPARE(m_db.rows("SELECT fileName, ringerVolume, metadataCurrent FROM file LEFT JOIN themelet ON fileId = id"), files);
        QCOMPARE(SignalRecorder::calls().size(), files[1].endsWith("|1") ? 1 : 0); // announced unless rolled back
    }

    // A re-read takes wallpaper, version, tones and the name from the file, the rest from the row.
    void reread()
    {
        QVERIFY(writeTree(package("re"), { "images/b.jpg", "sounds/chime.ogg" }));
        addThemelet("re", R"({"wallpaper": "w.jpg", "displayName": "Old", "version": 1, )"
            R"("ringerToneFile": {"file": "dusk.ogg"}, "messageToneFile": {"file": "dusk.ogg"}})", true);
        m_db.exec("UPDATE themelet SET favorite = 0, ringerVolume = 33, highlightColor = '#ff00ff00', enabledSounds = -5, "
                  "timestamp = '2020-01-01T00:00:00Z', partnerSpace = 'user', applicationWallpaper = '/x/app.jpg'");
        write(package("re") + "/re.themelet", R"({"wallpaper": "b.jpg", "displayName": "New", "version": 5, "ringerVolume": 90, )"
            R"("favorite": true, "highlightColor": "#222222", "partnerSpace": "new", )"
            R"("ringerToneFile": {"file": "chime.ogg", "enabled": 0}})");
        QVERIFY(m_db.exec("UPDATE file SET metadataCurrent = 0") && !m_manager->updateMetaData());
        QCOMPARE(m_db.rows("SELECT displayName, homeWallpaper, applicationWallpaper, favorite, timestamp, ringerVolume, enabledSounds, "
                           "highlightColor, partnerSpace, version FROM themelet JOIN file ON fileId = id"),
                 QStringList { "New|" + package("re") + "/images/b.jpg|NULL|0|2020-01-01T00:00:00Z|33|-5|#ff00ff00|user|5" });
        QCOMPARE(m_db.rows(s_resources), QStringList { "ringerToneFile|chime.ogg" });
    }

    // Invalid files count like any others: 101 files make a full batch, with more to come, and then one more.
    void batchSize()
    {
        for (int i = 0; i < 101; ++i)
            addThemelet(QString::number(i), "{}");
        QVERIFY(m_manager->updateMetaData() && !m_manager->updateMetaData());
        QCOMPARE(SignalRecorder::calls(), (QList<int> { 1, 1 }));
    }

    void save_data()
    {
        QTest::addColumn<QString>("before"); // assignments to the row before saving
        QTest::addColumn<QVariantMap>("values");
        // name|favorite|timestamp|wallpaper kept|highlight|secondary|volume|enabledSounds|partnerSpace|version
        QTest::addColumn<QString>("row");
        QTest::addColumn<QStringList>("resources");
        const auto add = [](const char *tag, const char *before, const QVariantMap &values, const char *row, const QStringList &resources =
                { "clockAlarmToneFile|dusk.ogg", "messageToneFile|dusk.ogg", "ringerToneFile|dusk.ogg" }) {
            QTest::newRow(tag) << QString(before) << values << QString(row) << resources;
        };
        add("values", "", { { "displayName", "New" }, { "highlightColor", "#ff112233" }, { "secondaryColor", "#ff445566" },
                            { "secondaryColors", "#ffffffff" }, { "ringerVolume", 5 }, { "homeWallpaper", "/x.jpg" },
                            { "partnerSpace", "other" }, { "version", 9 }, { "favorite", QVariant() } },
            "New|1|2014-05-01T12:00:00|1|#ff112233|#ff445566|5|-1|p|1");
        add("favourite off; tones off, high bits kept", "", { { "favorite", false }, { "messageToneEnabled", false },
            { "clockAlarmToneEnabled", 0 } }, "Plain|0|NULL|1|NULL|NULL|80|-67|p|1");
        const auto url = [](const QVariant &url) { return QVariantMap { { "url", url } }; };
        add("favourite on; resources", "favorite = 0", { { "favorite", true }, { "resources", QVariantMap {
                { "ringerToneFile", url(QUrl::fromLocalFile(user("a.ogg"))) },
                { "mailToneFile", url(user("b b.ogg")) }, // a plain path
                { "messageToneFile", url(QUrl()) },       // deletes
                { "chatToneFile", url(QUrl("http://example.com/x.ogg")) },
                { "calendarToneFile", url(QUrl::fromLocalFile(user("gone.ogg"))) } } } },
            "Plain|1|now|1|NULL|NULL|80|-1|p|1", { "clockAlarmToneFile|dusk.ogg", "mailToneFile|b b.ogg", "ringerToneFile|a.ogg" });
    }

    void save()
    {
        QFETCH(QString, before);
        QFETCH(QVariantMap, values);
        QFETCH(QString, row);
        QFETCH(QStringList, resources);
        QVERIFY(writeTree(user({}), { "a.ogg", "b b.ogg" }));
        const qint64 id = addThemelet("plain", R"({"wallpaper": "w.jpg", "displayName": "Plain", "partnerSpace": "p", "timestamp": )"
            R"("2014-05-01T12:00:00", "ringerToneFile": {"file": "dusk.ogg"}, "messageToneFile": {"file": "dusk.ogg"}, )"
            R"("clockAlarmToneFile": {"file": "dusk.ogg"}})", true);
        if (!before.isEmpty())
            m_db.exec("UPDATE themelet SET " + before);
        const QDateTime since = QDateTime::currentDateTimeUtc();
        QVERIFY(m_manager->save(id, values));
        QCOMPARE(m_db.rows("SELECT displayName, favorite, " + timestampSince(since) + ", homeWallpaper LIKE '%/images/w.jpg', "
                           "highlightColor, secondaryColor, ringerVolume, enabledSounds, partnerSpace, version FROM themelet "
                           "JOIN file ON fileId = file.id"), QStringList { row });
        QCOMPARE(m_db.rows(s_resources), resources);
        QCOMPARE(SignalRecorder::calls(), QList<int>()); // the caller tells the clients
    }

    // The source signals once per change, from the store (a setter that signalled too would count twice), also after another
    // item of its key went before the notice. The manager follows the source: a save or a re-read of the active themelet
    // announces it, a save of another doesn't.
    void activeThemelet()
    {
        ThemeletSettings settings;
        QSignalSpy source(&settings, &ThemeletSettings::sourceChanged), home(&settings, &ThemeletSettings::homeImageChanged);
        std::unique_ptr<ThemeletSettings>(new ThemeletSettings)->setSource(QUrl("file:///t/sun set.themelet"));
        QVERIFY(DConfTest::barrier());
        QCOMPARE(settings.source(), QUrl("file:///t/sun set.themelet"));
        QVERIFY(source.count() == 1 && home.count() == 0);

        const qint64 id = addThemelet("active", R"({"wallpaper": "w.jpg"})", true);
        const qint64 other = addThemelet("other", R"({"wallpaper": "w.jpg"})", true);
        QList<Themelet> updates;
        QObject context;
        connect(m_manager, &ThemeletManager::activeThemeletUpdated, &context, [&](const Themelet &t) { updates << t; });
        const QString active = package("active") + "/active.themelet";
        DConfTest::write("/desktop/lunda/background/portrait/picture_filename", '\'' + active + '\''); // by another process
        QVERIFY(DConfTest::barrier());
        QCOMPARE(source.count(), 2);
        QVERIFY(m_manager->save(id, { { "ringerVolume", 30 } }) && m_manager->save(other, { { "ringerVolume", 30 } }));
        QVERIFY(m_db.exec("UPDATE file SET metadataCurrent = 0") && !m_manager->updateMetaData());
        QCOMPARE(updates.size(), 2);
        QVERIFY(updates[0]->ringerVolume == 30 && updates[1]->id == id);
    }

    void createAndRemove()
    {
        QVERIFY(writeTree(user({}), { "old/mine.themelet", "new/moved.themelet", "home.jpg", "app.jpg" }));
        ThemeletData *data = new ThemeletData(0, QUrl::fromLocalFile(user("old/mine.themelet")));
        const Themelet themelet(data);
        data->displayName = "Mine";
        data->homeWallpaper = user("home.jpg");
        data->applicationWallpaper = user("app.jpg");
        data->highlightColor = QColor("#80cc9933");
        data->favorite = true;
        const QString select = "SELECT path, fileName, displayName, favorite, timestamp, highlightColor, secondaryColor, ringerVolume, "
                               "applicationWallpaper FROM themelet JOIN file ON fileId = file.id JOIN directory ON directoryId = "
                               "directory.id";
        QString row = user("%1|%2|1|NULL|#80cc9933|#ff000000|%3|") + user("app.jpg");
        const qint64 id = m_manager->create(themelet);
        QCOMPARE(m_db.rows(select), QStringList { row.arg("old|mine.themelet", "Mine").arg(80) }); // favourite, no time

        // Again: the user's favourite mark and its time stay. With the id known, a new url moves the row.
        m_db.exec("UPDATE themelet SET favorite = 0, timestamp = '2020-01-01T00:00:00Z'");
        row.replace("|1|NULL|", "|0|2020-01-01T00:00:00Z|");
        data->ringerVolume = 12;
        QCOMPARE(m_manager->create(themelet), id);
        QCOMPARE(m_db.rows(select), QStringList { row.arg("old|mine.themelet", "Mine").arg(12) });
        data->id = id;
        data->url = QUrl::fromLocalFile(user("new/moved.themelet"));
        data->displayName = "Moved";
        QCOMPARE(m_manager->create(themelet), id);
        QCOMPARE(m_db.rows(select), QStringList { row.arg("new|moved.themelet", "Moved").arg(12) });
        // A url that names no local file moves nothing.
        data->url = QUrl("http://example.com/moved.themelet");
        QCOMPARE(m_manager->create(themelet), 0);
        QCOMPARE(m_db.rows(select), QStringList { row.arg("new|moved.themelet", "Moved").arg(12) });

        // Removal deletes the wallpapers and the row, and keeps the file and its row; with no themelet the delete still runs.
        QVERIFY(m_manager->remove(id) && m_manager->remove(id));
        QVERIFY(!QFile::exists(user("home.jpg")) && !QFile::exists(user("app.jpg")) && QFile::exists(user("new/moved.themelet")));
        QCOMPARE(m_db.rows("SELECT fileName, fileId FROM file LEFT JOIN themelet ON fileId = id"), QStringList { "moved.themelet|NULL" });
        // One read from a file has no application wallpaper; the empty path is tried all the same.
        const qint64 read = addThemelet("read", R"({"wallpaper": "w.jpg"})", true);
        QVERIFY(m_manager->remove(read) && !QFile::exists(package("read") + "/images/w.jpg"));
    }
};

QTEST_GUILESS_MAIN(tst_ThemeletManager)
#include "tst_themeletmanager.moc"
