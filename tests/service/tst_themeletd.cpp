// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The real themeletd on the sandbox's private bus, with the integration files of the build tree.
#include "dconftest.h"
#include "profilemanager.h"
#include "servicefixture.h"
#include "profiledefaults.h"
#include "sysroot.h"

#include <QDBusArgument>
#include <QDBusVariant>
#include <QPainter>

#include <memory>
#include <sys/stat.h>

using namespace Fixture;

class tst_Themeletd : public QObject
{
    Q_OBJECT

    const QString m_sandbox = qEnvironmentVariable("THEMELET_SANDBOX");
    const QString m_package = Sysroot::path("/usr/share/themelet/sunset");
    const QString m_watched = m_sandbox + "/watched";
    QProcess m_service;
    std::unique_ptr<TestDatabase> m_db;
    QList<int> m_signals;
    qlonglong m_sunsetId = 0;
    QString m_themeletRow;

    QString query(const QString &sql) { return m_db->rows(sql).join(';'); }
    static QVariant map(std::initializer_list<std::pair<QString, QVariant>> entries) { return QVariantMap(entries); }
    // Lets the coalescing windows of the service close.
    void settle() { QTest::qWait(300); }
    // Until the service's loops have sent nothing for a while; then forgets what they sent.
    bool quiet()
    {
        const bool ok = QTest::qWaitFor([&]() {
            m_signals.clear();
            QTest::qWait(400);
            return m_signals.isEmpty();
        }, 20000);
        m_signals.clear();
        return ok;
    }

    // One hostile call: it must be answered, by a reply or an error, and the service must live.
    void attack(const QString &method, const QVariantList &arguments)
    {
        if (QTest::currentTestFailed())
            return;
        const QDBusMessage answer = Service::call(method, arguments, 30000);
        const QString error = answer.errorName();
        const bool answered = answer.type() == QDBusMessage::ReplyMessage
                || (answer.type() == QDBusMessage::ErrorMessage && error != "org.freedesktop.DBus.Error.NoReply"
                    && error != "org.freedesktop.DBus.Error.ServiceUnknown");
        QVERIFY2(answered && Service::ownerPid() == m_service.processId(), qPrintable(method + ": " + error + ' ' + answer.errorMessage()));
    }

public slots:
    void recordChange(int type) { m_signals.append(type); }

private slots:
    void initTestCase()
    {
        // The MIME package, as a user's installation would have it.
        const QString mime = qEnvironmentVariable("XDG_DATA_HOME") + "/mime";
        QVERIFY(QDir().mkpath(mime + "/packages"));
        QVERIFY(QFile::copy(THEMELETD_SHARE "/mime/packages/vorka-themelet.xml", mime + "/packages/vorka-themelet.xml"));
        QCOMPARE(QProcess::execute("update-mime-database", { mime }), 0);

        QVERIFY(writeTree(m_package, { "images/sunset.jpg", "sounds/dusk.ogg" }, "x"));
        QVERIFY(write(m_package + "/sunset.themelet", R"({"wallpaper": "sunset.jpg", "displayName": "Sunset", )"
                                                      R"("ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));
        QVERIFY(write(m_sandbox + "/loose/tone.ogg", "OggS") && write(m_sandbox + "/tones/bell #2.ogg", "OggS"));
        QVERIFY(write(m_watched + "/notes.themelet", "{}") && write(m_watched + "/mine/images/w.jpg", "x"));
        QVERIFY(write(m_watched + "/mine/mine.themelet", R"({"wallpaper": "w.jpg"})"));
        QVERIFY(write(ProfileDefaults::path(),
                      "[themelet]\nringing.alert.volume=55\nringing.alert.tone=" + m_sandbox.toUtf8()
                              + "/tones/bell #2.ogg\nsms.alert.enabled=false\n"));

        // A first index half-made by a killed start is thrown away, never used.
        const QString halfMade = TestDatabase::indexPath() + ".new";
        QVERIFY(write(halfMade, "SQLite format 3"));
        // A picture that says it has 20000x20000 pixels: refused from its header, never decoded.
        QVERIFY(write(m_sandbox + "/bomb.ppm", "P6\n20000 20000\n255\n"));
        // The system's sound theme: its sounds are tones, read-only.
        QVERIFY(write(Sysroot::path("/usr/share/sounds/freedesktop/index.theme"), "[Sound Theme]\nName=Default\n")
                && write(Sysroot::path("/usr/share/sounds/freedesktop/stereo/bell.oga"), "OggS"));
        QVERIFY(Service::start(m_service, { m_watched, Sysroot::path("/usr/share") }));
        QVERIFY(!QFile::exists(halfMade));
        QVERIFY(QDBusConnection::sessionBus().connect(Service::Name, Service::Path, Service::Name, "contentChanged", this,
                                                      SLOT(recordChange(int))));
        m_db = std::make_unique<TestDatabase>();
        QTRY_COMPARE_WITH_TIMEOUT(query("SELECT displayName FROM file JOIN themelet ON fileId = id WHERE fileName = 'sunset.themelet'"), QString("Sunset"), 20000);
        m_sunsetId = query("SELECT id FROM file WHERE fileName = 'sunset.themelet'").toLongLong();
    }

