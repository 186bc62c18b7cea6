#include "signalrecorder.h"
#include "testdatabase.h"
#include "themeletfixture.h"
#include "themeletmanager.h"

#include <QDateTime>
#include <QFile>
#include <QJsonParseError>
#include <QLocale>
#include <QRegularExpression>
#include <QtTest>

#include <sys/stat.h>

using namespace ThemeletFixture;

namespace {

const QString s_rowColumns = QStringLiteral(
        "SELECT favorite, ringerVolume, enabledSounds, version, highlightColor, secondaryColor, partnerSpace "
        "FROM themelet");
const QString s_resources = QStringLiteral(
        "SELECT resource.resourceType, file.fileName FROM resource INNER JOIN file ON resource.resourceId = file.id "
        "ORDER BY resource.resourceType");

void expectParseFailure(const QString &path, const QString &error, const QString &offset)
{
    QTest::ignoreMessage(QtWarningMsg,
                         QRegularExpression(QLatin1String("^Failed to parse themelet file ")
                                            + QRegularExpression::escape(QLatin1Char('"') + path + QLatin1Char('"'))
                                            + QLatin1String(" , jsonError: ") + error
                                            + QLatin1String(" , jsonOffset: ") + offset + QLatin1Char('$')));
}

}

class TestThemeletUpdate : public QObject
{
    Q_OBJECT
private slots:
    void initTestCase();
    void init();

    void sunset();
    void format_data();
    void format();
    void translation_data();
    void translation();
    void catalogueKeptAcrossFiles();
    void malformed_data();
    void malformed();
    void unreadable();
    void reread_data();
    void reread();
    void invalidRereadDeletesRow();
    void batchSize_data();
    void batchSize();
    void unopenableRollsBack();

private:
    QString value(const QString &statement) { return m_db->value(statement).toString(); }

    ThemeletManager *m_manager = nullptr;
    QScopedPointer<TestDatabase> m_db;
};

void TestThemeletUpdate::initTestCase()
{
    QLocale::setDefault(QLocale(QStringLiteral("fi_FI")));
    prepareSysroot();
    m_manager = manager();
    QVERIFY(m_manager);
    m_db.reset(new TestDatabase);
    QVERIFY(m_db->isOpen());
}

void TestThemeletUpdate::init()
{
    clearIndex(*m_db);
    SignalRecorder::clear();
}

void TestThemeletUpdate::sunset()
{
    const QString package = makePackage(QStringLiteral("sunset"), { QStringLiteral("sunset.jpg") },
                                        { QStringLiteral("dusk.ogg") });
    const qint64 id = addThemelet(*m_db, package, R"({
        "wallpaper": "sunset.jpg",
        "displayName": "themelet-la-sunset",
        "translationCatalog": "themelet-sunset",
        "highlightColor": "#ffcc66",
        "secondaryHighlightColor": "#cc9933",
        "primaryColor": "#ffffff",
        "secondaryColors": "#b0ffffff",
        "ringerVolume": 60,
        "timestamp": "2014-05-01T12:00:00",
        "version": 2,
        "ringerToneFile": { "file": "dusk.ogg", "enabled": 1 },
        "messageToneFile": { "enabled": 0 }
    })");

    QCOMPARE(m_manager->updateMetaData(), false);
    QCOMPARE(SignalRecorder::calls(), QList<int> { 1 });

    QCOMPARE(m_db->rows(QStringLiteral(
                     "SELECT fileId, homeWallpaper, applicationWallpaper, favorite, highlightColor, "
                     "secondaryHighlightColor, primaryColor, secondaryColor, ringerVolume, enabledSounds, "
                     "timestamp, version FROM themelet")),
             QStringList { QStringLiteral("%1|%2/images/sunset.jpg|NULL|1|#ffcc66|#cc9933|#ffffff|#b0ffffff|60|-3|"
                                          "2014-05-01T12:00:00|2").arg(id).arg(package) });
    QCOMPARE(m_db->rows(QStringLiteral("SELECT displayName, metadataCurrent FROM file WHERE id = %1").arg(id)),
             QStringList { QStringLiteral("Auringonlasku|1") });
    QCOMPARE(m_db->rows(QStringLiteral("SELECT fileId, resourceType FROM resource")),
             QStringList { QStringLiteral("%1|ringerToneFile").arg(id) });

    const Themelet themelet = m_manager->themeletFromUrl(QUrl::fromLocalFile(package + "/sunset.themelet"));
    QVERIFY(!themelet.isNull());
    QCOMPARE(themelet->id, id);
    QCOMPARE(themelet->resources.keys(), QStringList { QStringLiteral("ringerToneFile") });
}

