// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef SERVICEFIXTURE_H
#define SERVICEFIXTURE_H

#include "indexfixture.h"

#include <QDBusConnection>
#include <QDBusConnectionInterface>
#include <QDBusMessage>
#include <QDBusReply>
#include <QSet>

#include <csignal>

// themeletd as a child process on the sandbox's private bus, for the tests
// that call it, attack it, kill it or starve it, and its index against the disk.
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

inline bool answers()
{
    return call("Introspect", {}, 30000, "org.freedesktop.DBus.Introspectable").type() == QDBusMessage::ReplyMessage;
}

inline qint64 ownerPid()
{
    const QDBusReply<uint> pid = QDBusConnection::sessionBus().interface()->servicePid(Name);
    return pid.isValid() ? qint64(pid.value()) : 0;
}

// Starts themeletd watching `watched` and waits until it owns its name and
// answers, which it does only once its index is open: a test's connection made
// before would race with the creation of the index. The log goes to `log`
// (appended) if given, else to the test's stderr. A `wrapper` command runs
// first and must exec its arguments, so that the pid stays.
inline bool start(QProcess &process, const QStringList &watched, const QString &log = QString(),
                  const QStringList &wrapper = {})
{
    QStringList command = wrapper;
    command << QStringLiteral(THEMELETD_BINARY) << QStringLiteral("--no-default-watch");
    for (const QString &path : watched)
        command << QStringLiteral("--watch") << path;
    process.setProcessChannelMode(log.isEmpty() ? QProcess::ForwardedErrorChannel : QProcess::MergedChannels);
    process.setStandardOutputFile(log.isEmpty() ? QProcess::nullDevice() : log, QIODevice::Append);
    process.start(command.takeFirst(), command);
    return process.waitForStarted(10000)
            && QTest::qWaitFor([&]() { return ownerPid() == process.processId(); }, 30000) && answers();
}

inline bool stop(QProcess &process, int signal = SIGTERM)
{
    if (process.state() == QProcess::NotRunning)
        return true;
    ::kill(pid_t(process.processId()), signal);
    return process.waitForFinished(30000)
            && QTest::qWaitFor([]() { return ownerPid() == 0; }, 10000);
}

// Files and directories ("/" appended) under root, on disk and in the index.
// Links to directories are left out, as a scan leaves them out.
inline QSet<QString> disk(const QString &root)
{
    QSet<QString> entries { root + "/" };
    for (QDirIterator it(root, QDir::Files | QDir::Dirs | QDir::NoDotAndDotDot, QDirIterator::Subdirectories); it.hasNext();) {
        const QFileInfo info(it.next());
        if (!info.isDir() || !info.isSymLink())
            entries << info.filePath() + (info.isDir() ? "/" : "");
    }
    return entries;
}

inline QSet<QString> rows(const QString &root)
{
    const QString under = QStringLiteral(" WHERE path = '%1' OR path LIKE '%1/%'").arg(root);
    const QStringList entries = TestDatabase().rows("SELECT path || '/' || fileName FROM file JOIN directory ON directoryId = "
                                                    "directory.id" + under + " UNION ALL SELECT path || '/' FROM directory" + under);
    return QSet<QString>(entries.begin(), entries.end());
}

// How the index differs from the disk under root; empty if it doesn't.
inline QString difference(const QString &root)
{
    const QSet<QString> r = rows(root), d = disk(root);
    return r == d ? QString() : QStringLiteral("%1 extra rows, %2 missing, e.g. %3").arg((r - d).size()).arg((d - r).size())
            .arg(QStringList((r - d).values() + (d - r).values()).mid(0, 3).join(", "));
}

inline bool converged(const QString &root, int timeout)
{
    return QTest::qWaitFor([&]() { return difference(root).isEmpty(); }, timeout);
}

}

#endif
