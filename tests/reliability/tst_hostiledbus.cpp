// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// Hostile calls on themeletd's D-Bus interface: wrong types and arity, unknown
// methods, ids and types, URLs that are no local files or lead elsewhere, and
// huge or deeply nested maps. Every call gets an answer, the service lives on,
// nothing changes outside its places, and a normal client is still served.
#include "servicefixture.h"
#include "sysroot.h"

#include <QDBusArgument>
#include <QDBusObjectPath>
#include <QDBusVariant>
#include <QRandomGenerator>

#include <sys/stat.h>

using namespace Fixture;

class tst_HostileDBus : public QObject
{
    Q_OBJECT

    const QString m_sandbox = qEnvironmentVariable("THEMELET_SANDBOX");
    const QString m_watched = m_sandbox + "/watched";
    const QString m_package = Sysroot::path("/usr/share/themelet/sunset");
    QProcess m_service;
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
        const QString error = answer.errorName();
        const bool answered = answer.type() == QDBusMessage::ReplyMessage
                || (answer.type() == QDBusMessage::ErrorMessage && error != "org.freedesktop.DBus.Error.NoReply"
                    && error != "org.freedesktop.DBus.Error.ServiceUnknown");
        if (answered && Service::ownerPid() == m_service.processId())
            return;
        QString shown;
        QDebug(&shown) << method << arguments;
        QFAIL(qPrintable(shown.left(300) + ": " + error + ' ' + answer.errorMessage()));
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
        TestDatabase db;
        QVERIFY(QTest::qWaitFor([&]() { return db.value("SELECT count(*) FROM themelet") == 1 && db.value("SELECT count(*) FROM image") == 1; }, 60000));
        m_themelet = db.value("SELECT fileId FROM themelet").toLongLong();
        m_file = db.value("SELECT fileId FROM image").toLongLong();
    }

    void cleanupTestCase() { QVERIFY(Service::stop(m_service)); }

    void hostileCalls()
    {
        // Path, size and time of everything but the service's own places: the index and
        // wallpapers under data/, dconf under config/.
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
        const QString victim = m_sandbox + "/victim", keep = victim + "/keep.jpg", tone = victim + "/keep.ogg";
        const QStringList urls { "", "relative/a.jpg", "..", "../../etc/passwd", "/../../etc/passwd", m_watched + "/../victim/keep.jpg",
            "file://" + m_watched + "/../../victim/keep.jpg", "file:relative.jpg", "file://otherhost/etc/passwd", "http://example.com/a.jpg",
            "data:image/png;base64,AAAA", "file:///", "/", "/proc/self/mem", "/dev/zero", victim + "/fifo", "file://" + victim + "/fifo",
            victim, keep, tone, "file://" + keep, m_watched + "/a.jpg", m_package + "/sunset.themelet", "file://" + m_package + "/images/sunset.jpg",
            QString(64 * 1024, 'a'), "/" + QString(5000, 'b'), "/tmp/%00x", QString::fromUtf8("/t\xc3\xa4st/\xe2\x80\x8f.jpg"),
            "file:///%2e%2e/%2e%2e/etc/passwd", "file:///tmp/a%2Fb.jpg", "\n/etc/passwd", " /etc/passwd" };
        for (const QString &url : urls) {
            for (const char *method : { "createThemelet", "indexFile", "installPackage", "setThemelet" })
                attack(method, { url });
            attack("setFavorite", { url, true });
            attack("setFavorite", { url, false });
        }
        // Unknown and known ids and types, with values that aren't what the keys want.
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
        const auto resource = [&](const QString &key, const QVariant &url) { return nested(1, QVariantMap { { key, QVariantMap { { "url", url } } } }); };
        const QList<QVariantMap> maps { {}, { { "displayName", 5 } }, { { "displayName", QString(100000, 'n') } }, { { "ringerVolume", 1e300 } },
            { { "ringerVolume", "60" } }, { { "highlightColor", "#12" } }, { { "homeWallpaper", keep } }, { { "url", "file://" + keep } },
            { { "resources", 5 } }, resource("ringerToneFile", tone), resource("ringerToneFile", "../../keep.ogg"), resource("bogusFile", tone),
            resource("File", 1), { { "unknownKey", QVariantList { 1, "two", QVariantMap { { "three", 3.0 } } } } },
            { { "contentId", 1 }, { "type", 2 }, { "mimeType", "x/y" }, { "fileName", "../../x" } },
            { { "messageToneEnabled", QVariant::fromValue(QDBusVariant(true)) } }, { { "bytes", QByteArray(70000, '\0') } },
            // 21 levels of a{sv} are the deepest that the bus carries.
            nested(10, 1), nested(21, "deep"), nested(20, QVariantMap { { "url", tone } }),
            { { "resources", QVariant::fromValue(structure) } }, { { "resources", QVariant::fromValue(intKeys) } },
            nested(3, QVariant::fromValue(intKeys)) };
        for (int type : { -1, 0, 1, 2, 3, 4, 5, 6, 7, 8, 99, INT_MIN, INT_MAX }) {
            for (qlonglong id : { 0LL, -1LL, 1LL, m_themelet, m_file, m_themelet + 1000, LLONG_MAX, LLONG_MIN }) {
                attack("remove", { type, id });
                for (const QVariantMap &map : maps)
                    attack("saveAttributes", { type, id, map });
            }
        }
        // Huge and wide maps.
        QVariantMap huge, wide;
        for (int i = 0; i < 100000; ++i)
            huge.insert(QString::number(i), i);
        for (int i = 0; i < 2000; ++i)
            wide.insert("key" + QString::number(i), nested(10, i));
        for (const QVariantList &arguments : { QVariantList { 1, m_themelet, huge }, { 0, m_file, huge }, { 1, m_themelet, wide } })
            attack("saveAttributes", arguments);

        // Wrong arity and types, and names that don't exist, from a seeded generator.
        const QStringList methods { "createThemelet", "indexFile", "installPackage", "refreshThemelets", "remove", "saveAttributes",
                                    "setThemelet", "setFavorite", "Remove", "create", "x", "delete", "saveAttributes2", "contentChanged" };
        const QVariantList values { 1, "s", true, 2.5, qlonglong(7), QVariant::fromValue(uchar(3)), QStringList { "a" },
                                    QByteArray("ab"), QVariantMap { { "k", 1 } }, QVariantList { 1, "x" },
                                    QVariant::fromValue(QDBusObjectPath("/p")), QVariant::fromValue(QDBusVariant(5)),
                                    "file://" + keep, qlonglong(m_themelet), -1 };
        QRandomGenerator random(14);
        for (int i = 0; i < 600; ++i) {
            QVariantList arguments;
            for (int n = random.bounded(5); n > 0; --n)
                arguments << values.at(random.bounded(values.size()));
            attack(methods.at(random.bounded(methods.size())), arguments);
        }
        for (const char *interface : { "com.vorka.themeletd.Other", "org.freedesktop.DBus.Properties" })
            attack("Get", { "com.vorka.themeletd", "x" }, interface);
        qInfo("%d hostile calls answered", m_calls);
        QVERIFY(m_calls >= 1000);

        // A normal client is still served, and what was written stayed in its places.
        QCOMPARE(Service::call("setFavorite", { "file://" + m_package + "/images/sunset.jpg", false }).arguments(), QVariantList { true });
        Service::call("saveAttributes", { 1, m_themelet, QVariantMap { { "displayName", "Still here" } } });
        TestDatabase db;
        QVERIFY(QTest::qWaitFor([&]() { return db.value("SELECT displayName FROM file WHERE id = " + QString::number(m_themelet)) == "Still here"; }));
        QCOMPARE(db.value("PRAGMA integrity_check").toString(), QString("ok"));
        QCOMPARE(snapshot(), before);
    }
};

QTEST_GUILESS_MAIN(tst_HostileDBus)
#include "tst_hostiledbus.moc"
