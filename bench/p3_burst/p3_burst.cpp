// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// P3: a burst of new pictures in one watched directory. themeletd watches an
// empty directory; once its inotify watch on it exists (read from
// /proc/PID/fdinfo), FILES copies of a picture are written there as fast as
// possible. The time from the first create until a poll (every 5 ms) sees every
// file row committed is compared with the time the creates themselves took.
//   bench_p3_burst DIR FILES PICTURE -- DAEMON ARGS...   (DAEMON must watch DIR)
#include "benchcommon.h"

#include <QCoreApplication>
#include <QDir>
#include <QFile>
#include <QFileInfo>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <memory>

namespace {

// True once one of the process's inotify descriptors watches this inode.
bool watches(pid_t pid, const QString &dir)
{
    struct stat st;
    if (stat(QFile::encodeName(dir).constData(), &st) != 0)
        return false;
    const QByteArray wanted = "ino:" + QByteArray::number(qulonglong(st.st_ino), 16) + ' ';
    const QDir fdinfo(QStringLiteral("/proc/%1/fdinfo").arg(pid));
    for (const QString &fd : fdinfo.entryList(QDir::Files)) {
        QFile f(fdinfo.filePath(fd));
        if (!f.open(QIODevice::ReadOnly))
            continue;
        for (const QByteArray &line : f.readAll().split('\n'))
            if (line.startsWith("inotify wd:") && line.contains(wanted))
                return true;
    }
    return false;
}

}

int main(int argc, char **argv)
{
    QCoreApplication app(argc, argv);
    const QStringList args = app.arguments();
    const int dash = args.indexOf(QStringLiteral("--"));
    if (dash < 4 || dash + 1 >= args.size()) {
        Bench::note(QStringLiteral("usage: bench_p3_burst DIR FILES PICTURE -- DAEMON ARGS..."));
        return 2;
    }
    const QString dir = QDir(args.at(1)).absolutePath();
    const int files = args.at(2).toInt();
    QFile picture(args.at(3));
    if (!QDir().mkpath(dir) || !picture.open(QIODevice::ReadOnly))
        return 1;
    const QByteArray bytes = picture.readAll();
    const QString suffix = QFileInfo(picture.fileName()).suffix(); // the copies keep the type of the original
    QVector<QByteArray> paths;
    for (int i = 0; i < files; ++i)
        paths.append(QFile::encodeName(QStringLiteral("%1/burst_%2.%3").arg(dir).arg(i, 6, 10, QLatin1Char('0')).arg(suffix)));

    Bench::Child daemon;
    if (!daemon.start(args.at(dash + 1), args.mid(dash + 2)))
        return 1;
    auto poller = std::make_unique<Bench::IndexPoller>(Bench::indexPath());
    const double ready = Bench::now() + 60;
    while (!watches(daemon.pid(), dir) && Bench::now() < ready && daemon.running())
        Bench::sleepSeconds(0.01);
    if (!poller->open(10) || !watches(daemon.pid(), dir)) {
        Bench::note(QStringLiteral("the daemon never watched ") + dir);
        daemon.stop();
        return 1;
    }
    // Let the start-up work settle, so that the burst meets an idle loop.
    Bench::sleepSeconds(0.5);
    const qint64 before = qMax<qint64>(0, poller->maxFileId());

    const double start = Bench::now();
    for (const QByteArray &path : paths) {
        const int fd = ::open(path.constData(), O_CREAT | O_WRONLY | O_TRUNC | O_CLOEXEC, 0644);
        if (fd < 0 || ::write(fd, bytes.constData(), size_t(bytes.size())) != bytes.size()) {
            Bench::note(QStringLiteral("create failed"));
            return 1;
        }
        ::close(fd);
    }
    const double creates = Bench::now() - start;

    const double timeout = start + 120;
    double committed = -1;
    qint64 rows = 0;
    while (Bench::now() < timeout && daemon.running()) {
        if (poller->maxFileId() - before >= files) {
            rows = poller->fileCount();
            if (rows >= files) {
                committed = Bench::now() - start;
                break;
            }
        }
        Bench::sleepSeconds(0.005);
    }
    rows = poller->fileCount();
    // The pictures' metadata follows the rows; reported beside, not judged.
    double metadata = -1;
    while (committed > 0 && Bench::now() < timeout && daemon.running()) {
        if (poller->staleImages() == 0) {
            metadata = Bench::now() - start;
            break;
        }
        Bench::sleepSeconds(0.02);
    }
    poller.reset();
    daemon.stop(30);

    const double ratio = committed > 0 ? committed / creates : -1;
    QVariantMap values {
            { QStringLiteral("ours"), committed },
            { QStringLiteral("baseline"), creates },
            { QStringLiteral("unit"), QStringLiteral("s") },
            { QStringLiteral("ratio"), ratio },
            { QStringLiteral("target"), QStringLiteral("<=1.5") },
            { QStringLiteral("result"), committed > 0 && ratio <= 1.5 ? QStringLiteral("pass") : QStringLiteral("fail") },
            { QStringLiteral("files"), files },
            { QStringLiteral("rows"), rows },
            { QStringLiteral("metadata_done_s"), metadata },
    };
    if (committed < 0)
        values.insert(QStringLiteral("note"), QStringLiteral("rows never all committed (inotify queue overflow?)"));
    Bench::result(QStringLiteral("P3"), values);
    return committed > 0 ? 0 : 1;
}
