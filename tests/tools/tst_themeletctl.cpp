// themeletctl end to end: the real client against the real themeletd on the
// sandbox's private bus, over a package, a tone pack and a Pictures folder.
#include "indexfixture.h"

#include <QDBusConnection>
#include <QDBusContext>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

using namespace Fixture;

namespace {

struct Result
{
    int exitCode = -1;
    QString out;
    QString err;
};

QString sandbox() { return qEnvironmentVariable("THEMELET_SANDBOX"); }
QString pictures() { return sandbox() + QStringLiteral("/home/Pictures"); }
QString package() { return InstallManager::installPaths().at(0) + QStringLiteral("/sunset"); }
QString tones() { return InstallManager::installPaths().at(1) + QStringLiteral("/classic"); }
QString s_themeletId;
QString s_createdId;

// %P the package, %H the Pictures folder, %S the sandbox, %T the package
// themelet's id, %C the id of the themelet created last.
QString expand(QString text, bool forPattern = false)
{
    const auto path = [forPattern](const QString &value) { return forPattern ? QRegularExpression::escape(value) : value; };
    return text.replace(QLatin1String("%P"), path(package())).replace(QLatin1String("%H"), path(pictures()))
            .replace(QLatin1String("%S"), path(sandbox())).replace(QLatin1String("%T"), s_themeletId).replace(QLatin1String("%C"), s_createdId);
}

Result ctl(const QStringList &arguments, const QProcessEnvironment &environment = QProcessEnvironment::systemEnvironment())
{
    QProcess process;
    process.setProcessEnvironment(environment);
    // An event loop, not waitForFinished: a fake service in this process must answer.
    QEventLoop loop;
    QObject::connect(&process, QOverload<int, QProcess::ExitStatus>::of(&QProcess::finished), &loop, &QEventLoop::quit);
    QObject::connect(&process, &QProcess::errorOccurred, &loop, &QEventLoop::quit);
    QTimer::singleShot(60000, &loop, &QEventLoop::quit);
    process.start(QStringLiteral(THEMELETCTL), arguments);
    loop.exec();
    Result result;
    if (process.state() != QProcess::NotRunning) {
        process.kill();
        process.waitForFinished();
        return result;
    }
    result.exitCode = process.exitStatus() == QProcess::NormalExit ? process.exitCode() : -1;
    result.out = QString::fromUtf8(process.readAllStandardOutput());
    result.err = QString::fromUtf8(process.readAllStandardError());
    return result;
}

// "a.0.b" walks objects by key and arrays by index.
QJsonValue at(QJsonValue value, const QString &path)
{
    for (const QString &step : path.split(QLatin1Char('.'))) {
        bool isIndex = false;
        const int index = step.toInt(&isIndex);
        value = isIndex && value.isArray() ? value.toArray().at(index) : value.toObject().value(step);
    }
    return value;
}

QString text(const QJsonValue &value)
{
    if (value.isNull() || value.isUndefined())
        return QStringLiteral("null");
    if (value.isBool())
        return value.toBool() ? QStringLiteral("true") : QStringLiteral("false");
    if (value.isDouble())
        return QString::number(value.toDouble());
    return value.toString();
}

// The first of the "path=value" checks that fails on the result's JSON, or an
// empty string; "exit=N" checks the exit code.
QString failedCheck(const Result &result, const QStringList &checks)
{
    QJsonParseError error;
    const QJsonDocument document = QJsonDocument::fromJson(result.out.toUtf8(), &error);
    const QJsonValue root = document.isArray() ? QJsonValue(document.array()) : QJsonValue(document.object());
    for (const QString &check : checks) {
        const QString expected = expand(check);
        const QString path = expected.left(expected.indexOf(QLatin1Char('=')));
        const QString actual = path + '=' + (path == QLatin1String("exit") ? QString::number(result.exitCode)
                                             : error.error != QJsonParseError::NoError ? QStringLiteral("(no JSON)")
                                                                                         : text(at(root, path)));
        if (actual != expected)
            return actual + " instead of " + expected + " in:\n" + result.out + result.err;
    }
    return QString();
}

// Runs a read until its JSON passes the checks, as writes take effect in the
// service's loops; the last failure, or an empty string.
QString waitFor(QStringList arguments, const QStringList &checks)
{
    for (QString &argument : arguments)
        argument = expand(argument);
    QString failed;
    QElapsedTimer timer;
    for (timer.start(); !timer.hasExpired(30000); QTest::qWait(100)) {
        if ((failed = failedCheck(ctl(arguments), checks)).isEmpty())
            break;
    }
    return failed.isEmpty() ? failed : arguments.join(' ') + ": " + failed;
}

}

