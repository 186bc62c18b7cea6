#include "dconftest.h"
#include "indexfixture.h"
#include "sysroot.h"

#include <QDBusConnection>
#include <QDBusConnectionInterface>
#include <QDBusMessage>
#include <QDBusReply>
#include <QXmlStreamReader>

#include <csignal>
#include <memory>

using namespace Fixture;

namespace {

const QString Service = QStringLiteral("com.vorka.themeletd");
const QString Path = QStringLiteral("/com/vorka/themeletd");

// The interface element of an introspection text, as one line per element with its attributes.
QStringList interfaceOutline(const QString &xml)
{
    QStringList outline;
    QXmlStreamReader reader(xml);
    bool inside = false;
    while (!reader.atEnd()) {
        reader.readNext();
        if (reader.isStartElement() && reader.name() == QLatin1String("interface"))
            inside = reader.attributes().value("name") == Service;
        if (!inside || !reader.isStartElement())
            continue;
        QStringList attributes;
        for (const QXmlStreamAttribute &attribute : reader.attributes())
            attributes << attribute.name() + "=" + attribute.value();
        attributes.sort();
        outline << reader.name() + " " + attributes.join(' ');
    }
    return outline;
}

QVariantMap map(std::initializer_list<std::pair<QString, QVariant>> entries)
{
    return QVariantMap(entries);
}

}

class tst_Themeletd : public QObject
{
    Q_OBJECT

    const QString m_sandbox = qEnvironmentVariable("THEMELET_SANDBOX");
    const QString m_package = Sysroot::path("/usr/share/themelet/sunset");
    const QString m_watched = m_sandbox + "/watched";
    QProcess m_service;
    std::unique_ptr<TestDatabase> m_db;
    QList<int> m_signals;
    QHash<QString, QString> m_names; // placeholders of the data rows

    QString expand(QString text) const
    {
        for (auto it = m_names.constBegin(); it != m_names.constEnd(); ++it)
            text.replace("%" + it.key(), it.value());
        return text;
    }
    QVariant expand(const QVariant &value) const
    {
        if (value.userType() == QMetaType::QString)
            return expand(value.toString());
        if (value.userType() != QMetaType::QVariantMap)
            return value;
        QVariantMap result;
        const QVariantMap source = value.toMap();
        for (auto it = source.constBegin(); it != source.constEnd(); ++it)
            result.insert(it.key(), expand(it.value()));
        return result;
    }

    QDBusMessage call(const QString &method, const QVariantList &arguments,
                      const QString &interface = Service)
    {
        QDBusMessage message = QDBusMessage::createMethodCall(Service, Path, interface, method);
        QVariantList expanded;
        for (const QVariant &argument : arguments)
            expanded << expand(argument);
        message.setArguments(expanded);
        return QDBusConnection::sessionBus().call(message, QDBus::Block, 20000);
    }

    QString query(const QString &sql) { return m_db->rows(expand(sql)).join(';'); }
    bool waitForRows(const QString &sql, const QString &expected)
    {
        const bool ok = QTest::qWaitFor([&]() { return query(sql) == expand(expected); }, 20000);
        if (!ok)
            qWarning().noquote() << sql << "gives" << query(sql) << "not" << expand(expected);
        return ok;
    }
    bool waitForKey(const QString &key, const QString &value)
    {
        return QTest::qWaitFor([&]() { return DConfTest::read(key) == expand(value); }, 10000);
    }
    bool nameOwned() { return QDBusConnection::sessionBus().interface()->isServiceRegistered(Service); }
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

