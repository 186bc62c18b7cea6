// Hostile calls on themeletd's D-Bus interface: wrong types and arity, unknown
// methods, ids and types, URLs that are no local files or lead elsewhere, and
// huge or deeply nested maps. Every call gets an answer, the service lives on,
// nothing changes outside its places, and a normal client is still served.
#include "servicefixture.h"
#include "sysroot.h"

#include <QDBusObjectPath>
#include <QDBusVariant>
#include <QRandomGenerator>

#include <sys/stat.h>

using namespace Fixture;

namespace {

// Path, size and time of everything under `root`, but for `skipped` subtrees.
QStringList snapshot(const QString &root, const QStringList &skipped)
{
    QStringList entries;
    QDirIterator it(root, QDir::AllEntries | QDir::Hidden | QDir::System | QDir::NoDotAndDotDot,
                    QDirIterator::Subdirectories);
    while (it.hasNext()) {
        const QString path = it.next();
        if (std::any_of(skipped.begin(), skipped.end(), [&](const QString &s) { return path.startsWith(s); }))
            continue;
        const QFileInfo info = it.fileInfo();
        entries << path + QLatin1Char('|') + QString::number(info.isDir() ? 0 : info.size()) + QLatin1Char('|')
                        + QString::number(info.lastModified().toMSecsSinceEpoch());
    }
    entries.sort();
    return entries;
}

QVariantMap nested(int depth, const QVariant &leaf)
{
    QVariant value = leaf;
    for (int i = 0; i < depth; ++i)
        value = QVariantMap { { QStringLiteral("resources"), value } };
    return value.toMap();
}

}

class tst_HostileDBus : public QObject
{
    Q_OBJECT

    const QString m_sandbox = qEnvironmentVariable("THEMELET_SANDBOX");
    const QString m_watched = m_sandbox + "/watched";
    const QString m_package = Sysroot::path("/usr/share/themelet/sunset");
    QProcess m_service;
    qint64 m_pid = 0;
    qint64 m_themelet = 0;
    qint64 m_file = 0;
    int m_calls = 0;

    // One call: it must be answered, by a reply or an error, and the service must live.
    void attack(const QString &method, const QVariantList &arguments, const QString &interface = Service::Name)
    {
        if (QTest::currentTestFailed())
            return;
        const QDBusMessage answer = Service::call(method, arguments, 30000, interface);
        ++m_calls;
        const bool answered = answer.type() == QDBusMessage::ReplyMessage
                || (answer.type() == QDBusMessage::ErrorMessage && answer.errorName() != "org.freedesktop.DBus.Error.NoReply"
                    && answer.errorName() != "org.freedesktop.DBus.Error.ServiceUnknown");
        if (!answered || Service::ownerPid() != m_pid) {
            QString shown;
            QDebug(&shown) << arguments;
            QFAIL(qPrintable(QStringLiteral("%1 %2: %3 %4").arg(method, shown.left(300), answer.errorName(), answer.errorMessage())));
        }
    }

private slots:
    void initTestCase()
    {
        QVERIFY(writeTree(m_package, { "images/sunset.jpg", "sounds/dusk.ogg" }, "x"));
        QVERIFY(write(m_package + "/sunset.themelet", R"({"wallpaper": "sunset.jpg", "displayName": "Sunset", )"
                                                      R"("ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));
        QVERIFY(QDir().mkpath(m_watched) && writeJpeg(m_watched + "/a.jpg") && write(m_watched + "/sub/b.txt", "b"));
        QVERIFY(write(m_sandbox + "/victim/keep.jpg", "precious") && write(m_sandbox + "/victim/keep.ogg", "precious"));
        QVERIFY(mkfifo(qPrintable(m_sandbox + "/victim/fifo"), 0600) == 0);
        QVERIFY(Service::start(m_service, { m_watched }));
        m_pid = m_service.processId();
        TestDatabase db;
        QVERIFY(QTest::qWaitFor([&]() {
            return db.value("SELECT count(*) FROM themelet").toInt() == 1
                    && db.value("SELECT count(*) FROM image").toInt() == 1;
        }, 60000));
        m_themelet = db.value("SELECT fileId FROM themelet").toLongLong();
        m_file = db.value("SELECT fileId FROM image").toLongLong();
    }

