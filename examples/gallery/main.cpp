// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// themelet-gallery: themelets, photos and tones of the index, shown through the
// Orbaline.Themelet QML module. Besides the interactive window it has a
// non-interactive mode for scripts and tests: wait until the three lists are
// filled, optionally tap a themelet, save a screenshot and exit.
#include <QCommandLineParser>
#include <QDir>
#include <QElapsedTimer>
#include <QFileInfo>
#include <QGuiApplication>
#include <QMouseEvent>
#include <QQmlApplicationEngine>
#include <QQuickWindow>
#include <QTimer>

#include <cstdio>
#include <memory>

namespace {

struct Options
{
    QString screenshot;
    bool tap = false;
    bool create = false;
    bool switchSounds = false;
    int timeoutMs = 120000;
};

void print(const QString &line, FILE *stream = stdout)
{
    std::fprintf(stream, "%s\n", qPrintable(line));
    std::fflush(stream);
}

// Drives the window through its stages; each stage is polled, since the lists
// fill from the service at their own pace.
class Driver : public QObject
{
public:
    Driver(QQuickWindow *window, const Options &options) : m_window(window), m_options(options)
    {
        m_elapsed.start();
        connect(&m_poll, &QTimer::timeout, this, [this] { step(); });
        m_poll.start(100);
    }

private:
    enum Stage { Lists, Tap, Create, Settle };

    QObject *model(const char *name) const { return m_window->property(name).value<QObject *>(); }

    QVariant call(const char *function, const QVariant &argument = QVariant()) const
    {
        QVariant result;
        if (argument.isValid())
            QMetaObject::invokeMethod(m_window, function, Q_RETURN_ARG(QVariant, result), Q_ARG(QVariant, argument));
        else
            QMetaObject::invokeMethod(m_window, function, Q_RETURN_ARG(QVariant, result));
        return result;
    }

    // One line per list: its status by name and its count.
    bool listsFilled(bool report) const
    {
        bool filled = true;
        for (const char *name : { "themeletModel", "photoModel", "toneModel" }) {
            QObject *list = model(name);
            const int status = list ? list->property("status").toInt() : -1, count = list ? list->property("count").toInt() : 0;
            filled = filled && status == 2 && count > 0;
            if (report)
                print(QStringLiteral("%1: %2, %3 rows").arg(QLatin1String(name), call("statusName", status).toString()).arg(count));
        }
        return filled;
    }

    void click(const QPointF &point)
    {
        QMouseEvent press(QEvent::MouseButtonPress, point, point, m_window->mapToGlobal(point.toPoint()), Qt::LeftButton,
                          Qt::LeftButton, Qt::NoModifier);
        QCoreApplication::sendEvent(m_window, &press);
        QMouseEvent release(QEvent::MouseButtonRelease, point, point, m_window->mapToGlobal(point.toPoint()), Qt::LeftButton,
                            Qt::NoButton, Qt::NoModifier);
        QCoreApplication::sendEvent(m_window, &release);
    }

    void finish(int code)
    {
        m_poll.stop();
        if (!m_options.screenshot.isEmpty()) {
            const QImage image = m_window->grabWindow();
            if (image.isNull() || !image.save(m_options.screenshot)) {
                print("cannot save the screenshot to " + m_options.screenshot, stderr);
                code = 1;
            } else {
                print("screenshot: " + QFileInfo(m_options.screenshot).absoluteFilePath());
            }
        }
        QCoreApplication::exit(code);
    }

    // Either make a themelet of the first photo or go on to the grab.
    void startCreate()
    {
        m_stage = Settle;
        m_settle.start();
        if (!m_options.create)
            return;
        m_themelets = model("themeletModel")->property("count").toInt();
        m_photo = call("createFromPhoto", 0).toString();
        m_stage = Create;
    }

    void step()
    {
        if (m_elapsed.hasExpired(m_options.timeoutMs)) {
            print(m_stage == Tap      ? QStringLiteral("timed out: tapping themelet %1 did not make it current").arg(m_tapped)
                  : m_stage == Create ? QStringLiteral("timed out: the themelet made from a photo did not show up")
                                      : QStringLiteral("timed out waiting for the lists"), stderr);
            listsFilled(true);
            finish(1);
            return;
        }
        switch (m_stage) {
        case Lists:
            if (!listsFilled(false))
                return;
            listsFilled(true);
            m_stage = Settle;
            if (m_options.switchSounds)
                print(call("switchProfileSounds").toString());
            if (m_options.tap) {
                const int index = call("inactiveThemelet").toInt();
                const QPointF point = call("themeletTapPoint", index).toPointF();
                if (index < 0 || point.isNull()) {
                    print("no themelet to tap", stderr);
                    finish(1);
                    return;
                }
                m_tapped = call("themeletUrl", index).toString();
                click(point);
                m_stage = Tap;
                break;
            }
            startCreate();
            break;
        case Tap:
            if (m_window->property("activeSource").toString() != m_tapped)
                return;
            print("tapped " + m_tapped + ", Themelet.source follows");
            startCreate();
            break;
        case Create:
            if (model("themeletModel")->property("count").toInt() <= m_themelets)
                return;
            print(QStringLiteral("created a themelet from %1; the themelet list has %2 rows")
                          .arg(m_photo)
                          .arg(model("themeletModel")->property("count").toInt()));
            m_stage = Settle;
            m_settle.start();
            break;
        case Settle:
            // Thumbnails load asynchronously; give them a moment before the grab.
            if (m_settle.hasExpired(1500))
                finish(0);
            break;
        }
    }

