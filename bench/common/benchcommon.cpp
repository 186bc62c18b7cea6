// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "benchcommon.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QStandardPaths>
#include <QTextStream>
#include <QUuid>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <ctime>
#include <sys/resource.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace Bench {

void result(const QString &measure, const QVariantMap &values)
{
    QString line = QStringLiteral("RESULT ") + measure;
    for (auto it = values.cbegin(); it != values.cend(); ++it) {
        QString value = it.value().type() == QVariant::Double
                ? QString::number(it.value().toDouble(), 'g', 6)
                : it.value().toString();
        value.replace(QLatin1Char(' '), QLatin1Char('_'));
        line += QLatin1Char(' ') + it.key() + QLatin1Char('=') + value;
    }
    std::printf("%s\n", line.toUtf8().constData());
    std::fflush(stdout);
}

void note(const QString &text)
{
    std::fprintf(stderr, "  %s\n", text.toUtf8().constData());
}

double now()
{
    // steady_clock is CLOCK_MONOTONIC: comparable across processes.
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

double cpuNow()
{
    return double(std::clock()) / CLOCKS_PER_SEC;
}

ProcStats procStats(pid_t pid)
{
    ProcStats stats;
    QFile stat(QStringLiteral("/proc/%1/stat").arg(pid));
    if (!stat.open(QIODevice::ReadOnly))
        return stats;
    const QByteArray line = stat.readAll();
    // The command name may hold spaces; fields are counted after its ')'.
    const QList<QByteArray> fields = line.mid(line.lastIndexOf(')') + 2).split(' ');
    if (fields.size() > 13) {
        const double tick = sysconf(_SC_CLK_TCK);
        stats.cpuSeconds = (fields.at(11).toLongLong() + fields.at(12).toLongLong()) / tick;
    }
    QFile status(QStringLiteral("/proc/%1/status").arg(pid));
    if (status.open(QIODevice::ReadOnly)) {
        for (const QByteArray &l : status.readAll().split('\n')) {
            const QList<QByteArray> parts = l.simplified().split(' ');
            if (parts.size() < 2)
                continue;
            if (parts.at(0) == "VmRSS:")
                stats.rssKiB = parts.at(1).toLongLong();
            else if (parts.at(0) == "VmHWM:")
                stats.peakRssKiB = parts.at(1).toLongLong();
            else if (parts.at(0) == "RssAnon:")
                stats.anonKiB = parts.at(1).toLongLong();
        }
    }
    QFile rollup(QStringLiteral("/proc/%1/smaps_rollup").arg(pid));
    if (rollup.open(QIODevice::ReadOnly)) {
        for (const QByteArray &l : rollup.readAll().split('\n')) {
            const QList<QByteArray> parts = l.simplified().split(' ');
            if (parts.size() >= 2 && parts.at(0) == "Pss:")
                stats.pssKiB = parts.at(1).toLongLong();
        }
    }
    QFile schedstat(QStringLiteral("/proc/%1/schedstat").arg(pid));
    if (schedstat.open(QIODevice::ReadOnly)) {
        const QList<QByteArray> fields = schedstat.readAll().simplified().split(' ');
        if (fields.size() > 1)
            stats.runQueueSeconds = fields.at(1).toLongLong() / 1e9;
    }
    stats.ok = true;
    return stats;
}

QString indexPath()
{
    return QStandardPaths::writableLocation(QStandardPaths::GenericDataLocation)
            + QStringLiteral("/system/privileged/Themeletd/themeletd.sqlite");
}

IndexPoller::IndexPoller(const QString &path)
    : m_path(path)
    , m_connection(QUuid::createUuid().toString())
{
}

IndexPoller::~IndexPoller()
{
    {
        QSqlDatabase db = QSqlDatabase::database(m_connection, false);
        if (db.isValid())
            db.close();
    }
    QSqlDatabase::removeDatabase(m_connection);
}

bool IndexPoller::open(double timeoutSeconds)
{
    const double end = now() + timeoutSeconds;
    while (!QFile::exists(m_path)) {
        if (now() > end)
            return false;
        sleepSeconds(0.005);
    }
    QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), m_connection);
    db.setDatabaseName(m_path);
    // A reader never waits long: a busy poll just counts as "not yet".
    db.setConnectOptions(QStringLiteral("QSQLITE_BUSY_TIMEOUT=50"));
    return db.open();
}

qint64 IndexPoller::scalar(const QString &sql)
{
    QSqlDatabase db = QSqlDatabase::database(m_connection, false);
    QSqlQuery query(db);
    if (!query.exec(sql) || !query.next())
        return -1;
    const QVariant value = query.value(0);
    return value.isNull() ? 0 : value.toLongLong();
}

qint64 indexBytes(const QString &path)
{
    qint64 bytes = 0;
    for (const char *suffix : { "", "-wal", "-shm" })
        bytes += QFileInfo(path + QLatin1String(suffix)).size();
    return bytes;
}

bool Child::start(const QString &program, const QStringList &arguments)
{
    QList<QByteArray> args;
    args << QFile::encodeName(program);
    for (const QString &a : arguments)
        args << QFile::encodeName(a);
    std::vector<char *> argv;
    for (QByteArray &a : args)
        argv.push_back(a.data());
    argv.push_back(nullptr);

    std::fflush(stdout);
    std::fflush(stderr);
    m_pid = fork();
    if (m_pid < 0)
        return false;
    if (m_pid == 0) {
        execvp(argv[0], argv.data());
        std::fprintf(stderr, "cannot run %s\n", argv[0]);
        _exit(127);
    }
    m_status = -1;
    return true;
}

int Child::reap(int options)
{
    if (m_pid <= 0)
        return m_status;
    int status = 0;
    rusage usage {};
    pid_t r;
    do {
        r = wait4(m_pid, &status, options, &usage);
    } while (r < 0 && errno == EINTR);
    if (r == m_pid) {
        m_cpu = usage.ru_utime.tv_sec + usage.ru_utime.tv_usec / 1e6
                + usage.ru_stime.tv_sec + usage.ru_stime.tv_usec / 1e6;
        m_maxRss = usage.ru_maxrss;
        m_status = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
        m_pid = -1;
    }
    return m_status;
}

bool Child::running()
{
    if (m_pid <= 0)
        return false;
    reap(WNOHANG);
    return m_pid > 0;
}

int Child::stop(double timeoutSeconds)
{
    if (m_pid <= 0)
        return m_status;
    kill(m_pid, SIGTERM);
    const double end = now() + timeoutSeconds;
    while (running()) {
        if (now() > end) {
            kill(m_pid, SIGKILL);
            return reap(0);
        }
        sleepSeconds(0.01);
    }
    return m_status;
}

int Child::wait()
{
    return reap(0);
}

double timeProgram(const QString &program, const QStringList &arguments, Child *child)
{
    Child local;
    Child &c = child ? *child : local;
    const double start = now();
    if (!c.start(program, arguments))
        return -1;
    const int status = c.wait();
    const double seconds = now() - start;
    return status == 0 ? seconds : -1;
}

void sleepSeconds(double seconds)
{
    std::this_thread::sleep_for(std::chrono::duration<double>(seconds));
}

QString argValue(const QStringList &arguments, const QString &name, const QString &fallback)
{
    const int i = arguments.indexOf(name);
    return i >= 0 && i + 1 < arguments.size() ? arguments.at(i + 1) : fallback;
}

}