    void cleanupTestCase() { QVERIFY(Service::stop(m_service)); }

    void hostileCalls()
    {
        // The service's own places: the index and wallpapers under the data
        // directory, dconf under the configuration directory.
        const QStringList places { m_sandbox + "/data", m_sandbox + "/config", m_sandbox + "/cache", m_sandbox + "/runtime" };
        const QStringList before = snapshot(m_sandbox, places);

        const QString victim = m_sandbox + "/victim";
        const QStringList urls {
            "", "relative/a.jpg", "a.jpg", ".", "..", "../../etc/passwd", "/../../etc/passwd", m_watched + "/../victim/keep.jpg",
            "file://" + m_watched + "/../../victim/keep.jpg", "file:relative.jpg", "file://otherhost/etc/passwd",
            "http://example.com/a.jpg", "ftp://x/y", "data:image/png;base64,AAAA", "file:///", "file:///nonexistent/x.jpg",
            "/", "/proc/self/mem", "/proc/self/fd/0", "/dev/zero", "/dev/null", victim + "/fifo", "file://" + victim + "/fifo",
            victim, victim + "/keep.jpg", victim + "/keep.ogg", "file://" + victim + "/keep.jpg", m_watched + "/a.jpg",
            m_package + "/sunset.themelet", m_package + "/images/sunset.jpg", "file://" + m_package + "/images/sunset.jpg",
            QString(64 * 1024, 'a'), "/" + QString(5000, 'b'), QString("/tmp/%00x"), QString::fromUtf8("/t\xc3\xa4st/\xe2\x80\x8f.jpg"),
            "file:///%2e%2e/%2e%2e/etc/passwd", "file:///tmp/a%2Fb.jpg", "\n/etc/passwd", " /etc/passwd",
        };
        const QList<int> types { -1, 0, 1, 2, 3, 4, 5, 6, 7, 8, 99, INT_MIN, INT_MAX };
        const QList<qlonglong> ids { 0, -1, 1, m_themelet, m_file, m_themelet + 1000, LLONG_MAX, LLONG_MIN };

        // URLs and paths for every string method.
        for (const QString &url : urls) {
            for (const char *method : { "createThemelet", "indexFile", "installPackage", "setThemelet" })
                attack(method, { url });
            attack("setFavorite", { url, true });
            attack("setFavorite", { url, false });
        }
        // Unknown and known ids and types, with values that aren't what the keys want.
        const QList<QVariantMap> maps {
            {}, { { "displayName", 5 } }, { { "displayName", QString(100000, 'n') } }, { { "ringerVolume", -1 } },
            { { "ringerVolume", 1e300 } }, { { "ringerVolume", "60" } }, { { "favorite", "yes" } }, { { "highlightColor", 7 } },
            { { "highlightColor", "#12" } }, { { "homeWallpaper", victim + "/keep.jpg" } },
            { { "applicationWallpaper", victim + "/keep.jpg" } }, { { "url", "file://" + victim + "/keep.jpg" } },
            { { "resources", 5 } }, { { "resources", QVariantMap { { "ringerToneFile", 5 } } } },
            { { "resources", QVariantMap { { "ringerToneFile", QVariantMap { { "url", victim + "/keep.ogg" } } } } } },
            { { "resources", QVariantMap { { "ringerToneFile", QVariantMap { { "url", "../../keep.ogg" } } } } } },
            { { "resources", QVariantMap { { "bogusFile", QVariantMap { { "url", victim + "/keep.ogg" } } } } } },
            { { "resources", QVariantMap { { "File", QVariantMap { { "url", 1 } } } } } },
            { { "unknownKey", QVariantList { 1, "two", QVariantMap { { "three", 3.0 } } } } },
            { { "contentId", 1 }, { "type", 2 }, { "mimeType", "x/y" }, { "fileName", "../../x" } },
            { { "ringerToneEnabled", 3 } }, { { "messageToneEnabled", QVariant::fromValue(QDBusVariant(true)) } },
            { { "objectPath", QVariant::fromValue(QDBusObjectPath("/a/b")) } }, { { "bytes", QByteArray(70000, '\0') } },
            // 21 levels of a{sv} are the deepest that the bus carries.
            nested(10, 1), nested(21, "deep"), nested(20, QVariantMap { { "url", victim + "/keep.ogg" } }),
        };
        for (int type : types) {
            for (qlonglong id : ids) {
                attack("remove", { type, id });
                for (const QVariantMap &map : maps)
                    attack("saveAttributes", { type, id, map });
            }
        }
        // Huge maps.
        QVariantMap huge;
        for (int i = 0; i < 100000; ++i)
            huge.insert(QString::number(i), i);
        attack("saveAttributes", { 1, m_themelet, huge });
        attack("saveAttributes", { 0, m_file, huge });
        QVariantMap wide;
        for (int i = 0; i < 2000; ++i)
            wide.insert("key" + QString::number(i), nested(10, i));
        attack("saveAttributes", { 1, m_themelet, wide });

        // Wrong arity and types, and names that don't exist, from a seeded generator.
        const QStringList methods { "createThemelet", "indexFile", "installPackage", "refreshThemelets", "remove",
                                    "saveAttributes", "setThemelet", "setFavorite", "Remove", "create", "", "delete",
                                    "saveAttributes2", "contentChanged" };
        const QVariantList values { 1, "s", true, 2.5, qlonglong(7), QVariant::fromValue(uchar(3)), QStringList { "a" },
                                    QByteArray("ab"), QVariantMap { { "k", 1 } }, QVariantList { 1, "x" },
                                    QVariant::fromValue(QDBusObjectPath("/p")), QVariant::fromValue(QDBusVariant(5)),
                                    "file://" + victim + "/keep.jpg", qlonglong(m_themelet), -1 };
        QRandomGenerator random(14);
        for (int i = 0; i < 600; ++i) {
            QString method = methods.at(random.bounded(methods.size()));
            if (method.isEmpty())
                method = QStringLiteral("x");
            QVariantList arguments;
            for (int n = random.bounded(5); n > 0; --n)
                arguments << values.at(random.bounded(values.size()));
            attack(method, arguments);
        }
        for (const char *interface : { "com.vorka.themeletd.Other", "org.freedesktop.DBus.Properties" })
            attack("Get", { "com.vorka.themeletd", "x" }, interface);

        qInfo("%d hostile calls answered", m_calls);
        QVERIFY(m_calls >= 1000);

        // A normal client is still served, and what was written stayed in its places.
        QDBusMessage answer = Service::call("setFavorite", { QUrl::fromLocalFile(m_package + "/images/sunset.jpg").toString(), false });
        QCOMPARE(answer.type(), QDBusMessage::ReplyMessage);
        QCOMPARE(answer.arguments().value(0).toBool(), true);
        answer = Service::call("saveAttributes", { 1, m_themelet, QVariantMap { { "displayName", "Still here" } } });
        QCOMPARE(answer.type(), QDBusMessage::ReplyMessage);
        TestDatabase db;
        QVERIFY(QTest::qWaitFor([&]() { return db.value(QStringLiteral("SELECT displayName FROM file WHERE id = %1")
                                                             .arg(m_themelet)).toString() == "Still here"; }));
        QCOMPARE(db.value("PRAGMA integrity_check").toString(), QString("ok"));
        QCOMPARE(snapshot(m_sandbox, places), before);
    }
};

QTEST_GUILESS_MAIN(tst_HostileDBus)
#include "tst_hostiledbus.moc"
