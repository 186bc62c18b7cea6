// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// themeletctl end to end: the real client against the real themeletd on the
// sandbox's private bus, over a package and a Pictures folder.
#include "servicefixture.h"

#include <QDBusContext>

using namespace Fixture;

static QString sandbox() { return qEnvironmentVariable("THEMELET_SANDBOX"); }
static QString pictures() { return sandbox() + QStringLiteral("/home/Pictures"); }
static QString package() { return InstallManager::installPaths().at(0) + QStringLiteral("/sunset"); }

// The exit code, and stdout followed by "stderr: " and stderr.
static QPair<int, QString> ctl(const QStringList &arguments)
{
    QProcess process;
    process.start(QStringLiteral(THEMELETCTL), arguments);
    // Events keep flowing: a fake service in this process must answer.
    if (!QTest::qWaitFor([&]() { return process.state() == QProcess::NotRunning; }, 60000))
        process.kill();
    process.waitForFinished();
    return { process.exitStatus() == QProcess::NormalExit ? process.exitCode() : -1,
             QString::fromUtf8(process.readAllStandardOutput() + "stderr: " + process.readAllStandardError()) };
}

// Another process on the service's name: its error text must reach the terminal as one clean line.
class Impostor : public QObject, protected QDBusContext
{
    Q_OBJECT
    Q_CLASSINFO("D-Bus Interface", "com.vorka.themeletd")

public slots:
    void refreshThemelets() { sendErrorReply("com.vorka.themeletd.Error.Failed", "first\nsecond\x1b[2J"); }
};

class TestThemeletctl : public QObject
{
    Q_OBJECT

    QProcess m_service;
    QString m_id; // of the package's themelet

    // Each row: the arguments, the exit code, and a pattern for the output (see ctl()).
    static void columns()
    {
        QTest::addColumn<QStringList>("arguments");
        QTest::addColumn<int>("exitCode");
        QTest::addColumn<QString>("pattern");
    }
    static void row(const QStringList &arguments, int exitCode, const QString &pattern)
    {
        QTest::addRow("%s", qPrintable(arguments.join(' ').right(60))) << arguments << exitCode << pattern;
    }

