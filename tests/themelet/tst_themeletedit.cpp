#include "signalrecorder.h"
#include "sysroot.h"
#include "testdatabase.h"
#include "themeletfixture.h"
#include "themeletmanager.h"
#include "themeletsettings.h"

#include <QDateTime>
#include <QFile>
#include <QtTest>

using namespace ThemeletFixture;

namespace {

const QString s_row = QStringLiteral(
        "SELECT file.displayName, favorite, timestamp, homeWallpaper, applicationWallpaper, highlightColor, "
        "secondaryHighlightColor, primaryColor, secondaryColor, ringerVolume, enabledSounds, partnerSpace, version "
        "FROM themelet INNER JOIN file ON themelet.fileId = file.id WHERE fileId = %1");
const QString s_resources = QStringLiteral(
        "SELECT resource.resourceType, directory.path || '/' || file.fileName FROM resource "
        "INNER JOIN file ON resource.resourceId = file.id INNER JOIN directory ON file.directoryId = directory.id "
        "WHERE resource.fileId = %1 ORDER BY resource.resourceType");

QVariantMap resource(const QVariant &url)
{
    return { { QStringLiteral("url"), url } };
}

}

class TestThemeletEdit : public QObject
{
    Q_OBJECT
private slots:
    void initTestCase();
    void init();

    void saveEmptyMap();
    void saveValues();
    void saveFavorite_data();
    void saveFavorite();
    void saveToneBits_data();
    void saveToneBits();
    void saveResources();
    void saveUnknownId();
    void activeThemelet();

    void createNew();
    void createAgainKeepsFavorite();
    void createMoved();
    void remove();
    void themeletFromZefId();
    void installDirName_data();
    void installDirName();

private:
    qint64 readThemelet(const QString &name, const QByteArray &json);
    QString user(const QString &name) const;
    QString row(qint64 id) { return m_db->rows(s_row.arg(id)).value(0); }

    ThemeletManager *m_manager = nullptr;
    QScopedPointer<TestDatabase> m_db;
};

void TestThemeletEdit::initTestCase()
{
    prepareSysroot();
    m_manager = manager();
    QVERIFY(m_manager);
    m_db.reset(new TestDatabase);
    QVERIFY(m_db->isOpen());
}

void TestThemeletEdit::init()
{
    clearIndex(*m_db);
    QDir(user(QString())).removeRecursively();
    SignalRecorder::clear();
}

qint64 TestThemeletEdit::readThemelet(const QString &name, const QByteArray &json)
{
    const qint64 id = addThemelet(*m_db, makePackage(name, { QStringLiteral("w.jpg") }, { QStringLiteral("dusk.ogg") }),
                                  json);
    m_manager->updateMetaData();
    SignalRecorder::clear();
    return id;
}

// A place in the user's own files, outside any package.
QString TestThemeletEdit::user(const QString &name) const
{
    return qEnvironmentVariable("THEMELET_SANDBOX") + QLatin1String("/user/") + name;
}

void TestThemeletEdit::saveEmptyMap()
{
    const qint64 id = readThemelet(QStringLiteral("plain"), R"({"wallpaper": "w.jpg", "displayName": "Plain",
        "highlightColor": "#123456", "partnerSpace": "p", "timestamp": "2014-05-01T12:00:00",
        "ringerToneFile": {"file": "dusk.ogg"}})");
    const QString before = row(id);
    const QStringList resources = m_db->rows(s_resources.arg(id));

    QVERIFY(m_manager->save(id, QVariantMap()));
    QCOMPARE(row(id), before);
    QCOMPARE(m_db->rows(s_resources.arg(id)), resources);
    QCOMPARE(SignalRecorder::calls(), QList<int>()); // the caller tells the clients
}

