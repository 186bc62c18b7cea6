// themeletctl end to end: the real client against the real themeletd on the
// sandbox's private bus, over a package, a tone pack and a Pictures folder.
#include "indexfixture.h"
#include "sysroot.h"

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

Result ctl(const QStringList &arguments, const QProcessEnvironment &environment = QProcessEnvironment::systemEnvironment())
{
    QProcess process;
    process.setProcessEnvironment(environment);
    process.start(QStringLiteral(THEMELETCTL), arguments);
    Result result;
    if (!process.waitForFinished(60000)) {
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

// Every "path=value" holds in the JSON of the output; "%P" stands for the package, "%S" for the sysroot.
void verifyJson(const QString &out, const QStringList &checks)
{
    QJsonParseError error;
    const QJsonDocument document = QJsonDocument::fromJson(out.toUtf8(), &error);
    QVERIFY2(error.error == QJsonParseError::NoError, qPrintable(out));
    const QJsonValue root = document.isArray() ? QJsonValue(document.array()) : QJsonValue(document.object());
    for (QString check : checks) {
        check.replace(QLatin1String("%P"), package()).replace(QLatin1String("%S"), Sysroot::prefix());
        const int equals = check.indexOf(QLatin1Char('='));
        QCOMPARE(check.left(equals) + '=' + text(at(root, check.left(equals))), check);
    }
}

}

class TestThemeletctl : public QObject
{
    Q_OBJECT

    QProcess m_service;

    bool indexSettled()
    {
        const Result status = ctl({ "status", "--json" });
        const QJsonObject object = QJsonDocument::fromJson(status.out.toUtf8()).object();
        const QJsonObject counts = object.value("counts").toObject();
        return status.exitCode == 0 && counts.value("pending").toInt(-1) == 0 && counts.value("photos").toInt() == 3
                && counts.value("themelets").toInt() == 1 && counts.value("tones").toInt() == 3;
    }

    bool startService()
    {
        m_service.setProcessChannelMode(QProcess::ForwardedChannels);
        m_service.start(QStringLiteral(THEMELETD), { "--no-default-watch", "--watch", pictures() });
        if (!m_service.waitForStarted())
            return false;
        QElapsedTimer timer;
        timer.start();
        while (!indexSettled()) {
            if (timer.hasExpired(60000) || m_service.state() != QProcess::Running)
                return false;
            QTest::qWait(100);
        }
        return true;
    }

    // Each row: arguments, exit code, patterns that stdout must each match (or
    // "path=value" JSON checks with --json), a pattern for stderr.
    void addColumns()
    {
        QTest::addColumn<QStringList>("arguments");
        QTest::addColumn<int>("exitCode");
        QTest::addColumn<QStringList>("out");
        QTest::addColumn<QString>("err");
    }

    void verifyRow()
    {
        QFETCH(QStringList, arguments);
        QFETCH(int, exitCode);
        QFETCH(QStringList, out);
        QFETCH(QString, err);
        for (QString &argument : arguments)
            argument.replace(QLatin1String("%P"), package()).replace(QLatin1String("%H"), pictures());
        QElapsedTimer timer;
        timer.start();
        const Result result = ctl(arguments);
        QVERIFY2(timer.elapsed() < 10000, "no timeouts");
        QVERIFY2(result.exitCode == exitCode, qPrintable(result.out + result.err));
        QVERIFY2(QRegularExpression(err).match(result.err).hasMatch(), qPrintable(result.err));
        if (arguments.contains("--json")) {
            verifyJson(result.out, out);
        } else {
            for (QString pattern : out) {
                pattern.replace(QLatin1String("%P"), QRegularExpression::escape(package()));
                QVERIFY2(QRegularExpression(pattern).match(result.out).hasMatch(), qPrintable(pattern + " in:\n" + result.out));
            }
        }
    }

private slots:
    void initTestCase()
    {
        QVERIFY(write(package() + "/sunset.themelet", R"({"wallpaper": "sunset.jpg", "displayName": "Sunset", "favorite": false,
                      "ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})"));
        QVERIFY(QDir().mkpath(package() + "/images") && QDir().mkpath(pictures()));
        QVERIFY(writeJpeg(package() + "/images/sunset.jpg"));
        QVERIFY(write(package() + "/sounds/dusk.ogg", "OggS"));
        QVERIFY(writeTree(tones(), { "bell.ogg", "alarm.ogg" }, "OggS"));
        QVERIFY(write(tones() + "/tones.index", R"({"files": [{"fileName": "bell.ogg", "displayName": "Bell", "category": "Default"},
                      {"fileName": "alarm.ogg", "displayName": "Alarm", "category": "Ringtone"}]})"));
        const QString date = QStringLiteral("set Exif.Photo.DateTimeOriginal 2014:05:0%1 12:00:00");
        for (int i = 1; i <= 3; ++i)
            QVERIFY(writeJpeg(pictures() + QStringLiteral("/photo%1.jpg").arg(i), { date.arg(4 - i) }));
    }

    void withoutService_data()
    {
        addColumns();
        const QString absent = "^themeletctl: themeletd is not running \\(nobody owns com.vorka.themeletd on the session bus\\)\n$";
        const QString tryHelp = "\nthemeletctl: try 'themeletctl --help'\n$";
        QTest::newRow("no command") << QStringList {} << 2 << QStringList { "^$" } << "^themeletctl: no command given" + tryHelp;
        QTest::newRow("help") << QStringList { "--help" } << 0 << QStringList { "^Usage: themeletctl", "\n  monitor " } << "^$";
        QTest::newRow("unknown command") << QStringList { "frob" } << 2 << QStringList { "^$" } << "^themeletctl: unknown command 'frob'" + tryHelp;
        QTest::newRow("unknown option") << QStringList { "status", "--frob" } << 2 << QStringList { "^$" } << "^themeletctl: Unknown option 'frob'\\." + tryHelp;
        QTest::newRow("too many") << QStringList { "set", "a", "b" } << 2 << QStringList { "^$" } << "^themeletctl: usage: themeletctl set ID\\|URL" + tryHelp;
        QTest::newRow("too few") << QStringList { "remove", "file" } << 2 << QStringList { "^$" } << "usage: themeletctl remove TYPE ID\\|URL" + tryHelp;
        QTest::newRow("list what") << QStringList { "list", "tunes" } << 2 << QStringList { "^$" } << "^themeletctl: list what\\? themelets, photos or tones" + tryHelp;
        QTest::newRow("favorite maybe") << QStringList { "favorite", "1", "maybe" } << 2 << QStringList { "^$" } << "on or off, not 'maybe'" + tryHelp;
        QTest::newRow("remove what") << QStringList { "remove", "sock", "1" } << 2 << QStringList { "^$" } << "unknown content type 'sock': file, themelet, photo, video, download or a number" + tryHelp;
        // Ids too, which would need the (missing) index to become URLs.
        for (const QStringList &command : { QStringList { "set", "12" }, { "create", "/x.jpg" }, { "install", "/x" },
                                            { "index", "/x.jpg" }, { "refresh" }, { "remove", "themelet", "/x.themelet" },
                                            { "favorite", "1", "on" }, { "monitor" } })
            QTest::newRow(qPrintable(command.first())) << command << 1 << QStringList { "^$" } << absent;
        QTest::newRow("list without index") << QStringList { "list", "photos" } << 1 << QStringList { "^$" }
                                            << "^themeletctl: no index at .*themeletd.sqlite \\(themeletd has not run yet\\)\n$";
        QTest::newRow("status") << QStringList { "status" } << 1
                                << QStringList { "^service: +not running\n", "\ndatabase: +.*/themeletd.sqlite \\(missing\\)\n",
                                                 "\nactive themelet: +none\n$" } << "^$";
        QTest::newRow("status json") << QStringList { "status", "--json" } << 1
                                     << QStringList { "service.running=false", "service.pid=null", "database.exists=false",
                                                      "counts.files=null", "activeThemelet=null" } << "^$";
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
};

QTEST_GUILESS_MAIN(TestThemeletctl)
#include "tst_themeletctl.moc"
