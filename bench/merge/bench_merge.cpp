// The GUI thread's share of a re-query that finds nothing changed: 100,000
// rows arrive from the index in batches of 50 and are merged into the same
// 100,000 rows on show. Reported against a plain copy of as many Content
// handles, measured in the same run.
#include "contentmodel.h"
#include "dbmanager.h"
#include "filequeryagent.h"

#include <QCoreApplication>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QTemporaryDir>
#include <QTextStream>

#include <algorithm>
#include <cstdlib>
#include <sys/resource.h>

// No managers run here, so no change is ever announced.
void Content::signalChanged(int)
{
}

namespace {

// 100,000 unless the first argument says otherwise (bench/run --quick, --tiny).
int s_rows = 100000;

// CPU time of the calling thread: the pool threads and other processes share
// the cores, and time spent waiting for them is not the merge's.
qint64 threadNanoseconds()
{
    rusage usage {};
    getrusage(RUSAGE_THREAD, &usage);
    return (qint64(usage.ru_utime.tv_sec) + usage.ru_stime.tv_sec) * 1000000000
            + (qint64(usage.ru_utime.tv_usec) + usage.ru_stime.tv_usec) * 1000;
}

// Times the model's own events: the batches arriving and the update passes.
class TimedModel : public ContentModel<FileData>
{
public:
    TimedModel() : ContentModel<FileData>(ThemeletContent::File)
    {
        connect(this, &QAbstractItemModel::rowsInserted, this, [this]() { ++inserts; });
        connect(this, &QAbstractItemModel::rowsRemoved, this, [this]() { ++removes; });
    }

    bool event(QEvent *event) override
    {
        const int type = event->type();
        if (type != QEvent::User && type != QEvent::User + 1 && type != QEvent::UpdateRequest)
            return ContentModel<FileData>::event(event);
        const qint64 start = threadNanoseconds();
        const bool handled = ContentModel<FileData>::event(event);
        nanoseconds += threadNanoseconds() - start;
        return handled;
    }

    bool runQuery()
    {
        query(new FileQueryAgent::FileParameters);
        while (status() == Querying)
            QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);
        return status() == Finished;
    }

    QVector<Content> rows() const
    {
        QVector<Content> rows;
        for (int i = 0; i < count(); ++i)
            rows.append(contentAt(i));
        return rows;
    }

    qint64 nanoseconds = 0;
    int inserts = 0;
    int removes = 0;
};

bool fillIndex()
{
    if (!DbManager::instance().isOpen())
        return false;
    QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QStringLiteral("bench"));
    db.setDatabaseName(QueryAgent::databaseUrl(0).toLocalFile());
    if (!db.open())
        return false;
    QSqlQuery query(db);
    QVariantList names;
    for (int i = 0; i < s_rows; ++i)
        names << QStringLiteral("tone%1").arg(i, 6, 10, QLatin1Char('0'));
    const bool ok = db.transaction() && query.exec(QStringLiteral("INSERT INTO directory (path, scope) VALUES ('/bench', 0)"))
            && query.prepare(QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, displayName, permissions) "
                                            "SELECT id, 'audio/ogg', ?, ?, 3 FROM directory WHERE path = '/bench'"))
            && (query.addBindValue(names), query.addBindValue(names), query.execBatch()) && db.commit();
    if (!ok)
        QTextStream(stderr) << "cannot fill the index: " << query.lastError().text() << '\n';
    return ok;
}

struct Measure
{
    QVector<qint64> merges;
    QVector<qint64> copies;
    int inserts = 0;
    int removes = 0;
};

// One model, queried twice; the second query finds the same rows.
bool measure(Measure *measure, bool holdReplaced)
{
    TimedModel model;
    if (!model.runQuery() || model.count() != s_rows) {
        QTextStream(stderr) << "first query failed\n";
        return false;
    }
    const QVector<Content> replaced = holdReplaced ? model.rows() : QVector<Content>();
    model.nanoseconds = 0;
    model.inserts = model.removes = 0;
    if (!model.runQuery() || model.count() != s_rows) {
        QTextStream(stderr) << "second query failed\n";
        return false;
    }
    measure->merges << model.nanoseconds;
    measure->inserts += model.inserts;
    measure->removes += model.removes;

    const QVector<Content> rows = model.rows();
    const qint64 start = threadNanoseconds();
    QVector<Content> copy;
    copy.reserve(rows.size());
    for (const Content &row : rows)
        copy.append(row);
    measure->copies << threadNanoseconds() - start;
    return true;
}

qint64 median(QVector<qint64> values)
{
    std::sort(values.begin(), values.end());
    return values.at(values.size() / 2);
}

}

int main(int argc, char **argv)
{
    // Never the user's own index: everything lives in a directory of its own.
    QTemporaryDir home;
    for (const char *variable : { "HOME", "XDG_DATA_HOME", "XDG_CONFIG_HOME", "XDG_CACHE_HOME" })
        qputenv(variable, (home.path() + '/' + variable).toUtf8());
    QCoreApplication application(argc, argv);
    if (argc > 1 && std::atoi(argv[1]) > 0)
        s_rows = std::atoi(argv[1]);
    QTextStream out(stdout);
    if (!fillIndex())
        return 1;

    // Plain: the replaced records die in the merge, as they do in a client.
    // Held: something else keeps them, which leaves the merge itself.
    Measure plain;
    Measure held;
    for (int run = 0; run < 5; ++run) {
        if (!measure(&plain, false) || !measure(&held, true))
            return 1;
    }
    const qint64 copy = median(plain.copies + held.copies);
    const auto ratio = [copy](const Measure &measure) {
        return QString::number(double(median(measure.merges)) / double(std::max<qint64>(1, copy)), 'f', 2);
    };
    out << "merge of " << s_rows << " identical rows in batches of " << QueryAgent::BatchSize << ": "
        << median(plain.merges) / 1000 << " us (" << median(held.merges) / 1000
        << " us with the replaced records held elsewhere); plain copy of as many handles: " << copy / 1000 << " us\n";
    out << "ratio=" << ratio(plain) << " ratioHeld=" << ratio(held) << " inserts=" << plain.inserts + held.inserts
        << " removes=" << plain.removes + held.removes << '\n';
    return 0;
}
