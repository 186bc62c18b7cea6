#ifndef SERVICEFIXTURE_H
#define SERVICEFIXTURE_H

#include "indexfixture.h"

#include <QDBusConnection>
#include <QDBusConnectionInterface>
#include <QDBusMessage>
#include <QDBusReply>

#include <csignal>

// themeletd as a child process on the sandbox's private bus, for the tests
// that attack it or kill it.
namespace Service {

const QString Name = QStringLiteral("com.vorka.themeletd");
const QString Path = QStringLiteral("/com/vorka/themeletd");

inline QDBusMessage call(const QString &method, const QVariantList &arguments, int timeout = 30000,
                         const QString &interface = Name)
{
    QDBusMessage message = QDBusMessage::createMethodCall(Name, Path, interface, method);
    message.setArguments(arguments);
    return QDBusConnection::sessionBus().call(message, QDBus::Block, timeout);
}

inline qint64 ownerPid()
{
    const QDBusReply<uint> pid = QDBusConnection::sessionBus().interface()->servicePid(Name);
    return pid.isValid() ? qint64(pid.value()) : 0;
}

// Starts themeletd watching `watched` and waits until it owns its name. Its
// log goes to `log` (appended) if given, else to the test's stderr.
inline bool start(QProcess &process, const QStringList &watched, const QString &log = QString())
{
    QStringList arguments { QStringLiteral("--no-default-watch") };
    for (const QString &path : watched)
        arguments << QStringLiteral("--watch") << path;
    if (log.isEmpty()) {
        process.setProcessChannelMode(QProcess::ForwardedErrorChannel);
        process.setStandardOutputFile(QProcess::nullDevice());
    } else {
        process.setProcessChannelMode(QProcess::MergedChannels);
        process.setStandardOutputFile(log, QIODevice::Append);
    }
    process.start(QStringLiteral(THEMELETD_BINARY), arguments);
    return process.waitForStarted(10000)
            && QTest::qWaitFor([&]() { return ownerPid() == process.processId(); }, 30000);
}

inline bool stop(QProcess &process, int signal = SIGTERM)
{
    if (process.state() == QProcess::NotRunning)
        return true;
    ::kill(pid_t(process.processId()), signal);
    return process.waitForFinished(30000)
            && QTest::qWaitFor([]() { return ownerPid() == 0; }, 10000);
}

}

#endif