    void cleanupTestCase() { QVERIFY(Service::stop(m_service)); }

    // An answer is "reply|<first argument>" or "<error name>|<words its one-line message holds>". A call is announced by
    // one contentChanged of its type (-1: none): a write that changes nothing is not announced, and a refused write of a
    // known type makes the clients show the stored values again. Nothing else changes the package's themelet.
    void calls_data()
    {
        QTest::addColumn<QString>("method");
        QTest::addColumn<QVariantList>("arguments");
        QTest::addColumn<QString>("answer");
        QTest::addColumn<int>("announced");
        QTest::addColumn<QString>("sunset");

        m_themeletRow = QStringLiteral("SELECT displayName, ringerVolume, favorite, (SELECT group_concat(resourceType || '=' "
                                       "|| fileName) FROM resource JOIN file ON id = resourceId WHERE fileId = %1) FROM "
                                       "file JOIN themelet ON fileId = id WHERE id = %1").arg(m_sunsetId);
        const QVariant tone = map({ { "messageToneFile", map({ { "url", m_sandbox + "/loose/tone.ogg" } }) } });
        const QString saved = "Dusk|40|1|ringerToneFile=dusk.ogg,messageToneFile=tone.ogg", unset = "Dusk|40|0|" + saved.section('|', 3);
        QTest::newRow("saveAttributes, nested")
                << "saveAttributes" << QVariantList { 1, m_sunsetId, map({ { "displayName", "Dusk" }, { "ringerVolume", 40 }, { "resources", tone } }) }
                << "reply|" << 1 << saved;
        QTest::newRow("saveAttributes, same values")
                << "saveAttributes" << QVariantList { 1, m_sunsetId, map({ { "displayName", "Dusk" }, { "favorite", true }, { "resources", tone } }) }
                << "reply|" << -1 << saved;
        QTest::newRow("setFavorite") << "setFavorite" << QVariantList { "file://" + m_package + "/images/sunset.jpg", false } << "reply|true"
                                     << 1 << unset;

        const QString invalid = "InvalidArgs|";
        QTest::newRow("unknown id") << "saveAttributes" << QVariantList { 1, qlonglong(999999), QVariantMap() } << "NotFound|" << 1 << unset;
        QTest::newRow("package themelet") << "remove" << QVariantList { 1, m_sunsetId } << "ReadOnly|belongs to a package" << 1 << unset;
        // A user's own themelet: its picture is not the service's to delete.
        QTest::newRow("user themelet") << "remove" << QVariantList { 1, query("SELECT id FROM file WHERE fileName = 'mine.themelet'")
                                                                      .toLongLong() } << "ReadOnly|did not make" << 1 << unset;
        QTest::newRow("plain file") << "remove" << QVariantList { 0, query("SELECT id FROM file WHERE fileName = 'dusk.ogg'").toLongLong() }
                                    << "Failed|" << 0 << unset;
        QTest::newRow("volume out of range") << "saveAttributes" << QVariantList { 1, m_sunsetId, map({ { "ringerVolume", 1000 } }) }
                                             << invalid << 1 << unset;
        QTest::newRow("watched directory as package") << "installPackage" << QVariantList { m_watched } << invalid << -1 << unset;
        QTest::newRow("nothing installable") << "installPackage" << QVariantList { m_sandbox + "/loose" } << invalid + "Nothing to install"
                                             << -1 << unset;
        QTest::newRow("decompression bomb") << "createThemelet" << QVariantList { "file://" + m_sandbox + "/bomb.ppm" }
                                            << invalid + "more pixels" << -1 << unset;
    }