void TestThemeletUpdate::format_data()
{
    QTest::addColumn<QByteArray>("json");
    QTest::addColumn<QString>("row"); // favorite|ringerVolume|enabledSounds|version|highlight|secondary|partnerSpace
    QTest::addColumn<QString>("timestamp"); // empty: the batch's own time
    QTest::addColumn<QStringList>("resources");

    const QString invalid;
    const QString defaults = QStringLiteral("1|80|-1|1|NULL|NULL|NULL");
    const QStringList none;

    QTest::newRow("only wallpaper") << QByteArray(R"({"wallpaper": "w.jpg"})") << defaults << QString() << none;
    QTest::newRow("slash in wallpaper") << QByteArray(R"({"wallpaper": "images/w.jpg"})") << invalid << QString() << none;
    QTest::newRow("missing wallpaper file") << QByteArray(R"({"wallpaper": "gone.jpg"})") << invalid << QString() << none;
    QTest::newRow("no wallpaper") << QByteArray(R"({"Wallpaper": "w.jpg"})") << invalid << QString() << none;

    QTest::newRow("version 2") << QByteArray(R"({"wallpaper": "w.jpg", "version": 2})")
                               << QStringLiteral("1|80|-1|2|NULL|NULL|NULL") << QString() << none;
    QTest::newRow("version as text") << QByteArray(R"({"wallpaper": "w.jpg", "version": "3"})")
                                     << QStringLiteral("1|80|-1|0|NULL|NULL|NULL") << QString() << none;

    QTest::newRow("volume fraction") << QByteArray(R"({"wallpaper": "w.jpg", "ringerVolume": 80.5})")
                                     << defaults << QString() << none;
    QTest::newRow("volume 150") << QByteArray(R"({"wallpaper": "w.jpg", "ringerVolume": 150})")
                                << QStringLiteral("1|150|-1|1|NULL|NULL|NULL") << QString() << none;

    QTest::newRow("favorite false") << QByteArray(R"({"wallpaper": "w.jpg", "favorite": false})")
                                    << QStringLiteral("0|80|-1|1|NULL|NULL|NULL") << QString() << none;

    QTest::newRow("colours, plural key")
            << QByteArray(R"({"wallpaper": "w.jpg", "highlightColor": "#ffcc66", "secondaryColor": "#111111",
                             "secondaryColors": "#b0ffffff", "partnerSpace": "partner"})")
            << QStringLiteral("1|80|-1|1|#ffcc66|#b0ffffff|partner") << QString() << none;

    QTest::newRow("enabled false is no number")
            << QByteArray(R"({"wallpaper": "w.jpg", "ringerToneFile": {"file": "dusk.ogg", "enabled": false}})")
            << defaults << QString() << QStringList { QStringLiteral("ringerToneFile|dusk.ogg") };
    QTest::newRow("enabled 0 keeps the resource")
            << QByteArray(R"({"wallpaper": "w.jpg", "ringerToneFile": {"file": "dusk.ogg", "enabled": 0}})")
            << QStringLiteral("1|80|-2|1|NULL|NULL|NULL") << QString()
            << QStringList { QStringLiteral("ringerToneFile|dusk.ogg") };
    QTest::newRow("empty file falls back")
            << QByteArray(R"({"wallpaper": "w.jpg", "ringerToneFile": {"enabled": 1}})")
            << defaults << QString() << QStringList { QStringLiteral("ringerToneFile|fallback-ringer.ogg") };
    QTest::newRow("disabled tone with empty file")
            << QByteArray(R"({"wallpaper": "w.jpg", "ringerToneFile": {"file": "", "enabled": 0}})")
            << QStringLiteral("1|80|-2|1|NULL|NULL|NULL") << QString() << none;
    QTest::newRow("empty tone object")
            << QByteArray(R"({"wallpaper": "w.jpg", "ringerToneFile": {}})") << defaults << QString() << none;
    QTest::newRow("slash in tone file")
            << QByteArray(R"({"wallpaper": "w.jpg", "ringerToneFile": {"file": "sounds/dusk.ogg"}})")
            << defaults << QString() << none;
    QTest::newRow("bits in table order")
            << QByteArray(R"({"wallpaper": "w.jpg", "messageToneFile": {"enabled": 0},
                             "clockAlarmToneFile": {"file": "dusk.ogg", "enabled": 0},
                             "chatToneFile": {"file": "dusk.ogg", "enabled": 7}})")
            << QStringLiteral("1|80|-67|1|NULL|NULL|NULL") << QString()
            << QStringList { QStringLiteral("chatToneFile|dusk.ogg"), QStringLiteral("clockAlarmToneFile|dusk.ogg") };

    QTest::newRow("timestamp not ISO")
            << QByteArray(R"({"wallpaper": "w.jpg", "timestamp": "yesterday"})") << defaults << QString() << none;
    QTest::newRow("timestamp normalised")
            << QByteArray(R"({"wallpaper": "w.jpg", "timestamp": "2014-05-01T12:00:00.250Z"})") << defaults
            << QStringLiteral("2014-05-01T12:00:00Z") << none;

    QTest::newRow("wrong types everywhere")
            << QByteArray(R"({"wallpaper": "w.jpg", "displayName": 5, "translationCatalog": [], "favorite": "no",
                             "highlightColor": {"a": 1}, "secondaryColors": [1, 2], "ringerVolume": "60",
                             "partnerSpace": 7, "timestamp": 12, "version": null, "ringerToneFile": [1],
                             "messageToneFile": {"file": 5, "enabled": "0"}, "mailToneFile": null})")
            << QStringLiteral("1|80|-1|0|||NULL") << QString() << none;
}