    QString themeletId(const QString &fileName)
    {
        return query(QStringLiteral("SELECT fileId FROM themelet JOIN file ON id = fileId WHERE fileName = '%1'").arg(fileName));
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
        QVERIFY(writeTree(m_sandbox + "/extra", { "images/aurora.jpg" }, "x"));
        QVERIFY(write(m_sandbox + "/extra/aurora.themelet", R"({"wallpaper": "aurora.jpg", "displayName": "Aurora"})"));
        QVERIFY(write(m_sandbox + "/loose/tone.ogg", "OggS") && write(m_sandbox + "/tones/bell.ogg", "OggS"));
        QVERIFY(write(m_watched + "/notes.themelet", "{}"));
        QVERIFY(write(Sysroot::path("/etc/themelet/profiles.ini"),
                      "[themelet]\nringing.alert.volume=55\nringing.alert.tone=" + m_sandbox.toUtf8()
                              + "/tones/bell.ogg\nsms.alert.enabled=false\n"));

        m_service.setProcessChannelMode(QProcess::ForwardedChannels);
        m_service.start(THEMELETD_BINARY, { "--no-default-watch", "--watch", m_watched });
        QVERIFY(QTest::qWaitFor([&]() { return nameOwned(); }, 20000));
        QVERIFY(QDBusConnection::sessionBus().connect(Service, Path, Service, "contentChanged", this, SLOT(recordChange(int))));
        QVERIFY(QTest::qWaitFor([]() { return QFile::exists(TestDatabase::indexPath()); }));
        m_db = std::make_unique<TestDatabase>();

        m_names = { { "package", m_package }, { "sandbox", m_sandbox }, { "watched", m_watched } };
        QVERIFY(waitForRows("SELECT displayName FROM file JOIN themelet ON fileId = id WHERE fileName = 'sunset.themelet'", "Sunset"));
        m_names.insert("sunsetId", themeletId("sunset.themelet"));
        m_names.insert("toneId", query("SELECT id FROM file WHERE fileName = 'dusk.ogg'"));
    }

    void cleanupTestCase()
    {
        // The service may have been restarted by activation, away from m_service.
        QDBusReply<uint> pid = QDBusConnection::sessionBus().interface()->servicePid(Service);
        if (pid.isValid())
            ::kill(pid.value(), SIGTERM);
        QVERIFY(QTest::qWaitFor([&]() { return !nameOwned(); }, 20000));
    }

    void introspection()
    {
        QDBusReply<QString> xml = call("Introspect", {}, "org.freedesktop.DBus.Introspectable");
        QVERIFY(xml.isValid());
        QFile contract(THEMELETD_XML);
        QVERIFY(contract.open(QIODevice::ReadOnly));
        const QStringList expected = interfaceOutline(QString::fromUtf8(contract.readAll()));
        QVERIFY(expected.size() > 20);
        QCOMPARE(interfaceOutline(xml.value()), expected);
    }

    void methods_data()
    {
        QTest::addColumn<QString>("method");
        QTest::addColumn<QVariantList>("arguments");
        QTest::addColumn<QString>("reply");
        QTest::addColumn<int>("type");
        QTest::addColumn<bool>("once");
        QTest::addColumn<QString>("sql");
        QTest::addColumn<QString>("rows");

        const QString themelet = "SELECT displayName, ringerVolume, favorite, (SELECT group_concat(resourceType || '=' || fileName) FROM "
                                 "resource JOIN file ON id = resourceId WHERE fileId = %sunsetId) FROM file JOIN themelet ON fileId = id "
                                 "WHERE id = %sunsetId";
        QTest::newRow("saveAttributes, nested")
                << "saveAttributes"
                << QVariantList { 1, qlonglong(0), map({ { "displayName", "Dusk" }, { "ringerVolume", 40 },
                                                          { "resources", map({ { "messageToneFile", map({ { "url", "%sandbox/loose/tone.ogg" } }) } }) } }) }
                << "" << 1 << true << themelet << "Dusk|40|1|ringerToneFile=dusk.ogg,messageToneFile=tone.ogg";
        QTest::newRow("setFavorite") << "setFavorite" << QVariantList { "file://%package/images/sunset.jpg", false } << "true" << 1 << true
                                     << themelet << "Dusk|40|0|ringerToneFile=dusk.ogg,messageToneFile=tone.ogg";
        QTest::newRow("indexFile") << "indexFile" << QVariantList { "file://%sandbox/loose/bell.ogg" } << "" << 0 << false
                                   << "SELECT mimeType FROM file WHERE fileName = 'bell.ogg'" << "audio/ogg";
        QTest::newRow("installPackage") << "installPackage" << QVariantList { "%sandbox/extra" } << "" << 1 << false
                                        << "SELECT displayName, permissions FROM file JOIN themelet ON fileId = id "
                                           "WHERE fileName = 'aurora.themelet'" << "Aurora|1";
        // The package's file changed on disk: its name wins over the edited one.
        QTest::newRow("refreshThemelets") << "refreshThemelets" << QVariantList {} << "" << 1 << false
                                          << "SELECT displayName FROM file WHERE id = %sunsetId" << "Sunrise";
    }

