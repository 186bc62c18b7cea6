// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// P1 and P6: the first index of a tree by themeletd, against the floor program.
//   bench_p1_index ROOT FILES FLOOR -- DAEMON ARGS...
// Run in a sandbox (fresh XDG_DATA_HOME and session bus). Time runs from the
// daemon's start until a poll of its index sees every file row committed and no
// picture row waiting for metadata. The poll reads max(id) of table file every
// 20 ms on its own connection, then confirms with count(*).
#include "benchcommon.h"

#include <QCoreApplication>
#include <QDir>
#include <QFile>
#include <QStandardPaths>

#include <memory>

namespace {

QVariantMap floorRun(const QString &floor, const QString &root)
{
    const QString db = QStandardPaths::writableLocation(QStandardPaths::CacheLocation)
            + QStringLiteral("/floor.sqlite");
    QDir().mkpath(QFileInfo(db).absolutePath());
    for (const char *suffix : { "", "-wal", "-shm" })
        QFile::remove(db + QLatin1String(suffix));
    Bench::Child child;
    const double seconds = Bench::timeProgram(floor, { root, db }, &child);
    return { { QStringLiteral("s"), seconds }, { QStringLiteral("cpu"), child.waitedCpuSeconds() },
             { QStringLiteral("bytes"), Bench::indexBytes(db) } };
}

}

int main(int argc, char **argv)
{
    QCoreApplication app(argc, argv);
    const QStringList args = app.arguments();
    const int dash = args.indexOf(QStringLiteral("--"));
    if (args.size() < 4 || dash < 4 || dash + 1 >= args.size()) {
        Bench::note(QStringLiteral("usage: bench_p1_index ROOT FILES FLOOR -- DAEMON ARGS..."));
        return 2;
    }
    const QString root = args.at(1);
    const qint64 files = args.at(2).toLongLong();
    const QString floor = args.at(3);
    const double timeout = qEnvironmentVariableIntValue("BENCH_TIMEOUT") > 0
            ? qEnvironmentVariableIntValue("BENCH_TIMEOUT") : 1800;

    const QVariantMap floor1 = floorRun(floor, root);

    Bench::Child daemon;
    const QString index = Bench::indexPath();
    const double start = Bench::now();
    if (!daemon.start(args.at(dash + 1), args.mid(dash + 2)))
        return 1;
    auto poller = std::make_unique<Bench::IndexPoller>(index);
    if (!poller->open(60)) {
        Bench::note(QStringLiteral("no index appeared at ") + index);
        daemon.stop();
        return 1;
    }

    double end = -1;
    double tenthAt = -1;
    Bench::ProcStats tenth, last;
    while (Bench::now() - start < timeout && daemon.running()) {
        const qint64 rows = poller->maxFileId();
        if (rows >= files / 10 && tenthAt < 0) {
            tenthAt = Bench::now() - start;
            tenth = Bench::procStats(daemon.pid());
        }
        if (rows >= files && poller->fileCount() >= files && poller->staleImages() == 0) {
            end = Bench::now() - start;
            break;
        }
        Bench::sleepSeconds(0.02);
    }
    last = Bench::procStats(daemon.pid());
    // A little idle time: the peak counts what the daemon holds once the work is done too.
    Bench::sleepSeconds(1.0);
    const Bench::ProcStats settled = Bench::procStats(daemon.pid());
    const qint64 rows = poller->fileCount();
    poller.reset(); // the daemon closes the last connection: the log is checkpointed away
    const int status = daemon.stop(30);
    const qint64 bytes = Bench::indexBytes(index);

    const QVariantMap floor2 = floorRun(floor, root);
    const double floorSeconds = (floor1.value(QStringLiteral("s")).toDouble()
                                 + floor2.value(QStringLiteral("s")).toDouble()) / 2;
    const double ratio = end > 0 ? end / floorSeconds : -1;
    const bool done = end > 0 && rows >= files;

    Bench::result(QStringLiteral("P1"), {
            { QStringLiteral("ours"), end },
            { QStringLiteral("baseline"), floorSeconds },
            { QStringLiteral("unit"), QStringLiteral("s") },
            { QStringLiteral("ratio"), ratio },
            { QStringLiteral("target"), QStringLiteral("<=2") },
            { QStringLiteral("result"), done && ratio <= 2 ? QStringLiteral("pass") : QStringLiteral("fail") },
            { QStringLiteral("files"), rows },
            { QStringLiteral("cpu_s"), last.cpuSeconds },
            { QStringLiteral("cpu_ratio"), last.cpuSeconds / qMax(0.001, (floor1.value(QStringLiteral("cpu")).toDouble() + floor2.value(QStringLiteral("cpu")).toDouble()) / 2) },
            { QStringLiteral("runqueue_wait_s"), last.runQueueSeconds },
            { QStringLiteral("floor_cpu_s"), floor1.value(QStringLiteral("cpu")) },
            { QStringLiteral("floor_runs_s"), QStringLiteral("%1/%2").arg(floor1.value(QStringLiteral("s")).toDouble(), 0, 'f', 3)
                                                     .arg(floor2.value(QStringLiteral("s")).toDouble(), 0, 'f', 3) },
            { QStringLiteral("db_bytes_per_file"), rows > 0 ? double(bytes) / rows : 0.0 },
            { QStringLiteral("floor_db_bytes_per_file"), rows > 0 ? floor1.value(QStringLiteral("bytes")).toDouble() / rows : 0.0 },
            { QStringLiteral("daemon_exit"), status },
    });

    const double peakMiB = qMax(last.peakRssKiB, settled.peakRssKiB) / 1024.0;
    const double growthMiB = (qMax(last.rssKiB, settled.rssKiB) - tenth.rssKiB) / 1024.0;
    Bench::result(QStringLiteral("P6"), {
            { QStringLiteral("ours"), peakMiB },
            { QStringLiteral("unit"), QStringLiteral("MiB") },
            { QStringLiteral("target"), QStringLiteral("<=25_MiB_peak") },
            { QStringLiteral("result"), done && peakMiB <= 25 ? QStringLiteral("pass") : QStringLiteral("fail") },
            { QStringLiteral("rss_end_mib"), qMax(last.rssKiB, settled.rssKiB) / 1024.0 },
            { QStringLiteral("anon_end_mib"), settled.anonKiB / 1024.0 },
            { QStringLiteral("pss_end_mib"), settled.pssKiB / 1024.0 },
            { QStringLiteral("files"), rows },
    });
    Bench::result(QStringLiteral("P6growth"), {
            { QStringLiteral("ours"), growthMiB },
            { QStringLiteral("unit"), QStringLiteral("MiB") },
            { QStringLiteral("target"), QStringLiteral("<=5_MiB") },
            { QStringLiteral("result"), done && tenthAt > 0 && growthMiB <= 5 ? QStringLiteral("pass") : QStringLiteral("fail") },
            { QStringLiteral("rss_at_tenth_mib"), tenth.rssKiB / 1024.0 },
            { QStringLiteral("peak_at_tenth_mib"), tenth.peakRssKiB / 1024.0 },
            { QStringLiteral("tenth_at_s"), tenthAt },
    });
    return done ? 0 : 1;
}
