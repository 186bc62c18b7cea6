// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

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
#include <ctime>

// No managers run here, so no change is ever announced.
void Content::signalChanged(int)
{
}

namespace {

// 100,000 unless the first argument says otherwise (bench/run --quick, --tiny).
int s_rows = 100000;

// Each side runs until it has used at least this much CPU, so that neither
// is read off a clock tick or two.
const qint64 MinimumNanoseconds = 100 * 1000 * 1000;

// CPU time of the calling thread, to the nanosecond: the pool threads and other
// processes share the cores, and time spent waiting for them is not the merge's.
qint64 threadNanoseconds()
{
    timespec now {};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return qint64(now.tv_sec) * 1000000000 + now.tv_nsec;
}

// Where the copies leave a trace, so that the compiler can't drop them.
volatile quintptr s_sink = 0;

// The baseline: one copy of the handles, averaged over enough repetitions.
qint64 copyNanoseconds(const QVector<Content> &rows)
{
    qint64 total = 0;
    int repetitions = 0;
    while (total < MinimumNanoseconds) {
        const qint64 start = threadNanoseconds();
        QVector<Content> copy;
        copy.reserve(rows.size());
        for (const Content &row : rows)
            copy.append(row);
        s_sink = s_sink + quintptr(copy.constLast().data()) + quintptr(copy.size());
        total += threadNanoseconds() - start;
        ++repetitions;
    }
    return total / repetitions;
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

    // The baseline runs to 100 ms each time: five are enough, however many merges small lists need.
    if (measure->copies.size() < 5)
        measure->copies << copyNanoseconds(model.rows());
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
    qint64 merged = 0;
    for (int run = 0; run < 5 || merged < MinimumNanoseconds; ++run) {
        if (!measure(&plain, false) || !measure(&held, true))
            return 1;
        merged += plain.merges.constLast();
    }
    const qint64 copy = median(plain.copies + held.copies);
    const auto ratio = [copy](const Measure &measure) {
        return QString::number(double(median(measure.merges)) / double(std::max<qint64>(1, copy)), 'f', 2);
    };
    out << "merge of " << s_rows << " identical rows in batches of " << QueryAgent::BatchSize << ": "
        << double(median(plain.merges)) / 1000 << " us (" << double(median(held.merges)) / 1000
        << " us with the replaced records held elsewhere); plain copy of as many handles: " << double(copy) / 1000
        << " us (thread CPU time, each side repeated to at least 100 ms)\n";
    out << "ratio=" << ratio(plain) << " ratioHeld=" << ratio(held) << " inserts=" << plain.inserts + held.inserts
        << " removes=" << plain.removes + held.removes << '\n';
    return 0;
}
