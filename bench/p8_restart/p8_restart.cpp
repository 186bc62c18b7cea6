// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// P8: a restart over an unchanged tree, what every boot of a phone does.
//   bench_p8_restart ROOT FILES -- DAEMON ARGS...
//   bench_p8_restart --walk ROOT     (the baseline: readdir + stat of every entry)
// Run in a sandbox. A first index of ROOT is made and the daemon stopped; then
// the daemon starts again over the same index with nothing changed on disk. It
// is idle once it watches every directory of the tree (/proc/PID/fdinfo) and
// its main thread has used no CPU for 100 ms (/proc/PID/schedstat); the time is
// that of the last CPU it used. The index with its -wal and -shm may grow by
// at most 64 KiB: an unchanged tree writes nothing.
#include "benchcommon.h"

#include <QCoreApplication>
#include <QDir>
#include <QFile>

#include <dirent.h>
#include <sys/stat.h>

#include <memory>

namespace {

// Directories (no links, no hidden ones) below and with root, as the daemon watches them.
qint64 walk(const QByteArray &root, qint64 *files)
{
    qint64 directories = 1;
    QList<QByteArray> queue { root };
    while (!queue.isEmpty()) {
        const QByteArray dir = queue.takeFirst();
        DIR *d = opendir(dir.constData());
        if (!d)
            continue;
        while (dirent *e = readdir(d)) {
            if (e->d_name[0] == '.')
                continue;
            const QByteArray path = dir + QByteArray("/") + QByteArray(e->d_name);
            struct stat st;
            if (stat(path.constData(), &st) != 0)
                continue;
            if (S_ISDIR(st.st_mode)) {
                if (e->d_type == DT_LNK)
                    continue;
                ++directories;
                queue << path;
            } else {
                ++*files;
            }
        }
        closedir(d);
    }
    return directories;
}

qint64 watchCount(pid_t pid)
{
    qint64 count = 0;
    const QDir fdinfo(QStringLiteral("/proc/%1/fdinfo").arg(pid));
    for (const QString &fd : fdinfo.entryList(QDir::Files)) {
        QFile f(fdinfo.filePath(fd));
        if (f.open(QIODevice::ReadOnly))
            count += f.readAll().count("inotify wd:");
    }
    return count;
}

// Nanoseconds on a CPU of the main thread.
qint64 mainThreadRunNs(pid_t pid)
{
    QFile f(QStringLiteral("/proc/%1/schedstat").arg(pid));
    if (!f.open(QIODevice::ReadOnly))
        return -1;
    return f.readAll().split(' ').value(0).toLongLong();
}

// Starts the daemon and waits until the poll sees `files` rows: the first index.
bool firstIndex(const QString &daemonPath, const QStringList &daemonArgs, qint64 files)
{
    Bench::Child daemon;
    if (!daemon.start(daemonPath, daemonArgs))
        return false;
    auto poller = std::make_unique<Bench::IndexPoller>(Bench::indexPath());
    bool done = poller->open(60);
    const double start = Bench::now();
    while (done && Bench::now() - start < 1800 && daemon.running()) {
        if (poller->maxFileId() >= files && poller->fileCount() >= files && poller->staleImages() == 0)
            break;
        Bench::sleepSeconds(0.05);
    }
    done = done && poller->fileCount() >= files;
    poller.reset();
    daemon.stop(60);
    return done;
}

}