// Owns the service's name and answers what no real themeletd would.
class HostileService : public QObject, protected QDBusContext
{
    Q_OBJECT
    Q_CLASSINFO("D-Bus Interface", "com.vorka.themeletd")

public slots:
    QString setThemelet(const QString &) { return QStringLiteral("not an id"); }
    int setFavorite(const QString &, bool) { return 7; }
    void refreshThemelets()
    {
        sendErrorReply(QStringLiteral("com.vorka.themeletd.Error.Failed"), QStringLiteral("first\nsecond\x1b[2J"));
    }
};

class TestThemeletctl : public QObject
{
    Q_OBJECT

    QProcess m_service;

    bool launchService()
    {
        m_service.setProcessChannelMode(QProcess::ForwardedChannels);
        m_service.start(QStringLiteral(THEMELETD), { "--no-default-watch", "--watch", pictures() });
        return m_service.waitForStarted()
                && waitFor({ "status", "--json" }, { "exit=0", "counts.pending=0", "counts.photos=3", "counts.themelets=1",
                                                     "counts.tones=3" }).isEmpty();
    }

    // Until the monitor prints its first line: changes are made until one is
    // seen, as the monitor subscribes at its own pace.
    bool startMonitor(QProcess &monitor, const QStringList &arguments)
    {
        monitor.start(QStringLiteral(THEMELETCTL), arguments);
        if (!monitor.waitForStarted())
            return false;
        QElapsedTimer timer;
        bool on = true;
        for (timer.start(); !monitor.canReadLine() && !timer.hasExpired(20000); on = !on) {
            if (ctl({ "favorite", package() + "/sunset.themelet", on ? "on" : "off" }).exitCode != 0)
                return false;
            monitor.waitForReadyRead(300);
        }
        return monitor.canReadLine();
    }

    // Each row: arguments, exit code, patterns that stdout must each match (or
    // "path=value" JSON checks with --json), a pattern for stderr; then a read
    // whose JSON must come to pass the checks.
    void addColumns()
    {
        QTest::addColumn<QStringList>("arguments");
        QTest::addColumn<int>("exitCode");
        QTest::addColumn<QStringList>("out");
        QTest::addColumn<QString>("err");
        QTest::addColumn<QStringList>("then");
        QTest::addColumn<QStringList>("thenChecks");
    }

    void verifyRow()
    {
        QFETCH(QStringList, arguments);
        QFETCH(int, exitCode);
        QFETCH(QStringList, out);
        QFETCH(QString, err);
        for (QString &argument : arguments)
            argument = expand(argument);
        QElapsedTimer timer;
        timer.start();
        const Result result = ctl(arguments);
        QVERIFY2(timer.elapsed() < 10000, "no timeouts");
        QVERIFY2(result.exitCode == exitCode, qPrintable(result.out + result.err));
        QVERIFY2(QRegularExpression(expand(err, true)).match(result.err).hasMatch(), qPrintable(result.err));
        if (arguments.value(0) == QLatin1String("create") && exitCode == 0)
            s_createdId = QRegularExpression(QStringLiteral("(themelet |\"contentId\": )(\\d+)")).match(result.out).captured(2);
        if (arguments.contains("--json")) {
            const QString failed = failedCheck(result, out);
            QVERIFY2(failed.isEmpty(), qPrintable(failed));
        } else {
            for (const QString &pattern : out) {
                QVERIFY2(QRegularExpression(expand(pattern, true)).match(result.out).hasMatch(),
                         qPrintable(pattern + " in:\n" + result.out));
            }
        }

        QFETCH(QStringList, then);
        QFETCH(QStringList, thenChecks);
        if (then.isEmpty())
            return;
        const QString failed = waitFor(then, thenChecks);
        QVERIFY2(failed.isEmpty(), qPrintable(failed));
    }