void TestThemeletUpdate::format()
{
    QFETCH(QByteArray, json);
    QFETCH(QString, row);
    QFETCH(QString, timestamp);
    QFETCH(QStringList, resources);

    const QString package = makePackage(QStringLiteral("edge"), { QStringLiteral("w.jpg"), QStringLiteral("images/w.jpg") },
                                        { QStringLiteral("dusk.ogg"), QStringLiteral("sounds/dusk.ogg") });
    const qint64 id = addThemelet(*m_db, package, json);
    const QString before = QDateTime::currentDateTimeUtc().addSecs(-1).toString(Qt::ISODate);
    QCOMPARE(m_manager->updateMetaData(), false);
    const QString after = QDateTime::currentDateTimeUtc().toString(Qt::ISODate);

    QCOMPARE(value(QStringLiteral("SELECT metadataCurrent FROM file WHERE id = %1").arg(id)), QStringLiteral("1"));
    QCOMPARE(SignalRecorder::calls(), QList<int> { 1 });
    if (row.isNull()) {
        QCOMPARE(m_db->rows(s_rowColumns), QStringList());
        return;
    }
    QCOMPARE(m_db->rows(s_rowColumns), QStringList { row });
    QCOMPARE(value(QStringLiteral("SELECT homeWallpaper FROM themelet")), package + QLatin1String("/images/w.jpg"));
    QCOMPARE(m_db->rows(s_resources), resources);

    const QString stored = value(QStringLiteral("SELECT timestamp FROM themelet"));
    if (timestamp.isEmpty()) {
        QVERIFY2(stored >= before && stored <= after && stored.endsWith(QLatin1Char('Z')), qPrintable(stored));
    } else {
        QCOMPARE(stored, timestamp);
    }
}

void TestThemeletUpdate::translation_data()
{
    QTest::addColumn<QString>("locale");
    QTest::addColumn<QString>("catalog");
    QTest::addColumn<QString>("source");
    QTest::addColumn<QString>("name");

    const QString fi = QStringLiteral("fi_FI");
    const QString catalog = QStringLiteral("themelet-sunset");
    const QString sunset = QStringLiteral("themelet-la-sunset");
    QTest::newRow("locale catalogue") << fi << catalog << sunset << QStringLiteral("Auringonlasku");
    QTest::newRow("empty translation falls back")
            << fi << catalog << QStringLiteral("themelet-la-dusk") << QStringLiteral("Dusk");
    QTest::newRow("in no catalogue")
            << fi << catalog << QStringLiteral("themelet-la-dawn") << QStringLiteral("themelet-la-dawn");
    QTest::newRow("engineering catalogue alone")
            << QStringLiteral("de_DE") << catalog << sunset << QStringLiteral("Sunset");
    QTest::newRow("missing catalogues") << fi << QStringLiteral("themelet-gone") << sunset << sunset;
    QTest::newRow("no catalogue") << fi << QString() << sunset << sunset;
}