int main(int argc, char **argv)
{
    QCoreApplication app(argc, argv);
    const QStringList args = app.arguments();
    if (args.size() == 3 && args.at(1) == QLatin1String("--walk")) {
        qint64 files = 0;
        const qint64 directories = walk(QFile::encodeName(args.at(2)), &files);
        std::printf("walked %lld directories, %lld files\n", qlonglong(directories), qlonglong(files));
        return 0;
    }
    const int dash = args.indexOf(QStringLiteral("--"));
    if (dash < 3 || dash + 1 >= args.size()) {
        Bench::note(QStringLiteral("usage: bench_p8_restart ROOT FILES -- DAEMON ARGS..."));
        return 2;
    }
    const QString root = args.at(1);
    const qint64 files = args.at(2).toLongLong();
    const QString daemonPath = args.at(dash + 1);
    const QStringList daemonArgs = args.mid(dash + 2);
    const double timeout = qEnvironmentVariableIntValue("BENCH_TIMEOUT") > 0
            ? qEnvironmentVariableIntValue("BENCH_TIMEOUT") : 1800;

    if (!firstIndex(daemonPath, daemonArgs, files)) {
        Bench::note(QStringLiteral("the first index did not complete"));
        return 1;
    }
    qint64 walkedFiles = 0;
    const qint64 directories = walk(QFile::encodeName(root), &walkedFiles);
    const QString index = Bench::indexPath();
    const qint64 bytesBefore = Bench::indexBytes(index);

    const auto walkRun = [&](double *cpu) {
        Bench::Child child;
        const double seconds = Bench::timeProgram(app.applicationFilePath(), { QStringLiteral("--walk"), root }, &child);
        *cpu = child.waitedCpuSeconds();
        return seconds;
    };
    double walkCpu1 = 0, walkCpu2 = 0;
    const double walk1 = walkRun(&walkCpu1);

    Bench::Child daemon;
    const double start = Bench::now();
    if (!daemon.start(daemonPath, daemonArgs))
        return 1;
    double end = -1;
    double lastChange = start;
    qint64 lastRun = -1;
    bool watched = false;
    while (Bench::now() - start < timeout && daemon.running()) {
        const double t = Bench::now();
        const qint64 run = mainThreadRunNs(daemon.pid());
        if (run != lastRun) {
            lastRun = run;
            lastChange = t;
        }
        watched = watched || watchCount(daemon.pid()) >= directories;
        if (watched && t - lastChange >= 0.1) {
            end = lastChange - start;
            break;
        }
        Bench::sleepSeconds(0.005);
    }
    const Bench::ProcStats stats = Bench::procStats(daemon.pid());
    const qint64 bytesIdle = Bench::indexBytes(index);
    daemon.stop(30);
    const qint64 bytesAfter = Bench::indexBytes(index);
    const double walk2 = walkRun(&walkCpu2);

    const double walkSeconds = (walk1 + walk2) / 2;
    const double walkCpu = qMax(0.001, (walkCpu1 + walkCpu2) / 2);
    const double ratio = end > 0 ? end / walkSeconds : -1;
    const qint64 growth = qMax(bytesIdle, bytesAfter) - bytesBefore;
    const bool pass = end > 0 && ratio <= 1.5 && growth <= 64 * 1024;
    Bench::result(QStringLiteral("P8"), {
            { QStringLiteral("ours"), end },
            { QStringLiteral("baseline"), walkSeconds },
            { QStringLiteral("unit"), QStringLiteral("s") },
            { QStringLiteral("ratio"), ratio },
            { QStringLiteral("target"), QStringLiteral("<=1.5,_<=64_KiB_growth") },
            { QStringLiteral("result"), pass ? QStringLiteral("pass") : QStringLiteral("fail") },
            { QStringLiteral("cpu_s"), stats.cpuSeconds },
            { QStringLiteral("cpu_ratio"), stats.cpuSeconds / walkCpu },
            { QStringLiteral("walk_cpu_s"), walkCpu },
            { QStringLiteral("walk_runs_s"), QStringLiteral("%1/%2").arg(walk1, 0, 'f', 3).arg(walk2, 0, 'f', 3) },
            { QStringLiteral("runqueue_wait_s"), stats.runQueueSeconds },
            { QStringLiteral("growth_kib"), growth / 1024.0 },
            { QStringLiteral("growth_idle_kib"), (bytesIdle - bytesBefore) / 1024.0 },
            { QStringLiteral("files"), walkedFiles },
            { QStringLiteral("directories"), directories },
    });
    return pass ? 0 : 1;
}