    void methods()
    {
        QFETCH(QString, method);
        QFETCH(QVariantList, arguments);
        QFETCH(QString, reply);
        QFETCH(int, type);
        QFETCH(bool, once);
        QFETCH(QString, sql);
        QFETCH(QString, rows);

        if (method == "saveAttributes")
            arguments[1] = m_names.value("sunsetId").toLongLong();
        if (method == "indexFile")
            QVERIFY(QFile::copy(m_sandbox + "/tones/bell.ogg", m_sandbox + "/loose/bell.ogg"));
        if (method == "refreshThemelets") {
            QVERIFY(write(m_package + "/sunset.themelet", R"({"wallpaper": "sunset.jpg", "displayName": "Sunrise", )"
                                                          R"("ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));
            settle();
        }

        QVERIFY(quiet());
        const QDBusMessage answer = call(method, arguments);
        QCOMPARE(answer.type(), QDBusMessage::ReplyMessage);
        QCOMPARE(answer.arguments().isEmpty() ? QString() : answer.arguments().first().toString(), reply);
        QVERIFY(waitForRows(sql, rows));
        settle();
        QVERIFY2(m_signals.contains(type), qPrintable(QTest::toString(m_signals)));
        if (once)
            QCOMPARE(m_signals.count(type), 1);
    }

    void watchedPicture()
    {
        QVERIFY(quiet());
        QVERIFY(writeJpeg(m_watched + "/new.jpg"));
        QVERIFY(waitForRows("SELECT width, height FROM image JOIN file ON id = fileId WHERE fileName = 'new.jpg'", "64|48"));
        settle();
        QVERIFY(m_signals.contains(2));
        // A .themelet file a user drops in gets its type from the MIME package.
        QCOMPARE(query("SELECT mimeType FROM file WHERE fileName = 'notes.themelet'"), QString("application/x-vorka-themelet"));
    }