void TestThemeletUpdate::translation()
{
    QFETCH(QString, locale);
    QFETCH(QString, catalog);
    QFETCH(QString, source);
    QFETCH(QString, name);

    const QLocale previous;
    QLocale::setDefault(QLocale(locale));
    const QByteArray json = QStringLiteral(R"({"wallpaper": "w.jpg", "translationCatalog": "%1", "displayName": "%2"})")
                                    .arg(catalog, source).toUtf8();
    const qint64 id = addThemelet(*m_db, makePackage(QStringLiteral("named")), json);
    m_manager->updateMetaData();
    QLocale::setDefault(previous);

    QCOMPARE(value(QStringLiteral("SELECT displayName FROM file WHERE id = %1").arg(id)), name);
}

void TestThemeletUpdate::catalogueKeptAcrossFiles()
{
    // One batch, in directory order: after a file without catalogue, the same
    // catalogue named again stays untranslated for the rest of the batch.
    const QByteArray translated = R"({"wallpaper": "w.jpg", "translationCatalog": "themelet-sunset",
                                      "displayName": "themelet-la-sunset"})";
    const qint64 first = addThemelet(*m_db, makePackage(QStringLiteral("a")), translated);
    const qint64 second = addThemelet(*m_db, makePackage(QStringLiteral("b")), R"({"wallpaper": "w.jpg",
                                      "displayName": "themelet-la-sunset"})");
    const qint64 third = addThemelet(*m_db, makePackage(QStringLiteral("c")), translated);
    m_manager->updateMetaData();

    const QString names = QStringLiteral("SELECT displayName FROM file WHERE id IN (%1, %2, %3) ORDER BY id")
                                  .arg(first).arg(second).arg(third);
    QCOMPARE(m_db->rows(names), (QStringList { QStringLiteral("Auringonlasku"), QStringLiteral("themelet-la-sunset"),
                                               QStringLiteral("themelet-la-sunset") }));

    // A new batch starts with nothing remembered.
    m_db->exec(QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE id = %1").arg(third));
    m_manager->updateMetaData();
    QCOMPARE(value(QStringLiteral("SELECT displayName FROM file WHERE id = %1").arg(third)),
             QStringLiteral("Auringonlasku"));
}

void TestThemeletUpdate::malformed_data()
{
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QString>("error");
    QTest::addColumn<QString>("offset");

    const QString any = QStringLiteral("\\d+");
    const auto error = [](QJsonParseError::ParseError error) { return QString::number(error); };
    QTest::newRow("root array") << QByteArray(R"([{"wallpaper": "w.jpg"}])") << QStringLiteral("0")
                                << QStringLiteral("0");
    QTest::newRow("truncated") << QByteArray(R"({"wallpaper": "w.jpg",)") << any << any;
    QTest::newRow("not UTF-8") << QByteArray("{\"wallpaper\": \"w\xff\xfe.jpg\"}")
                               << error(QJsonParseError::IllegalUTF8String) << any;
    QTest::newRow("deeply nested") << QByteArray(R"({"wallpaper": "w.jpg", "x": )") + QByteArray(100000, '[')
                                   << error(QJsonParseError::DeepNesting) << any;
    QTest::newRow("huge") << QByteArray(R"({"wallpaper": "w.jpg", "displayName": ")") + QByteArray(6 << 20, 'a')
                                     + QByteArray("\"}")
                          << error(QJsonParseError::UnterminatedString) << any;
}

void TestThemeletUpdate::malformed()
{
    QFETCH(QByteArray, content);
    QFETCH(QString, error);
    QFETCH(QString, offset);

    // A malformed file loses the row it had and doesn't hold up the rest of the batch.
    const QString bad = makePackage(QStringLiteral("bad"));
    const qint64 badId = addThemelet(*m_db, bad, content);
    m_db->exec(QStringLiteral("INSERT INTO themelet (fileId, favorite) VALUES (%1, 1)").arg(badId));
    const qint64 goodId = addThemelet(*m_db, makePackage(QStringLiteral("good")), R"({"wallpaper": "w.jpg"})");
    m_db->exec(QStringLiteral("INSERT INTO themelet (fileId, ringerVolume) VALUES (%1, 42)").arg(goodId));

    expectParseFailure(bad + QLatin1String("/bad.themelet"), error, offset);
    QCOMPARE(m_manager->updateMetaData(), false);

    // The merge passes over the deleted row and still matches the next one.
    QCOMPARE(m_db->rows(QStringLiteral("SELECT fileId, ringerVolume FROM themelet")),
             QStringList { QStringLiteral("%1|42").arg(goodId) });
    QCOMPARE(m_db->rows(QStringLiteral("SELECT metadataCurrent FROM file ORDER BY id")),
             (QStringList { QStringLiteral("1"), QStringLiteral("1") }));
}