    void calls()
    {
        QFETCH(QString, method);
        QFETCH(QVariantList, arguments);
        QFETCH(QString, answer);
        QFETCH(int, announced);
        QFETCH(QString, sunset);

        QVERIFY(quiet());
        const QDBusMessage message = Service::call(method, arguments);
        const bool error = message.type() == QDBusMessage::ErrorMessage;
        const QString text = error ? message.errorMessage() : message.arguments().value(0).toString();
        QCOMPARE(error ? message.errorName() : "reply", (error ? "com.vorka.themeletd.Error." : "") + answer.section('|', 0, 0));
        QVERIFY2(text.contains(answer.section('|', 1)) && (!error || !text.isEmpty()) && !text.contains('\n'), qPrintable(text));
        QTRY_COMPARE_WITH_TIMEOUT(query(m_themeletRow), sunset, 20000);
        settle();
        QVERIFY2(announced < 0 ? m_signals.isEmpty() : m_signals.count(announced) == 1, qPrintable(QTest::toString(m_signals)));
    }

    void watchedPicture()
    {
        QVERIFY(quiet());
        QVERIFY(writeJpeg(m_watched + "/new.jpg"));
        QTRY_COMPARE_WITH_TIMEOUT(query("SELECT width, height FROM image JOIN file ON id = fileId WHERE fileName = 'new.jpg'"), QString("64|48"), 20000);
        settle();
        QVERIFY(m_signals.contains(2));
        // A .themelet file a user drops in gets its type from the MIME package.
        QCOMPARE(query("SELECT mimeType FROM file WHERE fileName = 'notes.themelet'"), QString("application/x-vorka-themelet"));
        QTRY_COMPARE(query("SELECT displayName, permissions, mimeType GLOB 'audio/*' FROM file WHERE fileName = 'bell.oga'"), QString("bell|1|1"));
    }

    void createAndSet()
    {
        // Blue beats a smaller red; a pale pink one is too dull for a hue and gets dark text. The second gets a name of its own.
        QImage picture(320, 200, QImage::Format_RGB32);
        picture.fill(QColor(20, 40, 200));
        QPainter(&picture).fillRect(0, 0, 100, 100, Qt::red);
        QVERIFY(QDir().mkpath(m_sandbox + "/pictures/grey") && picture.save(m_sandbox + "/pictures/Blue Lagoon.png"));
        picture.fill(QColor(255, 210, 210));
        QVERIFY(picture.save(m_sandbox + "/pictures/grey/Blue Lagoon.png"));

        // Sounds come from the profile while no themelet is active; a "#" in a name is no URL fragment.
        QVERIFY(quiet());
        const QDBusReply<qlonglong> first = Service::call("createThemelet", { QUrl::fromLocalFile(m_sandbox + "/pictures/Blue Lagoon.png").toString() }),
                                    second = Service::call("createThemelet", { QUrl::fromLocalFile(m_sandbox + "/pictures/grey/Blue Lagoon.png").toString() });
        const QString wallpapers = qEnvironmentVariable("XDG_DATA_HOME") + "/Vorka/themeletd/wallpapers/";
        const QString columns = "SELECT displayName, homeWallpaper, applicationWallpaper, highlightColor, secondaryHighlightColor, "
                                "primaryColor, secondaryColor, ringerVolume, enabledSounds, (SELECT group_concat(resourceType || '=' "
                                "|| fileName) FROM resource JOIN file ON id = resourceId WHERE fileId = %1) FROM file JOIN themelet "
                                "ON fileId = id WHERE id = %1";
        const QString made = "Blue Lagoon|%1|%1|%2|55|-3|ringerToneFile=bell #2.ogg";
        QCOMPARE(query(columns.arg(first.value())), made.arg(wallpapers + "Blue Lagoon.png", "#ff3344ff|#ff1f2999|#ffffffff|#a0ffffff"));
        QCOMPARE(query(columns.arg(second.value())), made.arg(wallpapers + "Blue Lagoon-2.png", "#ffe6e6e6|#ff969696|#ff000000|#a0000000"));
        settle();
        QCOMPARE(m_signals.count(1), 2);

        // Its sounds are heard: the profile "themelet" becomes the active one.
        QCOMPARE(Service::call("setThemelet", { QUrl::fromLocalFile(wallpapers + "Blue Lagoon.png").toString() }).arguments(),
                 QVariantList { first.value() });
        const QString background = "/desktop/vorka/background/portrait/", colours = "/desktop/vorka/themelet/",
                      profile = "/org/orbaline/themelet/profiles/themelet/", quoted = "'" + wallpapers + "Blue Lagoon.png'";
        const QStringList keys { "/desktop/lunda/background/portrait/picture_filename", background + "home_picture_filename",
                                 background + "app_picture_filename", profile + "ringing.alert.volume", profile + "ringing.alert.tone",
                                 profile + "ringing.alert.enabled", profile + "sms.alert.enabled", colours + "highlight_color",
                                 colours + "secondary_highlight_color", colours + "primary_color", colours + "secondary_color" };
        const auto values = [&keys]() { QStringList values; for (const QString &key : keys) values << DConfTest::read(key); return values; };
        QCOMPARE(values(), QStringList({ quoted, quoted, quoted, "55", "'" + m_sandbox + "/tones/bell #2.ogg'", "true", "false",
                                         "'#ff3344ff'", "'#ff1f2999'", "'#ffffffff'", "'#a0ffffff'" }));
        ProfileManager sounds;
        QTRY_COMPARE(sounds.activeProfile(), ProfileManager::Themelet);

        // An edit of the active themelet is applied again.
        const QVariant edit = map({ { "highlightColor", "#ff00ff00" }, { "ringerVolume", 30 }, { "messageToneEnabled", true } });
        QCOMPARE(Service::call("saveAttributes", { 1, first.value(), edit }).type(), QDBusMessage::ReplyMessage);
        QTRY_COMPARE_WITH_TIMEOUT(DConfTest::read(colours + "highlight_color"), QString("'#ff00ff00'"), 10000);
        QCOMPARE(values().mid(3, 4), QStringList({ "30", "'" + m_sandbox + "/tones/bell #2.ogg'", "true", "true" }));

        // Removing a themelet made here takes its copy of the picture along.
        QCOMPARE(Service::call("remove", { 1, second.value() }).type(), QDBusMessage::ReplyMessage);
        QVERIFY(!QFile::exists(wallpapers + "Blue Lagoon-2.png") && QFile::exists(wallpapers + "Blue Lagoon.png"));

        // Removing the active one leaves no key naming its deleted picture, and the profile from before.
        QCOMPARE(Service::call("remove", { 1, first.value() }).type(), QDBusMessage::ReplyMessage);
        QVERIFY(!QFile::exists(wallpapers + "Blue Lagoon.png"));
        QTRY_COMPARE(values(), QStringList({ "''", "''", "''" }) + QVector<QString>(keys.size() - 3).toList());
        QTRY_COMPARE(sounds.activeProfile(), ProfileManager::General);
    }