    void createAndSet()
    {
        QImage picture(320, 200, QImage::Format_RGB32);
        picture.fill(QColor(20, 40, 200));
        QVERIFY(QDir().mkpath(m_sandbox + "/pictures") && picture.save(m_sandbox + "/pictures/Blue Lagoon.png"));
        const QString url = QUrl::fromLocalFile(m_sandbox + "/pictures/Blue Lagoon.png").toString();

        // Sounds come from the profile while no themelet is active; the second copy gets a name of its own.
        QVERIFY(quiet());
        const QDBusReply<qlonglong> first = call("createThemelet", { url });
        const QDBusReply<qlonglong> second = call("createThemelet", { url });
        QVERIFY(first.isValid() && second.isValid() && first.value() > 0 && second.value() > first.value());
        const QString wallpapers = qEnvironmentVariable("XDG_DATA_HOME") + "/Vorka/themeletd/wallpapers/";
        const QString columns = "SELECT displayName, homeWallpaper, applicationWallpaper, highlightColor, secondaryHighlightColor, "
                                "primaryColor, secondaryColor, ringerVolume, enabledSounds, (SELECT group_concat(resourceType || '=' "
                                "|| fileName) FROM resource JOIN file ON id = resourceId WHERE fileId = %1) FROM file JOIN themelet "
                                "ON fileId = id WHERE id = %1";
        const QString made = "Blue Lagoon|%2|%2|#ff3344ff|#ff1f2999|#ffffffff|#a0ffffff|55|-3|ringerToneFile=bell.ogg";
        QCOMPARE(query(columns.arg(first.value())), made.arg(wallpapers + "Blue Lagoon.png"));
        QCOMPARE(query(columns.arg(second.value())), made.arg(wallpapers + "Blue Lagoon-2.png"));
        settle();
        // Each creation is announced; the copies of the pictures are indexed as files and photos as well.
        QCOMPARE(m_signals.count(1), 2);

        const QString themeletUrl = QUrl::fromLocalFile(wallpapers + "Blue Lagoon.png").toString();
        const QDBusReply<qlonglong> set = call("setThemelet", { themeletUrl });
        QVERIFY(set.isValid());
        QCOMPARE(set.value(), first.value());
        const QString profile = "/org/orbaline/themelet/profiles/themelet/";
        const QString quoted = "'" + wallpapers + "Blue Lagoon.png'";
        const QList<QPair<QString, QString>> applied {
            { "/desktop/lunda/background/portrait/picture_filename", quoted },
            { "/desktop/vorka/background/portrait/home_picture_filename", quoted },
            { "/desktop/vorka/background/portrait/app_picture_filename", quoted },
            { profile + "ringing.alert.volume", "55" },
            { profile + "ringing.alert.tone", "'" + m_sandbox + "/tones/bell.ogg'" },
            { profile + "ringing.alert.enabled", "true" },
            { profile + "sms.alert.enabled", "false" },
            { "/desktop/vorka/themelet/highlight_color", "'#ff3344ff'" },
            { "/desktop/vorka/themelet/secondary_highlight_color", "'#ff1f2999'" },
            { "/desktop/vorka/themelet/primary_color", "'#ffffffff'" },
            { "/desktop/vorka/themelet/secondary_color", "'#a0ffffff'" },
        };
        for (const auto &key : applied)
            QCOMPARE(DConfTest::read(key.first), key.second);

        // An edit of the active themelet is applied again.
        const QDBusMessage edit = call("saveAttributes", { 1, qlonglong(first.value()),
                                                           map({ { "highlightColor", "#ff00ff00" }, { "ringerVolume", 30 },
                                                                 { "messageToneEnabled", true } }) });
        QCOMPARE(edit.type(), QDBusMessage::ReplyMessage);
        QVERIFY(waitForKey("/desktop/vorka/themelet/highlight_color", "'#ff00ff00'"));
        QCOMPARE(DConfTest::read(profile + "ringing.alert.volume"), QString("30"));
        QCOMPARE(DConfTest::read(profile + "sms.alert.enabled"), QString("true"));

        // Removing a themelet made here takes its copy of the picture along.
        m_signals.clear();
        QCOMPARE(call("remove", { 1, qlonglong(second.value()) }).type(), QDBusMessage::ReplyMessage);
        QCOMPARE(query(QStringLiteral("SELECT count(*) FROM themelet WHERE fileId = %1").arg(second.value())), QString("0"));
        QVERIFY(!QFile::exists(wallpapers + "Blue Lagoon-2.png") && QFile::exists(wallpapers + "Blue Lagoon.png"));
        settle();
        QVERIFY(m_signals.contains(1));
    }

    void errors_data()
    {
        QTest::addColumn<QString>("method");
        QTest::addColumn<QVariantList>("arguments");
        QTest::addColumn<QString>("error");

        const QString invalid = "com.vorka.themeletd.Error.InvalidArgs", notFound = "com.vorka.themeletd.Error.NotFound";
        const QVariantList save { 1, qlonglong(-1) };
        QTest::newRow("unknown type") << "saveAttributes" << QVariantList { 9, qlonglong(1), QVariantMap() } << invalid;
        QTest::newRow("type without manager") << "remove" << QVariantList { 3, qlonglong(1) } << invalid;
        QTest::newRow("unknown id") << "saveAttributes" << QVariantList { 1, qlonglong(999999), QVariantMap() } << notFound;
        QTest::newRow("file is no themelet") << "remove" << QVariantList { 1, "%toneId" } << notFound;
        QTest::newRow("package themelet") << "remove" << QVariantList { 1, "%sunsetId" } << "com.vorka.themeletd.Error.ReadOnly";
        QTest::newRow("bad colour") << "saveAttributes" << QVariantList { 1, "%sunsetId", map({ { "highlightColor", "reddish" } }) }
                                    << invalid;
        QTest::newRow("volume out of range") << "saveAttributes" << QVariantList { 1, "%sunsetId", map({ { "ringerVolume", 1000 } }) }
                                             << invalid;
        QTest::newRow("tone without url") << "saveAttributes"
                                          << QVariantList { 1, "%sunsetId", map({ { "resources", map({ { "ringerToneFile", QVariantMap() } }) } }) }
                                          << invalid;
        QTest::newRow("web url") << "setThemelet" << QVariantList { "https://example.com/a.themelet" } << invalid;
        QTest::newRow("no themelet there") << "setThemelet" << QVariantList { "file:///nonexistent/a.themelet" } << notFound;
        QTest::newRow("relative package") << "installPackage" << QVariantList { "extra" } << invalid;
        QTest::newRow("missing package") << "installPackage" << QVariantList { "/nonexistent" } << notFound;
        QTest::newRow("missing picture") << "createThemelet" << QVariantList { "file:///nonexistent.jpg" } << notFound;
        QTest::newRow("no picture") << "createThemelet" << QVariantList { "file://%package/sunset.themelet" } << invalid;
        QTest::newRow("device") << "createThemelet" << QVariantList { "file:///dev/zero" } << invalid;
        QTest::newRow("empty url") << "indexFile" << QVariantList { "" } << invalid;
        QTest::newRow("directory") << "indexFile" << QVariantList { "%sandbox" } << invalid;
        QTest::newRow("wrong signature") << "saveAttributes" << QVariantList { "1", "2" } << "org.freedesktop.DBus.Error.UnknownMethod";
    }