    QQuickWindow *m_window;
    Options m_options;
    Stage m_stage = Lists;
    QString m_tapped, m_photo;
    int m_themelets = 0;
    QTimer m_poll;
    QElapsedTimer m_elapsed, m_settle;
};

}

int main(int argc, char *argv[])
{
    QCoreApplication::setApplicationName(QStringLiteral("themelet-gallery"));
    QCommandLineParser parser;
    parser.setApplicationDescription(QStringLiteral("Themelets, photos and tones of the content index."));
    parser.addHelpOption();
    const QCommandLineOption screenshot("screenshot", "Wait until the three lists are filled, save a screenshot to <file>, exit.", "file");
    const QCommandLineOption tap("tap-themelet", "Once the lists are filled, tap a themelet that is not current and wait until it is.");
    const QCommandLineOption create("create-themelet", "Then make a themelet of the first photo and wait until it is listed.");
    const QCommandLineOption switchSounds("switch-sounds", "Once the lists are filled, turn the profile's mail tone on or off and pick a ringer tone.");
    const QCommandLineOption timeout("timeout", "Give up waiting after <seconds> (default 120).", "seconds", "120");
    const QCommandLineOption size("size", "Window size, e.g. 540x960 (default 1280x800).", "WxH", "1280x800");
    const QCommandLineOption importPath("import-path", "Also look for QML modules in <dir>.", "dir");
    parser.addOptions({ screenshot, tap, create, switchSounds, timeout, size, importPath });
    // Parsed before the application exists, so that --help and usage errors need no display.
    QStringList arguments;
    for (int i = 0; i < argc; ++i)
        arguments << QString::fromLocal8Bit(argv[i]);
    const auto usageError = [](const QString &message) {
        print(QStringLiteral("themelet-gallery: ") + message, stderr);
        print(QStringLiteral("themelet-gallery: try 'themelet-gallery --help'"), stderr);
        return 2;
    };
    if (!parser.parse(arguments))
        return usageError(parser.errorText());
    if (parser.isSet(QStringLiteral("help"))) {
        const QCoreApplication core(argc, argv); // the help names the program from it
        std::fputs(qPrintable(parser.helpText()), stdout);
        return 0;
    }

    const QStringList dimensions = parser.value(size).split('x');
    const QSize windowSize(dimensions.value(0).toInt(), dimensions.value(1).toInt());
    if (windowSize.width() <= 0 || windowSize.height() <= 0)
        return usageError(QStringLiteral("--size takes WxH, e.g. 540x960"));
    // At most a day, so that the milliseconds fit in an int.
    bool timeoutValid = false;
    const int timeoutSeconds = parser.value(timeout).toInt(&timeoutValid);
    if (!timeoutValid || timeoutSeconds <= 0 || timeoutSeconds > 24 * 3600)
        return usageError(QStringLiteral("--timeout takes a number of seconds from 1 to 86400"));

    QCoreApplication::setAttribute(Qt::AA_EnableHighDpiScaling);
    QGuiApplication app(argc, argv);

    QQmlApplicationEngine engine;
    if (QDir(THEMELET_BUILD_QML_DIR).exists())
        engine.addImportPath(THEMELET_BUILD_QML_DIR);
    for (const QString &dir : parser.values(importPath))
        engine.addImportPath(dir);
    engine.load(QUrl(QStringLiteral("qrc:/gallery/main.qml")));
    auto *window = engine.rootObjects().isEmpty() ? nullptr : qobject_cast<QQuickWindow *>(engine.rootObjects().first());
    if (!window)
        return 1;
    window->resize(windowSize);
    window->show();

    std::unique_ptr<Driver> driver;
    if (parser.isSet(screenshot) || parser.isSet(tap) || parser.isSet(create) || parser.isSet(switchSounds)) {
        Options options;
        options.screenshot = parser.value(screenshot);
        options.tap = parser.isSet(tap);
        options.create = parser.isSet(create);
        options.switchSounds = parser.isSet(switchSounds);
        options.timeoutMs = timeoutSeconds * 1000;
        driver = std::make_unique<Driver>(window, options);
    }
    return app.exec();
}