void TestThemeletUpdate::unreadable()
{
    // A file that can't be opened counts as read and keeps whatever row it has.
    const QString package = makePackage(QStringLiteral("dir"));
    QDir().mkpath(package + QLatin1String("/dir.themelet"));
    const qint64 directoryId = addThemeletFile(*m_db, package, QStringLiteral("dir.themelet"));
    m_db->exec(QStringLiteral("INSERT INTO themelet (fileId, ringerVolume) VALUES (%1, 42)").arg(directoryId));
    const qint64 missingId = addThemeletFile(*m_db, package, QStringLiteral("gone.themelet"));
    // Opening a FIFO without a writer would block.
    QCOMPARE(::mkfifo(QFile::encodeName(package + QLatin1String("/fifo.themelet")).constData(), 0644), 0);
    const qint64 fifoId = addThemeletFile(*m_db, package, QStringLiteral("fifo.themelet"));

    QCOMPARE(m_manager->updateMetaData(), false);
    QCOMPARE(m_db->rows(QStringLiteral("SELECT fileId, ringerVolume FROM themelet")),
             QStringList { QStringLiteral("%1|42").arg(directoryId) });
    QCOMPARE(m_db->rows(QStringLiteral("SELECT id, metadataCurrent FROM file ORDER BY id")),
             (QStringList { QStringLiteral("%1|1").arg(directoryId), QStringLiteral("%1|1").arg(missingId),
                            QStringLiteral("%1|1").arg(fifoId) }));
}

void TestThemeletUpdate::reread_data()
{
    QTest::addColumn<QString>("displayName");
    QTest::addColumn<QString>("expected");
    QTest::newRow("new name") << QStringLiteral("New name") << QStringLiteral("New name");
    QTest::newRow("empty name keeps the old") << QString() << QStringLiteral("Old name");
}

void TestThemeletUpdate::reread()
{
    QFETCH(QString, displayName);
    QFETCH(QString, expected);

    const QString package = makePackage(QStringLiteral("re"), { QStringLiteral("a.jpg"), QStringLiteral("b.jpg") },
                                        { QStringLiteral("dusk.ogg"), QStringLiteral("ping.ogg"), QStringLiteral("chime.ogg") });
    const qint64 id = addThemelet(*m_db, package, R"({"wallpaper": "a.jpg", "displayName": "Old name", "version": 1,
        "ringerVolume": 10, "highlightColor": "#111111", "partnerSpace": "file",
        "ringerToneFile": {"file": "dusk.ogg"}, "messageToneFile": {"file": "ping.ogg"}})");
    m_manager->updateMetaData();

    // What the user changed since.
    m_db->exec(QStringLiteral("UPDATE themelet SET favorite = 0, ringerVolume = 33, highlightColor = '#ff00ff00', "
                              "enabledSounds = -5, timestamp = '2020-01-01T00:00:00Z', partnerSpace = 'user', "
                              "applicationWallpaper = '/elsewhere/app.jpg' WHERE fileId = %1").arg(id));
    writeFile(package + QLatin1String("/re.themelet"),
              QStringLiteral(R"({"wallpaper": "b.jpg", "displayName": "%1", "version": 5, "ringerVolume": 90,
                  "favorite": true, "highlightColor": "#222222", "partnerSpace": "new",
                  "ringerToneFile": {"file": "chime.ogg", "enabled": 0}})").arg(displayName).toUtf8());
    markUnread(*m_db);
    SignalRecorder::clear();

    QCOMPARE(m_manager->updateMetaData(), false);
    QCOMPARE(SignalRecorder::calls(), QList<int> { 1 });
    QCOMPARE(m_db->rows(QStringLiteral("SELECT homeWallpaper, applicationWallpaper, favorite, timestamp, ringerVolume, "
                                       "enabledSounds, highlightColor, partnerSpace, version FROM themelet")),
             QStringList { package + QLatin1String("/images/b.jpg|NULL|0|2020-01-01T00:00:00Z|33|-5|#ff00ff00|user|5") });
    QCOMPARE(m_db->rows(s_resources), QStringList { QStringLiteral("ringerToneFile|chime.ogg") });
    QCOMPARE(value(QStringLiteral("SELECT displayName FROM file WHERE id = %1").arg(id)), expected);
}