    // Reads run until they match, as writes take effect in the service's loops.
    static void verifyRow()
    {
        QFETCH(QStringList, arguments);
        QFETCH(int, exitCode);
        QFETCH(QString, pattern);
        const QRegularExpression expected(pattern, QRegularExpression::DotMatchesEverythingOption);
        const bool read = QStringList { "list", "show", "status" }.contains(arguments.value(0));
        QElapsedTimer timer;
        timer.start();
        QPair<int, QString> result = ctl(arguments);
        while (read && (result.first != exitCode || !expected.match(result.second).hasMatch()) && !timer.hasExpired(20000))
            result = (QTest::qWait(100), ctl(arguments));
        QVERIFY2(result.first == exitCode && expected.match(result.second).hasMatch(),
                 qPrintable(QString::number(result.first) + ": " + result.second));
        QVERIFY2(exitCode != 1 || result.second.section("stderr: ", 1).count('\n') <= 1, "one line of error");
    }

private slots:
    void initTestCase()
    {
        QVERIFY(write(package() + "/sunset.themelet", R"({"wallpaper": "sunset.jpg", "displayName": "Sunset", "favorite": false,
                      "ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));
        QVERIFY(QDir().mkpath(package() + "/images") && QDir().mkpath(pictures()) && QDir().mkpath(sandbox() + "/elsewhere"));
        QVERIFY(writeJpeg(package() + "/images/sunset.jpg") && write(package() + "/sounds/dusk.ogg", "OggS"));
        // Outside the watched and install paths: for index and install.
        QVERIFY(writeJpeg(sandbox() + "/elsewhere/new.jpg"));
        QVERIFY(write(sandbox() + "/extra/extra.themelet", R"({"wallpaper": "extra.jpg", "displayName": "Extra"})"));
        QVERIFY(QDir().mkpath(sandbox() + "/extra/images") && writeJpeg(sandbox() + "/extra/images/extra.jpg"));
        for (int i = 1; i <= 3; ++i)
            QVERIFY(writeJpeg(pictures() + QStringLiteral("/photo%1.jpg").arg(i), { QStringLiteral("set Exif.Photo.DateTimeOriginal 2014:05:0%1 12:00:00").arg(4 - i) }));
        // A package with one fault of each kind, for check.
        const QString bad = sandbox() + "/bad";
        QVERIFY(write(bad + "/a.themelet", R"({"wallpaper": "../x.jpg", "colour": "red"})"));
        QVERIFY(write(bad + "/b.themelet", "{\n \"wallpaper\": \"w.jpg\",\n oops\n}"));
        QVERIFY(QDir().mkpath(bad + "/images") && writeJpeg(bad + "/images/w.jpg") && write(bad + "/t/t.ogg", "OggS"));
        QVERIFY(write(bad + "/t.index", R"({"files": [{"fileName": "t.ogg"}, {"fileName": "../etc"}]})"));
        QVERIFY(write(bad + "/huge.index", QByteArray(4 * 1024 * 1024 + 1, ' ')));
        QVERIFY(QDir().mkpath(sandbox() + "/empty"));
    }

    void withoutService_data()
    {
        columns();
        const QString tryHelp = "\nthemeletctl: try 'themeletctl --help'\n$";
        row({}, 2, "^stderr: themeletctl: no command given" + tryHelp);
        row({ "--help" }, 0, "^Usage: themeletctl.*\n  monitor .*stderr: $");
        row({ "--json", "frob" }, 2, "^stderr: \\{\"error\":\"unknown command 'frob'\",\"hint\":\"try 'themeletctl --help'\"\\}\n$");
        // Ids too, which would need the (missing) index to become URLs.
        for (const QStringList &command : { QStringList { "set", "12" }, { "remove", "themelet", "/x.themelet" }, { "monitor" } })
            row(command, 1, "^stderr: themeletctl: themeletd is not running \\(nobody owns com.vorka.themeletd on the session bus\\); start it with 'themeletd &' "
                               "or install its D-Bus activation file\n$");
        row({ "list", "photos" }, 1, "^stderr: themeletctl: no index at .*themeletd.sqlite \\(themeletd has not run yet\\)\n$");
        // check reads as the engine reads, with no service.
        row({ "check", package() }, 0, "^.*: no problems found\nstderr: $");
        const QString bad = "/bad/";
        row({ "check", sandbox() + "/bad" }, 1, "^[^\\n]*" + QStringList {
                bad + "a.themelet: colour: unknown key; ignored",
                bad + "a.themelet: wallpaper: '../x.jpg' leaves .*/bad/images: only a plain file name is allowed",
                bad + "b.themelet: invalid JSON at line 3, column 3: unterminated object; the file is not read",
                bad + "huge.index: 4194305 bytes: larger than the 4194304 bytes a package file may have; not read",
                bad + "t.index: files\\[1\\].fileName: '../etc' is not a plain file name in .*/bad/t; ignored" }.join("\n[^\n]*") + "\nstderr: $");
        row({ "check", "--json", sandbox() + "/bad/b.themelet" }, 1, "^\\[\\s*.\\s*\"field\": \"\",\\s*\"file\": \".*/b.themelet\",\\s*\"problem\": \"invalid JSON");
        row({ "check", sandbox() + "/empty" }, 1, "nothing installable: no .themelet or .index file in it\nstderr: $");
        row({ "status" }, 1, "^service: +not running\ndatabase: +.*/themeletd.sqlite \\(missing\\)\nactive themelet: +none\nstderr: $");
    }

    void withoutService()
    {
        verifyRow();
        QVERIFY2(!QFile::exists(TestDatabase::indexPath()), "a client never creates the index");
    }

    void impostor()
    {
        QDBusConnection bus = QDBusConnection::sessionBus();
        Impostor service;
        QVERIFY(bus.registerObject(Service::Path, &service, QDBusConnection::ExportAllSlots) && bus.registerService(Service::Name));
        const QPair<int, QString> result = ctl({ "refresh" });
        bus.unregisterService(Service::Name);
        bus.unregisterObject(Service::Path);
        QCOMPARE(result, qMakePair(1, QStringLiteral("stderr: themeletctl: first second [2J\n")));
    }

    void startService()
    {
        QVERIFY(Service::start(m_service, { pictures() }));
        const QRegularExpression settled(R"("photos": 3,.*"themelets": 1,\s*"tones": 1)", QRegularExpression::DotMatchesEverythingOption);
        // A script waits for pending 0, from the first answer on: then everything is there.
        QVERIFY(QTest::qWaitFor([&]() { return ctl({ "status", "--json" }).second.contains("\"pending\": 0,"); }, 30000));
        QVERIFY(settled.match(ctl({ "status", "--json" }).second).hasMatch());
        m_id = QRegularExpression(R"("contentId": (\d+))").match(ctl({ "show", "--json", package() + "/sunset.themelet" }).second).captured(1);
    }

    // Rows run in order, each on the state the one before left.
    void withService_data()
    {
        columns();
        const QString P = package(), H = pictures(), S = sandbox(), none = "^stderr: $";
        const QString sunset = P + "/sunset.themelet", created = qEnvironmentVariable("XDG_DATA_HOME") + "/Vorka/themeletd/wallpapers/photo1.jpg";
        row({ "list", "themelets" }, 0, "^ID +NAME +FLAGS +PATH\n" + m_id + " +Sunset +read-only +" + sunset + "\nstderr: $");
        row({ "list", "themelets", "--json" }, 0, "^\\[\\s*\\{\\s*\"active\": false,.*\"contentId\": " + m_id + ",.*\"displayName\": \"Sunset\",.*\"filePath\": \""
                    + sunset + "\",.*\"readOnly\": true,.*\"fileName\": \"dusk.ogg\".*\"url\": \"file://" + sunset
                    + "\",.*\"wallpaperUrl\": \"file://" + P + "/images/sunset.jpg\",[^{}]*\\}\\s*\\]\n");
        row({ "list", "photos" }, 0, "^ID +TAKEN +SIZE +PATH\n\\d+ +2014-05-01T12:00:00 +64x48 +" + H + "/photo3.jpg\n.*photo2.*\n.*photo1");
        row({ "list", "tones" }, 0, "^ID +CATEGORY +NAME +PATH\n\\d+ +- +dusk.ogg +" + P + "/sounds/dusk.ogg\nstderr: $");
        row({ "show", sunset }, 0, "^type: themelet\ncontentId: " + m_id + "\n.*\ndisplayName: Sunset\n.*\nresources.ringerToneFile.url: " + P
                    + "/sounds/dusk.ogg\n.*\nactive: false\nstderr: $");
        row({ "status" }, 0, "^service: +running \\(pid \\d+\\)\ndatabase: .*\nschema version: +12\n.*pending: +0\nthemelets: +1\nphotos: +3\ntones: +1\nactive themelet: +none\nstderr: $");
        row({ "status", "--json" }, 0, R"(^\{\s*"activeThemelet": null,.*"pending": 0,.*"schemaVersion": 12\s*\},\s*"service": \{.*"pid": \d+,\s*"running": true)");

        row({ "create", H + "/photo1.jpg" }, 0, "^Created themelet \\d+: photo1 \\(" + created + "\\)\nstderr: $");
        row({ "set", sunset }, 0, "^Active themelet " + m_id + ": Sunset \\(" + sunset + "\\)\nstderr: $");
        row({ "set", "--json", m_id }, 0, "\"active\": true,.*\"contentId\": " + m_id + ",.*\"type\": \"themelet\"");
        row({ "favorite", m_id, "on" }, 0, none);
        row({ "favorite", P + "/images/sunset.jpg", "off" }, 0, none);
        row({ "favorite", H + "/photo3.jpg", "off" }, 1, "^stderr: themeletctl: no themelet has the wallpaper " + H + "/photo3.jpg\n$");
        row({ "index", S + "/elsewhere/new.jpg" }, 0, none);
        row({ "show", "--json", S + "/elsewhere/new.jpg" }, 0, R"("type": "photo",.*"width": 64)");
        row({ "remove", "themelet", created }, 0, none);
        row({ "show", created }, 1, "^stderr: themeletctl: not in the index: " + created + "\n$");
        row({ "install", S + "/extra" }, 0, none);
        row({ "refresh" }, 0, none);
        row({ "status", "--json" }, 0, "\"pending\": 0"); // settled: the monitors hear only their own changes
    }

    void withService() { verifyRow(); }

    // Last: monitors print changes, then notice the service go.
    void monitorAndStop()
    {
        QProcess text, json;
        text.start(QStringLiteral(THEMELETCTL), { "monitor" });
        json.start(QStringLiteral(THEMELETCTL), { "monitor", "--json" });
        // Changes are made until both print the themelet's notice, as a monitor subscribes at its own pace;
        // notices of other types may come first.
        const QString textLine = "\ncontentChanged 1 themelet\n";
        const QString jsonLine = "\n" R"({"signal":"contentChanged","type":1,"typeName":"themelet"})" "\n";
        QString textOut = "\n", jsonOut = "\n";
        QElapsedTimer timer;
        timer.start();
        for (bool on = true; !(textOut.contains(textLine) && jsonOut.contains(jsonLine)) && !timer.hasExpired(20000); on = !on) {
            QCOMPARE(ctl({ "favorite", package() + "/sunset.themelet", on ? "on" : "off" }).first, 0);
            QTest::qWait(300);
            textOut += QString::fromUtf8(text.readAllStandardOutput());
            jsonOut += QString::fromUtf8(json.readAllStandardOutput());
        }
        const bool lines = QRegularExpression("^\n(contentChanged \\d \\w+\n)*$").match(textOut).hasMatch();
        QVERIFY2(lines && textOut.contains(textLine), qPrintable(textOut));
        QVERIFY2(jsonOut.contains(jsonLine), qPrintable(jsonOut));
        QVERIFY(Service::stop(m_service));
        for (QProcess *monitor : { &text, &json }) {
            QVERIFY(monitor->waitForFinished(20000));
            QCOMPARE(monitor->exitCode(), 1);
            QCOMPARE(QString::fromUtf8(monitor->readAllStandardError()),
                     monitor == &text ? "themeletctl: themeletd left the session bus\n" : R"({"error":"themeletd left the session bus"})" "\n");
        }
    }
};

QTEST_GUILESS_MAIN(TestThemeletctl)
#include "tst_themeletctl.moc"