    void errors()
    {
        QFETCH(QString, method);
        QFETCH(QVariantList, arguments);
        QFETCH(QString, error);

        // Ids come as text from the table.
        for (QVariant &argument : arguments) {
            if (argument.toString().startsWith("%") && argument.toString().endsWith("Id"))
                argument = expand(argument.toString()).toLongLong();
        }
        const QDBusMessage answer = call(method, arguments);
        QCOMPARE(answer.type(), QDBusMessage::ErrorMessage);
        QCOMPARE(answer.errorName(), error);
        QVERIFY(!answer.errorMessage().isEmpty() && !answer.errorMessage().contains('\n'));
        QCOMPARE(call("Ping", {}, "org.freedesktop.DBus.Peer").type(), QDBusMessage::ReplyMessage);
    }

    void secondInstance()
    {
        const QFileInfo index(TestDatabase::indexPath());
        const QDateTime modified = index.lastModified();
        QProcess second;
        second.start(THEMELETD_BINARY, { "--no-default-watch" });
        QVERIFY(second.waitForFinished(20000));
        QCOMPARE(second.exitCode(), 1);
        QCOMPARE(second.readAllStandardError(),
                 QByteArray("themeletd: the name com.vorka.themeletd is already owned on the session bus; is themeletd running?\n"));
        QCOMPARE(QFileInfo(index.filePath()).lastModified(), modified);
    }

    void stopAndRestart()
    {
        m_db.reset();
        m_service.terminate();
        QVERIFY(m_service.waitForFinished(20000));
        QCOMPARE(m_service.exitStatus(), QProcess::NormalExit);
        QCOMPARE(m_service.exitCode(), 0);
        // The last connection closed: the log is checkpointed into the file.
        QVERIFY(!QFile::exists(TestDatabase::indexPath() + "-wal"));
        m_db = std::make_unique<TestDatabase>();
        QCOMPARE(query("PRAGMA integrity_check"), QString("ok"));

        // While it is down the disk changes; the service comes back by activation.
        QVERIFY(QFile::remove(m_watched + "/new.jpg") && writeJpeg(m_watched + "/later.jpg"));
        const QString services = qEnvironmentVariable("XDG_DATA_HOME") + "/dbus-1/services";
        QVERIFY(QDir().mkpath(services));
        QVERIFY(QFile::copy(THEMELETD_SHARE "/dbus-1/services/com.vorka.themeletd.service",
                            services + "/com.vorka.themeletd.service"));
        QDBusMessage reload = QDBusMessage::createMethodCall("org.freedesktop.DBus", "/org/freedesktop/DBus",
                                                             "org.freedesktop.DBus", "ReloadConfig");
        QCOMPARE(QDBusConnection::sessionBus().call(reload).type(), QDBusMessage::ReplyMessage);
        QCOMPARE(call("Ping", {}, "org.freedesktop.DBus.Peer").type(), QDBusMessage::ReplyMessage);

        QVERIFY(waitForRows("SELECT fileName FROM file WHERE directoryId = (SELECT id FROM directory WHERE path = '%watched') "
                            "ORDER BY fileName", "later.jpg;notes.themelet"));
        QVERIFY(waitForRows("SELECT width FROM image JOIN file ON id = fileId WHERE fileName = 'later.jpg'", "64"));
    }
};

QTEST_GUILESS_MAIN(tst_Themeletd)
#include "tst_themeletd.moc"