void TestThemeletEdit::saveValues()
{
    const qint64 id = readThemelet(QStringLiteral("values"), R"({"wallpaper": "w.jpg", "displayName": "Old",
        "partnerSpace": "p", "version": 2, "timestamp": "2014-05-01T12:00:00"})");
    const QString wallpaper = packagePath(QStringLiteral("values/images/w.jpg"));

    const QVariantMap values {
        { QStringLiteral("displayName"), QStringLiteral("New") },
        { QStringLiteral("highlightColor"), QStringLiteral("#ff112233") },
        { QStringLiteral("secondaryHighlightColor"), QStringLiteral("#ff223344") },
        { QStringLiteral("primaryColor"), QStringLiteral("#ff334455") },
        { QStringLiteral("secondaryColor"), QStringLiteral("#ff445566") },
        { QStringLiteral("ringerVolume"), 5 },
        // Not changeable by saving:
        { QStringLiteral("homeWallpaper"), QStringLiteral("/elsewhere.jpg") },
        { QStringLiteral("wallpaperUrl"), QStringLiteral("/elsewhere.jpg") },
        { QStringLiteral("partnerSpace"), QStringLiteral("other") },
        { QStringLiteral("version"), 9 },
        { QStringLiteral("secondaryColors"), QStringLiteral("#ffffffff") },
        { QStringLiteral("ringerVolume_"), QVariant() },
    };
    QVERIFY(m_manager->save(id, values));
    QCOMPARE(row(id), QStringLiteral("New|1|2014-05-01T12:00:00|%1|NULL|#ff112233|#ff223344|#ff334455|#ff445566|5|-1|p|2")
                              .arg(wallpaper));

    // An invalid value leaves the field alone.
    QVERIFY(m_manager->save(id, { { QStringLiteral("ringerVolume"), QVariant() },
                                  { QStringLiteral("favorite"), QVariant() },
                                  { QStringLiteral("ringerToneEnabled"), QVariant() } }));
    QCOMPARE(row(id), QStringLiteral("New|1|2014-05-01T12:00:00|%1|NULL|#ff112233|#ff223344|#ff334455|#ff445566|5|-1|p|2")
                              .arg(wallpaper));
}

void TestThemeletEdit::saveFavorite_data()
{
    QTest::addColumn<int>("wasFavorite");
    QTest::addColumn<QVariant>("favorite");
    QTest::addColumn<int>("isFavorite");
    QTest::addColumn<QString>("timestamp"); // "kept", "now" or "NULL"

    QTest::newRow("on stays on") << 1 << QVariant(true) << 1 << QStringLiteral("kept");
    QTest::newRow("off becomes on") << 0 << QVariant(true) << 1 << QStringLiteral("now");
    QTest::newRow("on becomes off") << 1 << QVariant(false) << 0 << QStringLiteral("NULL");
    QTest::newRow("off stays off") << 0 << QVariant(false) << 0 << QStringLiteral("kept");
    QTest::newRow("no mark given") << 0 << QVariant() << 0 << QStringLiteral("kept");
}

void TestThemeletEdit::saveFavorite()
{
    QFETCH(int, wasFavorite);
    QFETCH(QVariant, favorite);
    QFETCH(int, isFavorite);
    QFETCH(QString, timestamp);

    const QString earlier = QStringLiteral("2014-05-01T12:00:00");
    const qint64 id = readThemelet(QStringLiteral("fav"), QStringLiteral(R"({"wallpaper": "w.jpg", "favorite": %1,
        "timestamp": "%2"})").arg(wasFavorite ? "true" : "false", earlier).toUtf8());

    const QString before = QDateTime::currentDateTimeUtc().addSecs(-1).toString(Qt::ISODate);
    QVERIFY(m_manager->save(id, { { QStringLiteral("favorite"), favorite } }));
    const QString after = QDateTime::currentDateTimeUtc().toString(Qt::ISODate);

    const QStringList stored = m_db->rows(QStringLiteral("SELECT favorite, timestamp FROM themelet"))
                                       .value(0).split(QLatin1Char('|'));
    QCOMPARE(stored.value(0).toInt(), isFavorite);
    if (timestamp == QLatin1String("kept"))
        QCOMPARE(stored.value(1), earlier);
    else if (timestamp == QLatin1String("now"))
        QVERIFY2(stored.value(1) >= before && stored.value(1) <= after, qPrintable(stored.value(1)));
    else
        QCOMPARE(stored.value(1), timestamp);
}

