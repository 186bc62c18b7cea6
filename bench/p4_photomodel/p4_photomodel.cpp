// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// P4: the photo list of a large index. Time from componentComplete until the
// model's status is Finished with every row in place, against the sqlite3
// command line running the same SELECT into /dev/null (mean of a run before
// and one after the model). The index is made beforehand by bench_gen photodb.
// P7, in the same run: the longest stall of the GUI thread, seen by a 1 ms
// heartbeat timer, while the model loads and then queries again after a
// change notice with one photo added.
//   bench_p4_photomodel PHOTOS   (in a sandbox; the index is under XDG_DATA_HOME)
#include "benchcommon.h"
#include "content.h"
#include "photodata.h"
#include "themeletcontent.h"

#if __has_include("photomodel.h")
#include "photomodel.h"
using Model = PhotoModel;
static const char *const ModelName = "PhotoModel";
#else
#include "contentmodel.h"
// Until PhotoModel exists: the same base with the photo query, as PhotoModel runs it.
class Model : public ContentModel<PhotoData>
{
public:
    Model() : ContentModel<PhotoData>(ThemeletContent::Photo) { }
    void componentComplete() override
    {
        query(new QueryAgent::Parameters);
        ContentModel<PhotoData>::componentComplete();
    }
};
static const char *const ModelName = "ContentModel<PhotoData>";
#endif

#include <QElapsedTimer>
#include <QGuiApplication>
#include <QSqlDatabase>
#include <QSqlQuery>
#include <QStandardPaths>
#include <QTimer>

#include <fcntl.h>
#include <unistd.h>

namespace {

const char *const ListStatement =
        "SELECT file.id, directory.path || '/' || file.fileName, file.mimeType, file.fileName, file.displayName, "
        "file.permissions, image.dateTaken, image.width, image.height, image.orientation FROM file INNER JOIN "
        "directory on file.directoryId = directory.id INNER JOIN image on file.id = image.fileId ORDER BY "
        "image.dateTaken;";

// The sqlite3 command line with its output going to /dev/null; -1 if it isn't there.
double sqliteCli(const QString &index)
{
    const QString cli = QStandardPaths::findExecutable(QStringLiteral("sqlite3"));
    if (cli.isEmpty())
        return -1;
    Bench::Child child;
    const double start = Bench::now();
    const int saved = dup(STDOUT_FILENO);
    const int null = open("/dev/null", O_WRONLY);
    dup2(null, STDOUT_FILENO);
    const bool started = child.start(cli, { index, QLatin1String(ListStatement) });
    dup2(saved, STDOUT_FILENO);
    close(null);
    close(saved);
    if (!started || child.wait() != 0)
        return -1;
    return Bench::now() - start;
}

}

// The largest gap between two ticks of a 1 ms timer, and the phase it fell in.
class Heartbeat : public QObject
{
public:
    Heartbeat()
    {
        m_timer.setTimerType(Qt::PreciseTimer);
        connect(&m_timer, &QTimer::timeout, this, [this]() {
            const qint64 now = m_clock.nsecsElapsed();
            if (now - m_last > m_longest) {
                m_longest = now - m_last;
                m_longestPhase = m_phase;
            }
            m_last = now;
        });
        m_clock.start();
        m_timer.start(1);
    }
    // A new phase; with `fresh`, the gap up to now is not counted.
    void setPhase(const QString &phase, bool fresh = false)
    {
        m_phase = phase;
        if (fresh)
            m_last = m_clock.nsecsElapsed();
    }
    double longestMs() const { return double(m_longest) / 1e6; }
    QString longestPhase() const { return m_longestPhase; }

private:
    QTimer m_timer;
    QElapsedTimer m_clock;
    qint64 m_last = 0;
    qint64 m_longest = 0;
    QString m_phase;
    QString m_longestPhase;
};