    // One call per class of hostile input: unknown ids and types, URLs that are no local files or lead elsewhere, values
    // of the wrong type, huge or deeply nested maps. Every call is answered, the service lives on, nothing changes
    // outside its places (the index and wallpapers under data/, dconf under config/), and a normal client is still served.
    void hostileCalls()
    {
        const QString victim = m_sandbox + "/victim", keep = victim + "/keep.jpg", tone = victim + "/keep.ogg";
        QVERIFY(write(keep, "precious") && write(tone, "precious") && mkfifo(qPrintable(victim + "/fifo"), 0600) == 0);
        const qlonglong file = query("SELECT min(fileId) FROM image").toLongLong();
        const QRegularExpression places("^" + QRegularExpression::escape(m_sandbox) + "/(data|config|cache|runtime)(/|$)");
        const auto snapshot = [&]() {
            QStringList entries;
            for (QDirIterator it(m_sandbox, QDir::AllEntries | QDir::Hidden | QDir::System | QDir::NoDotAndDotDot,
                                 QDirIterator::Subdirectories); it.hasNext();) {
                const QFileInfo info(it.next());
                if (!places.match(info.filePath()).hasMatch())
                    entries << QStringLiteral("%1|%2|%3").arg(info.filePath()).arg(info.isDir() ? 0 : info.size())
                                       .arg(info.lastModified().toMSecsSinceEpoch());
            }
            entries.sort();
            return entries;
        };
        const QStringList before = snapshot();
        const auto nested = [](int depth, QVariant value) {
            while (depth-- > 0)
                value = QVariantMap { { "resources", value } };
            return value.toMap();
        };
        const QStringList urls { "", "relative/a.jpg", "file://" + m_watched + "/../../victim/keep.jpg", "file://otherhost/etc/passwd",
            "http://example.com/a.jpg", "/proc/self/mem", victim + "/fifo", victim, keep, m_package + "/sunset.themelet",
            QString(64 * 1024, 'a'), "file:///%2e%2e/%2e%2e/etc/passwd", "\n/etc/passwd" };
        for (const QString &url : urls) {
            for (const char *method : { "createThemelet", "indexFile", "installPackage", "setThemelet" })
                attack(method, { url });
            attack("setFavorite", { url, true });
        }
        // Containers that the demarshalling must flatten or refuse: a structure, a map with integer keys.
        QDBusArgument structure, intKeys;
        structure.beginStructure();
        structure << 1 << QString("s") << QDBusVariant(QVariantList { 2.5, "x" });
        structure.endStructure();
        intKeys.beginMap(QVariant::Int, qMetaTypeId<QDBusVariant>());
        intKeys.beginMapEntry();
        intKeys << 7 << QDBusVariant(QVariantMap { { "url", tone } });
        intKeys.endMapEntry();
        intKeys.endMap();
        QVariantMap huge;
        for (int i = 0; i < 100000; ++i)
            huge.insert(QString::number(i), i);
        // Values that aren't what the keys want; 21 levels of a{sv} are the deepest that the bus carries.
        const QList<QVariantMap> maps { {}, { { "displayName", 5 } }, { { "ringerVolume", 1e300 } }, { { "homeWallpaper", keep } },
            nested(1, QVariantMap { { "ringerToneFile", QVariantMap { { "url", tone } } } }), { { "resources", 5 } },
            { { "unknownKey", QVariantList { 1, "two", QVariantMap { { "three", 3.0 } } } } }, { { "bytes", QByteArray(70000, '\0') } },
            nested(21, "deep"), nested(20, QVariantMap { { "url", tone } }), { { "resources", QVariant::fromValue(intKeys) } },
            { { "resources", QVariant::fromValue(structure) } } };
        for (int type : { -1, 0, 1, 3, 99, INT_MIN }) {
            for (qlonglong id : { -1LL, m_sunsetId, file, LLONG_MAX }) {
                attack("remove", { type, id });
                for (const QVariantMap &map : maps)
                    attack("saveAttributes", { type, id, map });
            }
        }
        attack("saveAttributes", { 1, m_sunsetId, huge }); // once: it is slow to marshal

        Service::call("saveAttributes", { 1, m_sunsetId, map({ { "displayName", "Still here" } }) });
        QTRY_COMPARE(query("SELECT displayName FROM file WHERE id = " + QString::number(m_sunsetId)), QString("Still here"));
        QCOMPARE(query("PRAGMA integrity_check"), QString("ok"));
        QCOMPARE(snapshot(), before);
    }