    // A row with no follow-up read.
    static void row(const char *name, const QStringList &arguments, int exitCode, const QStringList &out, const QString &err)
    {
        QTest::newRow(name) << arguments << exitCode << out << err << QStringList() << QStringList();
    }

private slots:
    void initTestCase()
    {
        QVERIFY(write(package() + "/sunset.themelet", R"({"wallpaper": "sunset.jpg", "displayName": "Sunset", "favorite": false,
                      "ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));
        QVERIFY(QDir().mkpath(package() + "/images") && QDir().mkpath(pictures()));
        QVERIFY(writeJpeg(package() + "/images/sunset.jpg"));
        QVERIFY(write(package() + "/sounds/dusk.ogg", "OggS"));
        // A tone pack: tones.index describes the directory tones beside it.
        QVERIFY(writeTree(tones() + "/tones", { "bell.ogg", "alarm.ogg" }, "OggS"));
        QVERIFY(write(tones() + "/tones.index", R"({"files": [{"fileName": "bell.ogg", "displayName": "Bell", "category": "Default"},
                      {"fileName": "alarm.ogg", "displayName": "Alarm", "category": "Ringtone"}]})"));
        // Outside the watched and install paths: for index and install.
        QVERIFY(QDir().mkpath(sandbox() + "/elsewhere") && writeJpeg(sandbox() + "/elsewhere/new.jpg"));
        QVERIFY(write(sandbox() + "/extra/extra.themelet", R"({"wallpaper": "extra.jpg", "displayName": "Extra"})"));
        QVERIFY(QDir().mkpath(sandbox() + "/extra/images") && writeJpeg(sandbox() + "/extra/images/extra.jpg"));
        const QString date = QStringLiteral("set Exif.Photo.DateTimeOriginal 2014:05:0%1 12:00:00");
        for (int i = 1; i <= 3; ++i)
            QVERIFY(writeJpeg(pictures() + QStringLiteral("/photo%1.jpg").arg(i), { date.arg(4 - i) }));
    }

    void withoutService_data()
    {
        addColumns();
        const QString absent = "^themeletctl: themeletd is not running \\(nobody owns com.vorka.themeletd on the session bus\\)\n$";
        const QString tryHelp = "\nthemeletctl: try 'themeletctl --help'\n$";
        const QStringList none { "^$" };
        row("no command", {}, 2, none, "^themeletctl: no command given" + tryHelp);
        row("help", { "--help" }, 0, { "^Usage: themeletctl", "\n  monitor " }, "^$");
        row("unknown command", { "frob" }, 2, none, "^themeletctl: unknown command 'frob'" + tryHelp);
        row("unknown option", { "status", "--frob" }, 2, none, "^themeletctl: Unknown option 'frob'\\." + tryHelp);
        row("too many", { "set", "a", "b" }, 2, none, "^themeletctl: usage: themeletctl set ID\\|URL" + tryHelp);
        row("too few", { "remove", "file" }, 2, none, "usage: themeletctl remove TYPE ID\\|URL" + tryHelp);
        row("list what", { "list", "tunes" }, 2, none, "^themeletctl: list what\\? themelets, photos or tones" + tryHelp);
        row("favorite maybe", { "favorite", "1", "maybe" }, 2, none, "on or off, not 'maybe'" + tryHelp);
        row("remove what", { "remove", "sock", "1" }, 2, none,
            "unknown content type 'sock': file, themelet, photo, video, download or a number" + tryHelp);
        // Ids too, which would need the (missing) index to become URLs.
        for (const QStringList &command : { QStringList { "set", "12" }, { "create", "/x.jpg" }, { "install", "/x" },
                                            { "index", "/x.jpg" }, { "refresh" }, { "remove", "themelet", "/x.themelet" },
                                            { "favorite", "1", "on" }, { "monitor" } })
            row(qPrintable(command.first()), command, 1, none, absent);
        row("list without index", { "list", "photos" }, 1, none,
            "^themeletctl: no index at .*themeletd.sqlite \\(themeletd has not run yet\\)\n$");
        row("status", { "status" }, 1, { "^service: +not running\n", "\ndatabase: +.*/themeletd.sqlite \\(missing\\)\n",
                                         "\nactive themelet: +none\n$" }, "^$");
        row("status json", { "status", "--json" }, 1, { "service.running=false", "service.pid=null", "database.exists=false",
                                                        "counts.files=null", "activeThemelet=null" }, "^$");
    }

    void withoutService()
    {
        verifyRow();
        QVERIFY2(!QFile::exists(TestDatabase::indexPath()), "a client never creates the index");
    }

    void noBus()
    {
        QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
        environment.insert("DBUS_SESSION_BUS_ADDRESS", "unix:path=" + sandbox() + "/no-bus");
        const Result result = ctl({ "refresh" }, environment);
        QCOMPARE(result.exitCode, 1);
        QVERIFY2(result.err.startsWith("themeletctl: no D-Bus session bus: ") && result.err.count('\n') == 1, qPrintable(result.err));
    }

    void brokenIndex()
    {
        QVERIFY(write(TestDatabase::indexPath(), "not a database"));
        const Result list = ctl({ "list", "themelets" }), status = ctl({ "status" });
        QVERIFY(QFile::remove(TestDatabase::indexPath()));
        QCOMPARE(list.exitCode, 1);
        QCOMPARE(list.err, "themeletctl: cannot open the index at " + TestDatabase::indexPath() + '\n');
        QCOMPARE(status.exitCode, 1);
        QCOMPARE(status.err, list.err);
        QVERIFY2(status.out.contains(TestDatabase::indexPath() + " (unreadable)\n"), qPrintable(status.out));
    }

    void hostileService_data()
    {
        addColumns();
        row("wrong reply type", { "set", "/x.themelet" }, 1, { "^$" },
            "^themeletctl: Unexpected reply signature: got \"s\", expected \"x\"\n$");
        row("wrong reply type b", { "favorite", "/x.jpg", "on" }, 1, { "^$" }, "got \"i\", expected \"b\"\n$");
        row("error text is one line", { "refresh" }, 1, { "^$" }, "^themeletctl: first second \\[2J\n$");
        row("unknown method", { "install", "/x" }, 1, { "^$" }, "^themeletctl: .+\n$");
    }

    void hostileService()
    {
        QDBusConnection bus = QDBusConnection::sessionBus();
        HostileService service;
        QVERIFY(bus.registerObject(QStringLiteral("/com/vorka/themeletd"), &service, QDBusConnection::ExportAllSlots));
        QVERIFY(bus.registerService(QStringLiteral("com.vorka.themeletd")));
        verifyRow();
        bus.unregisterService(QStringLiteral("com.vorka.themeletd"));
        bus.unregisterObject(QStringLiteral("/com/vorka/themeletd"));
    }

    void startService()
    {
        QVERIFY2(launchService(), "themeletd settles on the sandbox's content");
        const Result themelet = ctl({ "show", "--json", package() + "/sunset.themelet" });
        s_themeletId = text(at(QJsonDocument::fromJson(themelet.out.toUtf8()).object(), "contentId"));
        QVERIFY2(s_themeletId.toInt() > 0, qPrintable(themelet.out + themelet.err));
    }

    void readCommands_data()
    {
        addColumns();
        const QString photo3 = "\\d+ +2014-05-01T12:00:00 +64x48 +%H/photo3.jpg\n";
        row("themelets", { "list", "themelets" }, 0, { "^ID +NAME +FLAGS +PATH\n%T +Sunset +read-only +%P/sunset.themelet\n$" }, "^$");
        row("themelets json", { "list", "themelets", "--json" }, 0,
            { "0.contentId=%T", "0.type=themelet", "0.displayName=Sunset", "0.readOnly=true", "0.favorite=false",
              "0.active=false", "0.filePath=%P/sunset.themelet", "0.url=file://%P/sunset.themelet",
              "0.wallpaperUrl=file://%P/images/sunset.jpg", "0.ringerToneEnabled=true",
              "0.resources.ringerToneFile.fileName=dusk.ogg", "1=null" }, "^$");
        row("photos by date", { "list", "photos" }, 0, { "^ID +TAKEN +SIZE +PATH\n" + photo3, "photo3.*\n.*photo2.*\n.*photo1" }, "^$");
        row("photos json", { "list", "photos", "--json" }, 0,
            { "0.type=photo", "0.fileName=photo3.jpg", "0.dateTaken=2014-05-01T12:00:00", "0.width=64", "0.height=48",
              "0.mimeType=image/jpeg", "0.readOnly=false", "2.fileName=photo1.jpg" }, "^$");
        row("tones by category", { "list", "tones" }, 0,
            { "^ID +CATEGORY +NAME +PATH\n\\d+ +Ringtone +Alarm +.*/alarm.ogg\n\\d+ +Default +Bell .*\n\\d+ +- .*/dusk.ogg\n$" }, "^$");
        row("tones json", { "list", "tones", "--json" }, 0,
            { "0.category=Ringtone", "0.displayName=Alarm", "1.displayName=Bell", "1.category=Default", "2.fileName=dusk.ogg", "2.category=", "3=null" }, "^$");
        row("show themelet by path", { "show", "%P/sunset.themelet" }, 0,
            { "^type: themelet\ncontentId: %T\n", "\ndisplayName: Sunset\n", "\nresources.ringerToneFile.url: %P/sounds/dusk.ogg\n",
              "\nactive: false\n$" }, "^$");
        row("show themelet by id", { "show", "%T", "--json" }, 0, { "type=themelet", "url=file://%P/sunset.themelet" }, "^$");
        row("show photo", { "show", "%H/photo1.jpg", "--json" }, 0, { "type=photo", "dateTaken=2014-05-03T12:00:00" }, "^$");
        row("show tone by url", { "show", "file://%S/sysroot/usr/share/sounds/classic/tones/bell.ogg", "--json" }, 0,
            { "type=file", "displayName=Bell", "category=Default", "readOnly=true" }, "^$");
        row("show unknown", { "show", "%H/none.jpg" }, 1, { "^$" }, "^themeletctl: not in the index: %H/none.jpg\n$");
        row("show unknown id", { "show", "999999" }, 1, { "^$" }, "^themeletctl: not in the index: 999999\n$");
        row("status", { "status" }, 0,
            { "^service: +running \\(pid \\d+\\)\n", "\nschema version: +12\n", "\nthemelets: +1\n", "\ntones: +3\n",
              "\npending: +0\n" }, "^$");
        row("status json", { "status", "--json" }, 0,
            { "service.running=true", "database.exists=true", "database.schemaVersion=12", "counts.themelets=1", "counts.tones=3",
              "counts.pending=0", "activeThemelet=null" }, "^$");
    }

    void readCommands() { verifyRow(); }

    // Rows run in order, each on the state the one before left.
    void writeCommands_data()
    {
        addColumns();
        const auto step = [](const char *name, const QStringList &arguments, int exitCode, const QStringList &out,
                             const QString &err, const QStringList &then = {}, const QStringList &checks = {}) {
            QTest::newRow(name) << arguments << exitCode << out << err << then << checks;
        };
        const QStringList none { "^$" };
        const QStringList showSunset { "show", "--json", "%P/sunset.themelet" };
        step("create", { "create", "%H/photo1.jpg" }, 0, { "^Created themelet \\d+: photo1 \\(/.*/photo1[^/]*\\.jpg\\)\n$" }, "^$",
             { "status", "--json" }, { "counts.themelets=2" });
        step("create json", { "create", "--json", "%H/photo2.jpg" }, 0, { "type=themelet", "displayName=photo2", "readOnly=false" },
             "^$");
        step("create missing", { "create", "%H/none.jpg" }, 1, none, "^themeletctl: .+\n$");
        step("set", { "set", "%P/sunset.themelet" }, 0, { "^Active themelet %T: Sunset \\(%P/sunset.themelet\\)\n$" }, "^$",
             { "status", "--json" }, { "activeThemelet=file://%P/sunset.themelet" });
        step("set by id json", { "set", "--json", "%T" }, 0, { "contentId=%T", "active=true" }, "^$", showSunset, { "active=true" });
        step("set no themelet", { "set", "%H/photo3.jpg" }, 1, none, "^themeletctl: No themelet at '%H/photo3.jpg'\n$");
        step("set unknown id", { "set", "999999" }, 1, none, "^themeletctl: not in the index: 999999\n$");
        step("favorite on", { "favorite", "%P/sunset.themelet", "on" }, 0, none, "^$", showSunset, { "favorite=true" });
        step("favorite off by id", { "favorite", "%T", "off" }, 0, none, "^$", showSunset, { "favorite=false" });
        step("favorite by wallpaper", { "favorite", "%P/images/sunset.jpg", "on" }, 0, none, "^$", showSunset, { "favorite=true" });
        step("favorite no wallpaper", { "favorite", "%H/photo3.jpg", "off" }, 1, none,
             "^themeletctl: no themelet has the wallpaper %H/photo3.jpg\n$");
        step("index", { "index", "%S/elsewhere/new.jpg" }, 0, none, "^$",
             { "show", "--json", "%S/elsewhere/new.jpg" }, { "type=photo", "width=64" });
        step("remove created", { "remove", "themelet", "%C" }, 0, none, "^$", { "show", "--json", "%C" }, { "exit=1" });
        step("remove file", { "remove", "file", "%S/elsewhere/new.jpg" }, 1, none, "^themeletctl: Content \\d+ of type 0 cannot be removed\n$");
        step("remove package themelet", { "remove", "themelet", "%T" }, 1, none, "^themeletctl: .+\n$", showSunset, { "exit=0" });
        step("remove unknown type", { "remove", "99", "1" }, 1, none, "^themeletctl: Unknown content type 99\n$");
        step("install", { "install", "%S/extra" }, 0, none, "^$", { "show", "--json", "%S/extra/extra.themelet" },
             { "displayName=Extra" });
        step("install missing", { "install", "%S/none" }, 1, none, "^themeletctl: .+\n$");
        step("refresh", { "refresh" }, 0, none, "^$", { "status", "--json" }, { "counts.pending=0" });
    }

    void writeCommands() { verifyRow(); }

    void monitor_data()
    {
        QTest::addColumn<QStringList>("arguments");
        QTest::addColumn<QString>("line");
        QTest::newRow("text") << QStringList { "monitor" } << "contentChanged 1 themelet\n";
        QTest::newRow("json") << QStringList { "monitor", "--json" } << R"({"signal":"contentChanged","type":1,"typeName":"themelet"})" "\n";
    }

    void monitor()
    {
        QFETCH(QStringList, arguments);
        QFETCH(QString, line);
        QProcess monitor;
        QVERIFY(startMonitor(monitor, arguments));
        QCOMPARE(QString::fromUtf8(monitor.readLine()), line);
        monitor.terminate();
        QVERIFY(monitor.waitForFinished());
    }

    // Last: the service goes, the monitor notices, the index stays readable.
    void serviceStops()
    {
        QProcess monitor;
        QVERIFY(startMonitor(monitor, { "monitor" }));
        m_service.terminate();
        QVERIFY(m_service.waitForFinished(20000));
        QVERIFY(monitor.waitForFinished(20000));
        QCOMPARE(monitor.exitCode(), 1);
        QCOMPARE(QString::fromUtf8(monitor.readAllStandardError()), "themeletctl: themeletd left the session bus\n");

        const Result status = ctl({ "status", "--json" });
        QCOMPARE(status.exitCode, 1);
        QVERIFY(failedCheck(status, { "service.running=false", "database.schemaVersion=12", "counts.themelets=3" }).isEmpty());
        QCOMPARE(ctl({ "list", "themelets" }).exitCode, 0);
    }
};

QTEST_GUILESS_MAIN(TestThemeletctl)
#include "tst_themeletctl.moc"