// One photo more, written as the service would, for the re-query after the notice.
bool addPhoto(const QString &index)
{
    QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QStringLiteral("writer"));
    db.setDatabaseName(index);
    QSqlQuery query(db);
    return db.open()
            && query.exec(QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, permissions, metadataCurrent) "
                                         "SELECT directoryId, mimeType, 'p7-extra.jpg', 3, 1 FROM file LIMIT 1;"))
            && query.exec(QStringLiteral("INSERT INTO image (fileId, dateTaken, width, height, orientation) "
                                         "VALUES (last_insert_rowid(), '2031-01-01T00:00:00', 64, 48, 1);"));
}

// A client never announces changes.
void Content::signalChanged(int)
{
}

int main(int argc, char **argv)
{
    QGuiApplication app(argc, argv);
    const int photos = app.arguments().value(1).toInt();
    const QString index = Bench::indexPath();

    const double cli1 = sqliteCli(index);

    Model model;
    Heartbeat heartbeat;
    heartbeat.setPhase(QStringLiteral("load"));
    const double start = Bench::now();
    model.classBegin();
    model.componentComplete();
    while (model.status() == Model::Querying || model.status() == Model::Null)
        QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);
    const double seconds = Bench::now() - start;
    const int rows = model.count();
    const bool finished = model.status() == Model::Finished;

    const double cli2 = sqliteCli(index);
    const double cli = cli1 > 0 && cli2 > 0 ? (cli1 + cli2) / 2 : -1;
    const double ratio = cli > 0 ? seconds / cli : -1;
    QString verdict = QStringLiteral("skipped");
    if (!finished || rows != photos)
        verdict = QStringLiteral("fail");
    else if (cli > 0)
        verdict = ratio <= 1.5 ? QStringLiteral("pass") : QStringLiteral("fail");
    QVariantMap values {
            { QStringLiteral("ours"), seconds },
            { QStringLiteral("unit"), QStringLiteral("s") },
            { QStringLiteral("target"), QStringLiteral("<=1.5") },
            { QStringLiteral("result"), verdict },
            { QStringLiteral("rows"), rows },
            { QStringLiteral("photos"), photos },
            { QStringLiteral("model"), QLatin1String(ModelName) },
    };
    if (cli > 0) {
        values.insert(QStringLiteral("baseline"), cli);
        values.insert(QStringLiteral("ratio"), ratio);
        values.insert(QStringLiteral("cli_runs_s"), QStringLiteral("%1/%2").arg(cli1, 0, 'f', 3).arg(cli2, 0, 'f', 3));
    } else {
        values.insert(QStringLiteral("note"), QStringLiteral("no sqlite3 command line for the baseline"));
    }
    Bench::result(QStringLiteral("P4"), values);

    // P7: the load above, then a re-query that finds one photo more.
    // The write is the service's, in its own process: its time on this thread is no stall of the model's.
    const bool added = addPhoto(index);
    heartbeat.setPhase(QStringLiteral("requery"), true);
    QMetaObject::invokeMethod(&model, "contentChanged", Qt::DirectConnection, Q_ARG(int, ThemeletContent::Photo));
    QElapsedTimer requery;
    requery.start();
    while ((model.status() != Model::Finished || model.count() != rows + 1) && !requery.hasExpired(60000))
        QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);
    const bool requeried = added && model.count() == rows + 1;
    Bench::result(QStringLiteral("P7"), QVariantMap {
            { QStringLiteral("ours"), heartbeat.longestMs() },
            { QStringLiteral("unit"), QStringLiteral("ms") },
            { QStringLiteral("target"), QStringLiteral("<=16") },
            { QStringLiteral("result"), !requeried ? QStringLiteral("fail") : heartbeat.longestMs() <= 16 ? QStringLiteral("pass") : QStringLiteral("fail") },
            { QStringLiteral("stall_in"), heartbeat.longestPhase() },
            { QStringLiteral("rows"), model.count() },
    });
    return finished && requeried ? 0 : 1;
}