    // A second instance leaves the index alone.
    void secondInstance()
    {
        const QDateTime modified = QFileInfo(TestDatabase::indexPath()).lastModified();
        QProcess second;
        second.start(THEMELETD_BINARY, { "--no-default-watch" });
        QVERIFY(second.waitForFinished(20000));
        QCOMPARE(second.exitCode(), 1);
        QCOMPARE(second.readAllStandardError(), "themeletd: the name com.vorka.themeletd is already owned on the session bus; is themeletd running?\n");
        QCOMPARE(QFileInfo(TestDatabase::indexPath()).lastModified(), modified);
    }

    void stopAndRestart()
    {
        QCOMPARE(Service::call("setThemelet", { "file://" + m_package + "/sunset.themelet" }).type(), QDBusMessage::ReplyMessage);
        const QString volume = "/org/orbaline/themelet/profiles/themelet/ringing.alert.volume";
        QTRY_COMPARE(DConfTest::read(volume), query("SELECT ringerVolume FROM themelet WHERE fileId = " + QString::number(m_sunsetId)));
        m_db.reset();
        m_service.terminate();
        QVERIFY(m_service.waitForFinished(20000));
        QCOMPARE(m_service.exitStatus(), QProcess::NormalExit);
        QCOMPARE(m_service.exitCode(), 0);
        // The last connection closed: the log is checkpointed into the file.
        QVERIFY(!QFile::exists(TestDatabase::indexPath() + "-wal"));
        m_db = std::make_unique<TestDatabase>();
        QCOMPARE(query("PRAGMA integrity_check"), QString("ok"));
        const QString applied = DConfTest::read(volume);
        DConfTest::write(volume, "99");
        QVERIFY(Service::start(m_service, { m_watched, Sysroot::path("/usr/share") }));
        // The device follows the active themelet again.
        QTRY_COMPARE_WITH_TIMEOUT(DConfTest::read(volume), applied, 20000);
    }
};

QTEST_GUILESS_MAIN(tst_Themeletd)
#include "tst_themeletd.moc"