void TestThemeletEdit::saveToneBits_data()
{
    QTest::addColumn<int>("bits");
    QTest::addColumn<QVariantMap>("values");
    QTest::addColumn<int>("expected");

    QTest::newRow("clear bit 0") << -1 << QVariantMap { { "ringerToneEnabled", false } } << -2;
    QTest::newRow("set bit 0") << -2 << QVariantMap { { "ringerToneEnabled", true } } << -1;
    QTest::newRow("two tones") << 127
                               << QVariantMap { { "messageToneEnabled", false }, { "clockAlarmToneEnabled", false } }
                               << 61;
    QTest::newRow("high bits kept") << -1
                                    << QVariantMap { { "ringerToneEnabled", false }, { "messageToneEnabled", false },
                                                     { "mailToneEnabled", false }, { "internetCallToneEnabled", false },
                                                     { "chatToneEnabled", false }, { "calendarToneEnabled", false },
                                                     { "clockAlarmToneEnabled", false } }
                                    << -128;
    QTest::newRow("set from zero") << 0 << QVariantMap { { "chatToneEnabled", true }, { "mailToneEnabled", 0 } } << 16;
}

void TestThemeletEdit::saveToneBits()
{
    QFETCH(int, bits);
    QFETCH(QVariantMap, values);
    QFETCH(int, expected);

    const qint64 id = readThemelet(QStringLiteral("bits"), R"({"wallpaper": "w.jpg"})");
    m_db->exec(QStringLiteral("UPDATE themelet SET enabledSounds = %1").arg(bits));
    QVERIFY(m_manager->save(id, values));
    QCOMPARE(m_db->value(QStringLiteral("SELECT enabledSounds FROM themelet")).toInt(), expected);
}

void TestThemeletEdit::saveResources()
{
    const QString package = packagePath(QStringLiteral("tones"));
    const qint64 id = readThemelet(QStringLiteral("tones"), R"({"wallpaper": "w.jpg",
        "ringerToneFile": {"file": "dusk.ogg"}, "messageToneFile": {"file": "dusk.ogg"},
        "clockAlarmToneFile": {"file": "dusk.ogg"}})");
    writeFile(user(QStringLiteral("a.ogg")), "ogg");
    writeFile(user(QStringLiteral("b b.ogg")), "ogg");
    const QString dusk = package + QLatin1String("/sounds/dusk.ogg");

    const QVariantMap resources {
        { QStringLiteral("ringerToneFile"), resource(QUrl::fromLocalFile(user(QStringLiteral("a.ogg")))) },
        { QStringLiteral("mailToneFile"), resource(user(QStringLiteral("b b.ogg"))) }, // a plain path
        { QStringLiteral("messageToneFile"), resource(QUrl()) },                       // deletes
        { QStringLiteral("chatToneFile"), resource(QUrl(QStringLiteral("http://example.com/x.ogg"))) },
        { QStringLiteral("calendarToneFile"), resource(QUrl::fromLocalFile(user(QStringLiteral("gone.ogg")))) },
        { QStringLiteral("internetCallTone"), resource(QUrl::fromLocalFile(user(QStringLiteral("a.ogg")))) },
    };
    QVERIFY(m_manager->save(id, { { QStringLiteral("resources"), resources } }));

    QCOMPARE(m_db->rows(s_resources.arg(id)),
             (QStringList { QLatin1String("clockAlarmToneFile|") + dusk,
                            QLatin1String("mailToneFile|") + user(QStringLiteral("b b.ogg")),
                            QLatin1String("ringerToneFile|") + user(QStringLiteral("a.ogg")) }));
    // Tone files are registered as plain files.
    QCOMPARE(m_db->value(QStringLiteral("SELECT COUNT(*) FROM file WHERE fileName = 'gone.ogg'")).toInt(), 0);

    const Themelet themelet = m_manager->themeletFromUrl(QUrl::fromLocalFile(package + QLatin1String("/tones.themelet")));
    QCOMPARE(themelet->resources.value(QStringLiteral("ringerToneFile")).toMap().value(QStringLiteral("url")).toUrl(),
             QUrl::fromLocalFile(user(QStringLiteral("a.ogg"))));
}