void TestThemeletUpdate::invalidRereadDeletesRow()
{
    const QString package = makePackage(QStringLiteral("gone"));
    const qint64 id = addThemelet(*m_db, package, R"({"wallpaper": "w.jpg", "displayName": "Name"})");
    m_manager->updateMetaData();
    QCOMPARE(m_db->rows(s_rowColumns).size(), 1);

    QFile::remove(package + QLatin1String("/images/w.jpg"));
    markUnread(*m_db);
    SignalRecorder::clear();
    QCOMPARE(m_manager->updateMetaData(), false);

    QCOMPARE(SignalRecorder::calls(), QList<int> { 1 });
    QCOMPARE(m_db->rows(s_rowColumns), QStringList());
    QCOMPARE(m_db->rows(QStringLiteral("SELECT displayName, metadataCurrent FROM file WHERE id = %1").arg(id)),
             QStringList { QStringLiteral("Name|1") });
}

void TestThemeletUpdate::batchSize_data()
{
    QTest::addColumn<int>("files");
    QTest::addColumn<bool>("more");
    QTest::newRow("100") << 100 << true;
    QTest::newRow("99") << 99 << false;
}

void TestThemeletUpdate::batchSize()
{
    QFETCH(int, files);
    QFETCH(bool, more);

    // Invalid files count like any others.
    const QString package = makePackage(QStringLiteral("many"));
    QStringList statements;
    const qint64 directoryId = addDirectory(*m_db, package);
    for (int i = 0; i < files + 1; ++i) {
        const QString name = QStringLiteral("t%1.themelet").arg(i, 3, 10, QLatin1Char('0'));
        writeFile(package + QLatin1Char('/') + name, "{}");
        statements << QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, permissions, metadataCurrent) "
                                     "VALUES (%1, 'application/x-vorka-themelet', '%2', 1, %3)")
                              .arg(directoryId).arg(name).arg(i < files ? 0 : 1);
    }
    m_db->exec(statements);

    QCOMPARE(m_manager->updateMetaData(), more);
    QCOMPARE(value(QStringLiteral("SELECT COUNT(*) FROM file WHERE metadataCurrent = 0")), QStringLiteral("0"));
    QCOMPARE(SignalRecorder::calls(), QList<int> { 1 });

    // Nothing left: no transaction, no notice.
    QCOMPARE(m_manager->updateMetaData(), false);
    QCOMPARE(SignalRecorder::calls(), QList<int> { 1 });
}

void TestThemeletUpdate::unopenableRollsBack()
{
    // A file that has a row but can't be opened matches no entry in the merge, so
    // the entries after it go to the inserts, and the batch is rolled back.
    const QString first = makePackage(QStringLiteral("first"));
    addThemelet(*m_db, first, R"({"wallpaper": "w.jpg"})");
    addThemelet(*m_db, makePackage(QStringLiteral("second")), R"({"wallpaper": "w.jpg"})");
    m_manager->updateMetaData();
    QCOMPARE(m_db->rows(s_rowColumns).size(), 2);

    QFile::remove(first + QLatin1String("/first.themelet"));
    markUnread(*m_db);
    SignalRecorder::clear();

    QTest::ignoreMessage(QtWarningMsg, "virtual bool ThemeletManager::updateMetaData()");
    QTest::ignoreMessage(QtWarningMsg, "Failed to execute m_insertThemelet.");
    QTest::ignoreMessage(QtWarningMsg, QRegularExpression(QStringLiteral("^QSqlError\\(.*themelet.fileId")));
    QTest::ignoreMessage(QtWarningMsg, QRegularExpression(QStringLiteral("^\"INSERT INTO themelet \\( fileId,")));
    QCOMPARE(m_manager->updateMetaData(), false);

    QCOMPARE(SignalRecorder::calls(), QList<int>());
    QCOMPARE(value(QStringLiteral("SELECT COUNT(*) FROM file WHERE metadataCurrent = 0")), QStringLiteral("2"));
    QCOMPARE(m_db->rows(s_rowColumns).size(), 2);
}

QTEST_GUILESS_MAIN(TestThemeletUpdate)
#include "tst_themeletupdate.moc"
