// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// P2: picture metadata. The engine's loop (FileManager driving ImageManager, as
// in themeletd) reads a directory of pictures; its rate from the moment the scan
// committed the file rows until every image row is written is compared with a
// bare loop of QImageReader::size() and the exiv2 adapter over the same files.
//   bench_p2_metadata DIR   (run in a sandbox: the index goes under XDG_DATA_HOME)
#include "benchcommon.h"
#include "content.h"
#include "contentmanager.h"
#include "dbmanager.h"
#include "filemanager.h"
#include "quillmetadata.h"

#include <QCoreApplication>
#include <QDir>
#include <QImageReader>
#include <QSqlQuery>
#include <QTimer>

namespace {

double s_scanCommitted = 0;
double s_scanCommittedCpu = 0;
double s_lastImageBatchCpu = 0;
double s_lastImageBatch = 0;
qint64 s_expected = 0;
int s_batches = 0;

qint64 imageRows()
{
    QSqlQuery query(DbManager::instance());
    return query.exec(QStringLiteral("SELECT count(*) FROM image")) && query.next()
            ? query.value(0).toLongLong() : -1;
}

double bareLoop(const QStringList &paths, double *cpu)
{
    const double start = Bench::now();
    const double cpuStart = Bench::cpuNow();
    qint64 sink = 0;
    for (const QString &path : paths) {
        const QSize size = QImageReader(path, QByteArray()).size();
        const QuillMetadata metadata(path, QuillMetadata::AllFormats);
        sink += size.width() + size.height() + metadata.entry(QuillMetadata::DateTaken).isValid()
                + metadata.entry(QuillMetadata::Orientation).toInt();
    }
    *cpu = Bench::cpuNow() - cpuStart;
    const double seconds = Bench::now() - start;
    if (sink == 42)
        Bench::note(QStringLiteral("unlikely"));
    return seconds;
}

}

void Content::signalChanged(int type)
{
    if (type == 0) {
        s_scanCommitted = Bench::now();
        s_scanCommittedCpu = Bench::cpuNow();
    } else if (type == 2) {
        ++s_batches;
        // A batch holds at most 100 pictures: counting the rows before enough
        // batches came would only add the benchmark's own queries to the time.
        if (s_batches * 100 >= s_expected && imageRows() >= s_expected) {
            s_lastImageBatch = Bench::now();
            s_lastImageBatchCpu = Bench::cpuNow();
            QCoreApplication::quit();
        }
    }
}

int main(int argc, char **argv)
{
    qputenv("QT_ENABLE_REGEXP_JIT", "0"); // as themeletd does
    QCoreApplication app(argc, argv);
    if (app.arguments().size() < 2) {
        Bench::note(QStringLiteral("usage: bench_p2_metadata DIR"));
        return 2;
    }
    const QString dir = QDir(app.arguments().at(1)).absolutePath();
    QStringList paths;
    for (const QString &name : QDir(dir).entryList(QDir::Files, QDir::Name))
        paths.append(dir + QLatin1Char('/') + name);
    s_expected = paths.size();

    // Loop, engine, loop: the baseline is the mean of the two loops around it.
    double cpu1 = 0, cpu2 = 0;
    const double loop1 = bareLoop(paths, &cpu1);

    FileManager *files = FileManager::instance();
    // The writing connection as themeletd sets it up.
    QSqlQuery(DbManager::instance()).exec(QStringLiteral("PRAGMA cache_size = -512;"));
    QSqlQuery(DbManager::instance()).exec(QStringLiteral("PRAGMA synchronous = NORMAL;"));
    const double start = Bench::now();
    files->appendDirectory(dir, FileManager::UserScope, FileManager::ScanNew);
    QTimer::singleShot(900 * 1000, &app, &QCoreApplication::quit); // a stuck loop still reports
    app.exec();
    const double engineEnd = s_lastImageBatch;

    const double loop2 = bareLoop(paths, &cpu2);
    const double loop = (loop1 + loop2) / 2;
    const double metadata = engineEnd - s_scanCommitted;
    const double ratio = loop / metadata; // our rate over the loop's rate
    const qint64 rows = imageRows();

    Bench::result(QStringLiteral("P2"), {
            { QStringLiteral("ours"), metadata },
            { QStringLiteral("baseline"), loop },
            { QStringLiteral("unit"), QStringLiteral("s") },
            { QStringLiteral("ratio"), ratio },
            { QStringLiteral("target"), QStringLiteral(">=0.8 (rate)") },
            { QStringLiteral("result"), rows == s_expected && ratio >= 0.8 ? QStringLiteral("pass") : QStringLiteral("fail") },
            { QStringLiteral("files"), s_expected },
            { QStringLiteral("image_rows"), rows },
            { QStringLiteral("batches"), s_batches },
            { QStringLiteral("rate_ours_per_s"), s_expected / metadata },
            { QStringLiteral("rate_loop_per_s"), s_expected / loop },
            { QStringLiteral("cpu_ratio"), ((cpu1 + cpu2) / 2) / (s_lastImageBatchCpu - s_scanCommittedCpu) },
            { QStringLiteral("scan_s"), s_scanCommitted - start },
            { QStringLiteral("loop_runs_s"), QStringLiteral("%1/%2").arg(loop1, 0, 'f', 3).arg(loop2, 0, 'f', 3) },
    });
    return 0;
}
