// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "statusadaptor.h"
#include "themeletdadaptor.h"
#include "themeletservice.h"

#include <QCommandLineParser>
#include <QCoreApplication>
#include <QDBusConnection>
#include <QDBusError>
#include <QFileInfo>
#include <QLoggingCategory>
#include <QSocketNotifier>
#include <QStandardPaths>

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <fcntl.h>
#include <unistd.h>

namespace {

int s_signalPipe[2] = { -1, -1 };

void onSignal(int number)
{
    // The interrupted code may be about to read errno.
    const int savedErrno = errno;
    const char byte = char(number);
    // Nothing to do if the pipe is full: a stop is on its way already.
    [[maybe_unused]] const ssize_t written = write(s_signalPipe[1], &byte, 1);
    errno = savedErrno;
}

// SIGTERM and SIGINT end the event loop, so that the index is closed cleanly.
bool watchStopSignals(QCoreApplication *app)
{
    if (pipe2(s_signalPipe, O_CLOEXEC | O_NONBLOCK) != 0)
        return false;
    auto *notifier = new QSocketNotifier(s_signalPipe[0], QSocketNotifier::Read, app);
    QObject::connect(notifier, &QSocketNotifier::activated, app, [app]() {
        char byte = 0;
        while (read(s_signalPipe[0], &byte, 1) == 1)
            qDebug("themeletd: stopping on signal %d", int(byte));
        app->quit();
    });
    struct sigaction action = {};
    action.sa_handler = onSignal;
    sigemptyset(&action.sa_mask);
    action.sa_flags = SA_RESTART;
    return sigaction(SIGTERM, &action, nullptr) == 0 && sigaction(SIGINT, &action, nullptr) == 0;
}

}

int main(int argc, char *argv[])
{
    // QMimeDatabase matches a few glob patterns ("*.[1-9]"...) through a QRegularExpression
    // made afresh for each file name, and JIT-compiling each one costs far more than the
    // match: a first index took about 40% more CPU with it. Qt reads this once, at the first
    // match; set here, before any thread exists. An explicit setting is left alone.
    if (!qEnvironmentVariableIsSet("QT_ENABLE_REGEXP_JIT"))
        qputenv("QT_ENABLE_REGEXP_JIT", "0");
    QCoreApplication app(argc, argv);
    QCoreApplication::setOrganizationName(QStringLiteral("Vorka"));
    QCoreApplication::setApplicationName(QStringLiteral("themeletd"));
    QCoreApplication::setApplicationVersion(QStringLiteral(THEMELETD_VERSION));

    QCommandLineParser parser;
    parser.setApplicationDescription(QStringLiteral(
            "Keeps the index of pictures, tones and themelets and serves it on the session bus as com.vorka.themeletd."));
    // As in themeletctl: -v is --verbose, and the version has no short form.
    const QCommandLineOption help(QStringList { QStringLiteral("h"), QStringLiteral("help") },
                                  QStringLiteral("Displays this help."));
    const QCommandLineOption version(QStringLiteral("version"), QStringLiteral("Displays version information."));
    const QCommandLineOption watch(QStringLiteral("watch"),
                                   QStringLiteral("Index and follow this directory (may be given more than once)."),
                                   QStringLiteral("DIR"));
    const QCommandLineOption noDefaultWatch(QStringLiteral("no-default-watch"),
                                            QStringLiteral("Do not index the user's Pictures and Music directories."));
    const QCommandLineOption verbose(QStringList { QStringLiteral("v"), QStringLiteral("verbose") },
                                     QStringLiteral("Log every call and step."));
    parser.addOptions({ watch, noDefaultWatch, verbose, help, version });
    if (!parser.parse(app.arguments()) || !parser.positionalArguments().isEmpty()) {
        const QString error = parser.positionalArguments().isEmpty()
                ? parser.errorText()
                : QStringLiteral("unexpected argument '%1'").arg(parser.positionalArguments().constFirst());
        std::fprintf(stderr, "themeletd: %s\nthemeletd: try 'themeletd --help'\n", qPrintable(error));
        return 2;
    }
    if (parser.isSet(help)) {
        std::fputs(qPrintable(parser.helpText()), stdout);
        return 0;
    }
    if (parser.isSet(version)) {
        std::printf("themeletd %s\n", THEMELETD_VERSION);
        return 0;
    }

    if (!parser.isSet(verbose))
        QLoggingCategory::setFilterRules(QStringLiteral("*.debug=false"));

    QStringList watched;
    if (!parser.isSet(noDefaultWatch)) {
        // A default directory that doesn't exist is no error.
        for (auto location : { QStandardPaths::PicturesLocation, QStandardPaths::MusicLocation }) {
            const QString path = QStandardPaths::writableLocation(location);
            if (QFileInfo(path).isDir())
                watched << path;
        }
    }
    watched << parser.values(watch);

    QDBusConnection bus = QDBusConnection::sessionBus();
    if (!bus.isConnected()) {
        std::fprintf(stderr, "themeletd: cannot connect to the session bus: %s\n",
                     qPrintable(bus.lastError().message()));
        return 1;
    }

    // Nothing touches the index before the name is ours.
    ThemeletService service;
    new ThemeletdAdaptor(&service);
    new StatusAdaptor(&service);
    if (!bus.registerObject(QLatin1String(ThemeletService::ObjectPath), &service)) {
        std::fprintf(stderr, "themeletd: cannot register the object %s\n", ThemeletService::ObjectPath);
        return 1;
    }
    if (!bus.registerService(QLatin1String(ThemeletService::ServiceName))) {
        std::fprintf(stderr, "themeletd: the name %s is already owned on the session bus; is themeletd running?\n",
                     ThemeletService::ServiceName);
        return 1;
    }
    if (!watchStopSignals(&app))
        qWarning("themeletd: cannot catch SIGTERM and SIGINT");

    service.start(watched);
    const int result = app.exec();
    bus.unregisterService(QLatin1String(ThemeletService::ServiceName));
    service.stop();
    return result;
}