void TestThemeletEdit::saveUnknownId()
{
    readThemelet(QStringLiteral("known"), R"({"wallpaper": "w.jpg"})");
    const QStringList before = m_db->rows(QStringLiteral("SELECT * FROM themelet"));
    QTest::ignoreMessage(QtWarningMsg, "12345 is not an existing themelet");
    QVERIFY(!m_manager->save(12345, { { QStringLiteral("ringerVolume"), 1 } }));
    QCOMPARE(m_db->rows(QStringLiteral("SELECT * FROM themelet")), before);
}

void TestThemeletEdit::activeThemelet()
{
    const qint64 id = readThemelet(QStringLiteral("active"), R"({"wallpaper": "w.jpg", "ringerVolume": 10})");
    const qint64 otherId = readThemelet(QStringLiteral("other"), R"({"wallpaper": "w.jpg"})");
    QList<Themelet> updates;
    QMetaObject::Connection connection = connect(m_manager, &ThemeletManager::activeThemeletUpdated, this,
                                                 [&updates](const Themelet &themelet) { updates.append(themelet); });

    ThemeletSettings settings(nullptr);
    settings.setSource(QUrl::fromLocalFile(packagePath(QStringLiteral("active/active.themelet"))));
    // The manager hears of the change through the store, in the event loop.
    const auto announced = [&] {
        updates.clear();
        return m_manager->save(id, QVariantMap()) && !updates.isEmpty();
    };
    QTRY_VERIFY(announced());

    updates.clear();
    QVERIFY(m_manager->save(id, { { QStringLiteral("ringerVolume"), 30 } }));
    QCOMPARE(updates.size(), 1);
    QCOMPARE(updates.first()->id, id);
    QCOMPARE(updates.first()->ringerVolume, 30);

    QVERIFY(m_manager->save(otherId, { { QStringLiteral("ringerVolume"), 30 } }));
    QCOMPARE(updates.size(), 1);

    // A re-read of the active file announces it too; one of another file doesn't.
    m_db->exec(QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE id = %1").arg(otherId));
    m_manager->updateMetaData();
    QCOMPARE(updates.size(), 1);
    m_db->exec(QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE id = %1").arg(id));
    m_manager->updateMetaData();
    QCOMPARE(updates.size(), 2);
    QCOMPARE(updates.last()->id, id);

    // Once the settings name no themelet, nothing is announced.
    settings.setSource(QUrl::fromLocalFile(user(QStringLiteral("none.themelet"))));
    QTRY_VERIFY(!announced());
    disconnect(connection);
}

void TestThemeletEdit::createNew()
{
    writeFile(user(QStringLiteral("mine.themelet")), "{}");
    ThemeletData *data = new ThemeletData(0, QUrl::fromLocalFile(user(QStringLiteral("mine.themelet"))));
    Themelet themelet(data);
    data->displayName = QStringLiteral("Mine");
    data->homeWallpaper = user(QStringLiteral("home.jpg"));
    data->applicationWallpaper = user(QStringLiteral("app.jpg"));
    data->highlightColor = QColor(QStringLiteral("#ffcc66"));
    data->secondaryHighlightColor = QColor(QStringLiteral("#80cc9933"));
    data->primaryColor = QColor(Qt::white);
    data->secondaryColor = QColor(Qt::black);
    data->ringerVolume = 40;
    data->enabledSounds = -3;
    data->favorite = true;
    data->partnerSpace = QStringLiteral("partner");
    data->version = 3;
    data->resources.insert(QStringLiteral("ringerToneFile"), resource(QUrl::fromLocalFile(user(QStringLiteral("mine.themelet")))));

    const qint64 id = m_manager->create(themelet);
    QVERIFY(id != 0);
    // Favourite or not, a new row has no timestamp; resources are for save().
    QCOMPARE(row(id), QStringLiteral("Mine|1|NULL|%1|%2|#ffffcc66|#80cc9933|#ffffffff|#ff000000|40|-3|partner|3")
                              .arg(user(QStringLiteral("home.jpg")), user(QStringLiteral("app.jpg"))));
    QCOMPARE(m_db->rows(s_resources.arg(id)), QStringList());
    QCOMPARE(SignalRecorder::calls(), QList<int>());

    // No value, or no file: nothing is made.
    QCOMPARE(m_manager->create(Themelet()), qint64(0));
    QCOMPARE(m_manager->create(Themelet(new ThemeletData(0, QUrl::fromLocalFile(user(QStringLiteral("gone.themelet")))))),
             qint64(0));
}

void TestThemeletEdit::createAgainKeepsFavorite()
{
    writeFile(user(QStringLiteral("again.themelet")), "{}");
    ThemeletData *data = new ThemeletData(0, QUrl::fromLocalFile(user(QStringLiteral("again.themelet"))));
    Themelet themelet(data);
    data->displayName = QStringLiteral("First");
    data->favorite = false;
    const qint64 id = m_manager->create(themelet);
    QVERIFY(id != 0);
    QVERIFY(m_manager->save(id, { { QStringLiteral("favorite"), true } }));
    const QString timestamp = m_db->value(QStringLiteral("SELECT timestamp FROM themelet")).toString();
    QVERIFY(!timestamp.isEmpty());

    data->displayName = QStringLiteral("Second");
    data->ringerVolume = 12;
    data->highlightColor = QColor(Qt::red);
    QCOMPARE(m_manager->create(themelet), id);
    QCOMPARE(row(id), QStringLiteral("Second|1|%1|NULL|NULL|#ffff0000|#ff000000|#ff000000|#ff000000|12|-1|NULL|2")
                              .arg(timestamp));
}

void TestThemeletEdit::createMoved()
{
    writeFile(user(QStringLiteral("old/moved.themelet")), "{}");
    ThemeletData *data = new ThemeletData(0, QUrl::fromLocalFile(user(QStringLiteral("old/moved.themelet"))));
    Themelet themelet(data);
    const qint64 id = m_manager->create(themelet);
    QVERIFY(id != 0);

    writeFile(user(QStringLiteral("new/renamed.themelet")), "{}");
    data->id = id;
    data->url = QUrl::fromLocalFile(user(QStringLiteral("new/renamed.themelet")));
    data->displayName = QStringLiteral("Moved");
    QCOMPARE(m_manager->create(themelet), id);
    QCOMPARE(m_db->rows(QStringLiteral("SELECT directory.path, directory.scope, file.fileName, file.displayName "
                                       "FROM file INNER JOIN directory ON file.directoryId = directory.id "
                                       "WHERE file.id = %1").arg(id)),
             QStringList { user(QStringLiteral("new")) + QLatin1String("|0|renamed.themelet|Moved") });
}

void TestThemeletEdit::remove()
{
    writeFile(user(QStringLiteral("removed.themelet")), "{}");
    writeFile(user(QStringLiteral("home.jpg")), "jpeg");
    writeFile(user(QStringLiteral("app.jpg")), "jpeg");
    ThemeletData *data = new ThemeletData(0, QUrl::fromLocalFile(user(QStringLiteral("removed.themelet"))));
    Themelet themelet(data);
    data->homeWallpaper = user(QStringLiteral("home.jpg"));
    data->applicationWallpaper = user(QStringLiteral("app.jpg"));
    const qint64 id = m_manager->create(themelet);
    QVERIFY(id != 0);
    writeFile(user(QStringLiteral("tone.ogg")), "ogg");
    QVERIFY(m_manager->save(id, { { QStringLiteral("resources"), QVariantMap { { QStringLiteral("ringerToneFile"),
                                      resource(QUrl::fromLocalFile(user(QStringLiteral("tone.ogg")))) } } } }));

    QVERIFY(m_manager->remove(id));
    QVERIFY(!QFile::exists(user(QStringLiteral("home.jpg"))));
    QVERIFY(!QFile::exists(user(QStringLiteral("app.jpg"))));
    QVERIFY(QFile::exists(user(QStringLiteral("removed.themelet"))));
    QCOMPARE(m_db->value(QStringLiteral("SELECT COUNT(*) FROM themelet")).toInt(), 0);
    QCOMPARE(m_db->value(QStringLiteral("SELECT COUNT(*) FROM file WHERE id = %1").arg(id)).toInt(), 1);
    QCOMPARE(m_db->rows(s_resources.arg(id)).size(), 1);

    // Not a themelet: the delete still runs and succeeds.
    QVERIFY(m_manager->remove(id));
    QVERIFY(m_manager->remove(987654));
}

void TestThemeletEdit::themeletFromZefId()
{
    const qint64 id = readThemelet(QStringLiteral("zef"), R"({"wallpaper": "w.jpg", "displayName": "Zef",
        "highlightColor": "#ffcc66", "ringerVolume": 55, "messageToneFile": {"file": "dusk.ogg", "enabled": 0}})");
    m_db->exec(QStringLiteral("INSERT INTO zefid (fileId, zefId) VALUES (%1, 'zef-1')").arg(id));

    QTest::ignoreMessage(QtWarningMsg, "Themelet ThemeletManager::themeletFromZefId(const QString&)");
    QTest::ignoreMessage(QtWarningMsg, "Empty ZEF ID!");
    QVERIFY(m_manager->themeletFromZefId(QString()).isNull());
    QVERIFY(m_manager->themeletFromZefId(QStringLiteral("zef-2")).isNull());

    const Themelet themelet = m_manager->themeletFromZefId(QStringLiteral("zef-1"));
    QVERIFY(!themelet.isNull());
    QCOMPARE(themelet->id, id);
    QCOMPARE(themelet->url, QUrl::fromLocalFile(packagePath(QStringLiteral("zef/zef.themelet"))));
    QCOMPARE(themelet->displayName, QStringLiteral("Zef"));
    QCOMPARE(themelet->highlightColor, QColor(QStringLiteral("#ffcc66")));
    QCOMPARE(themelet->ringerVolume, 55);
    QCOMPARE(themelet->enabledSounds, -3);
    QCOMPARE(themelet->resources.keys(), QStringList { QStringLiteral("messageToneFile") });
}

void TestThemeletEdit::installDirName_data()
{
    QTest::addColumn<QString>("path");
    QTest::addColumn<QString>("name");

    const QString root = Sysroot::path(QStringLiteral("/usr/share/themelet"));
    QTest::newRow("themelet file") << root + "/sunset/sunset.themelet" << QStringLiteral("sunset");
    QTest::newRow("package itself") << root + "/sunset" << QString();
    QTest::newRow("elsewhere") << QStringLiteral("/home/user/sunset/sunset.themelet") << QString();
    QTest::newRow("sibling with a longer name") << root + "s/sunset/x" << QStringLiteral("");
}

void TestThemeletEdit::installDirName()
{
    QFETCH(QString, path);
    QFETCH(QString, name);
    const QString result = m_manager->themeletInstallDirName(path);
    QCOMPARE(result, name);
    QCOMPARE(result.isNull(), name.isNull());
}

QTEST_GUILESS_MAIN(TestThemeletEdit)
#include "tst_themeletedit.moc"
