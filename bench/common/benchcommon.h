// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef BENCHCOMMON_H
#define BENCHCOMMON_H

#include <QElapsedTimer>
#include <QString>
#include <QStringList>
#include <QVariantMap>

#include <sys/types.h>

namespace Bench {

// Prints "RESULT <measure> key=value ..." on stdout: the one line bench/run reads.
void result(const QString &measure, const QVariantMap &values);
// A line for people, on stderr.
void note(const QString &text);

// Monotonic seconds since an arbitrary origin, comparable across processes.
double now();
// CPU seconds (user+sys) of this process so far: steadier than wall time on a busy machine.
double cpuNow();

struct ProcStats
{
    double cpuSeconds = 0; // user + system
    qint64 rssKiB = 0;     // VmRSS
    qint64 peakRssKiB = 0; // VmHWM
    double runQueueSeconds = 0; // ready to run but waiting for a CPU (main thread)
    qint64 anonKiB = 0;    // RssAnon: what the process itself allocated
    qint64 pssKiB = 0;     // shared library pages divided among their users
    bool ok = false;
};
ProcStats procStats(pid_t pid);

// Where themeletd keeps its index under the current XDG_DATA_HOME.
QString indexPath();

// A read connection for polling the index. Opening waits for the file.
class IndexPoller
{
public:
    explicit IndexPoller(const QString &path);
    ~IndexPoller();
    bool open(double timeoutSeconds);
    // -1 while the table can't be read yet.
    qint64 scalar(const QString &sql);
    // Rows of table file: max(id) is cheap, and equals the count while
    // nothing was deleted; the caller confirms with count(*).
    qint64 maxFileId() { return scalar(QStringLiteral("SELECT max(id) FROM file")); }
    qint64 fileCount() { return scalar(QStringLiteral("SELECT count(*) FROM file")); }
    qint64 staleImages()
    {
        return scalar(QStringLiteral(
                "SELECT count(*) FROM file WHERE metadataCurrent = 0 AND mimeType GLOB 'image/*'"));
    }
    qint64 imageCount() { return scalar(QStringLiteral("SELECT count(*) FROM image")); }

private:
    QString m_path;
    QString m_connection;
};

// Total size of the index with its -wal and -shm files.
qint64 indexBytes(const QString &path);

// A child process started with fork/exec so that its pid can be read while it runs.
class Child
{
public:
    bool start(const QString &program, const QStringList &arguments);
    pid_t pid() const { return m_pid; }
    bool running();
    // SIGTERM, then waits; SIGKILL after the timeout. Returns the exit status.
    int stop(double timeoutSeconds = 10);
    int wait();
    // Children that exited: user+sys of the waited-for child.
    double waitedCpuSeconds() const { return m_cpu; }
    qint64 waitedPeakRssKiB() const { return m_maxRss; }

private:
    int reap(int options);

    pid_t m_pid = -1;
    int m_status = -1;
    double m_cpu = 0;
    qint64 m_maxRss = 0;
};

// Runs a program to its end: wall seconds, or -1 if it failed.
double timeProgram(const QString &program, const QStringList &arguments, Child *child = nullptr);

void sleepSeconds(double seconds);

QString argValue(const QStringList &arguments, const QString &name, const QString &fallback = {});

}

#endif
