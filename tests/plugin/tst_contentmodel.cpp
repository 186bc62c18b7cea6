#include "contentmodel.h"
#include "dbmanager.h"
#include "filequeryagent.h"
#include "messagelog.h"
#include "recordingservice.h"
#include "testdatabase.h"
#include "themeletinterface.h"

#include <QJSEngine>
#include <QQmlEngine>
#include <QThreadPool>
#include <QtTest>

#include <functional>
#include <memory>

namespace {

// A list of files with the protected interface of the base at hand.
class FileModel : public ContentModel<FileData>
{
public:
    explicit FileModel(int contentType = ThemeletContent::File) : ContentModel<FileData>(contentType) {}

    using AbstractContentModel::query;
    using AbstractContentModel::refilter;
    using AbstractContentModel::setFiltered;

    void requery(const QString &mimeType = QString()) { query(parameters(mimeType)); }

    static FileQueryAgent::FileParameters *parameters(const QString &mimeType)
    {
        auto *parameters = new FileQueryAgent::FileParameters;
        parameters->mimeType = mimeType;
        return parameters;
    }

    bool acceptContent(const Content &content) const override { return filter && filter(content); }

    std::function<bool(const Content &)> filter;
};

// Parameters that tell, when they go, whether their query ran: the runner
// deletes them on a pool thread, a replaced request on the model's thread.
class TracedParameters : public FileQueryAgent::FileParameters
{
public:
    TracedParameters(const QString &mimeType, QStringList *trace) : m_trace(trace) { this->mimeType = mimeType; }
    ~TracedParameters() override
    {
        static QMutex s_mutex;
        QMutexLocker locker(&s_mutex);
        *m_trace << mimeType + (QThread::currentThread() == QCoreApplication::instance()->thread() ? " dropped" : " ran");
    }

private:
    QStringList *m_trace;
};

// The row signals of a model in order.
class ModelLog : public QObject
{
public:
    explicit ModelLog(QAbstractItemModel *model)
    {
        connect(model, &QAbstractItemModel::rowsInserted, this,
                [this](const QModelIndex &, int first, int last) { entries << QStringLiteral("insert %1 %2").arg(first).arg(last); });
        connect(model, &QAbstractItemModel::rowsRemoved, this,
                [this](const QModelIndex &, int first, int last) { entries << QStringLiteral("remove %1 %2").arg(first).arg(last); });
        connect(model, &QAbstractItemModel::dataChanged, this, [this](const QModelIndex &first, const QModelIndex &last) {
            entries << QStringLiteral("change %1 %2").arg(first.row()).arg(last.row());
        });
    }
    QStringList of(const QString &kind) const { return entries.filter(QRegularExpression("^" + kind + " ")); }

    QStringList entries;
};

QStringList numbered(int count, const QString &prefix = QStringLiteral("n"))
{
    QStringList names;
    for (int i = 0; i < count; ++i)
        names << prefix + QStringLiteral("%1").arg(i, 4, 10, QLatin1Char('0'));
    return names;
}

QStringList displayNames(const QAbstractItemModel &model)
{
    QStringList names;
    for (int row = 0; row < model.rowCount(); ++row)
        names << model.index(row, 0).data(FileData::DisplayNameRole).toString();
    return names;
}

bool waitDone(const AbstractContentModel &model)
{
    return QTest::qWaitFor([&model]() { return model.status() != AbstractContentModel::Querying; }, 10000);
}

}

class tst_ContentModel : public QObject
{
    Q_OBJECT

    std::unique_ptr<TestDatabase> m_db;

    void addFiles(const QStringList &names, const QString &mimeType = QStringLiteral("audio/ogg"))
    {
        QStringList statements { QStringLiteral("INSERT OR IGNORE INTO directory (path, scope) VALUES ('/m', 0)") };
        for (const QString &name : names)
            statements << QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, displayName, permissions) "
                                         "SELECT id, '%1', '%2.ogg', '%2', 3 FROM directory WHERE path = '/m'").arg(mimeType, name);
        m_db->exec(statements);
    }

    // A model that has shown the files of the index.
    void fill(FileModel &model)
    {
        model.requery();
        model.componentComplete();
        QVERIFY(waitDone(model));
    }

private slots:
    void initTestCase()
    {
        MessageLog log(QStringList { "debug: DbManager::DbManager() Themelet DB Fine..." });
        QVERIFY(DbManager::instance().isOpen());
        m_db.reset(new TestDatabase);
    }

    void init() { m_db->exec("DELETE FROM directory"); }

    void cleanup() { QVERIFY(QThreadPool::globalInstance()->waitForDone(10000)); }

    void firstQueryAndRequery()
    {
        addFiles(numbered(120));
        FileModel model;
        ModelLog log(&model);
        QSignalSpy status(&model, &AbstractContentModel::statusChanged);
        QSignalSpy count(&model, &AbstractContentModel::countChanged);
        model.requery();
        QCOMPARE(model.status(), AbstractContentModel::Querying);
        model.componentComplete();
        QVERIFY(waitDone(model));
        QCOMPARE(model.status(), AbstractContentModel::Finished);
        QCOMPARE(status.count(), 1);
        QCOMPARE(displayNames(model), numbered(120));

        // Only appends, each of whole batches, and one per update pass.
        QVERIFY(log.of("remove").isEmpty());
        QVERIFY(log.of("change").isEmpty());
        int next = 0;
        for (const QString &insert : log.entries) {
            QCOMPARE(insert.section(' ', 1, 1).toInt(), next);
            next = insert.section(' ', 2, 2).toInt() + 1;
            QVERIFY(next % 50 == 0 || next == 120);
        }
        QCOMPARE(next, 120);
        QCOMPARE(count.count(), log.entries.size());

        // Identical rows: no insertion or removal, fresh records behind every row.
        const void *before = model.index(70, 0).internalPointer();
        log.entries.clear();
        model.requery();
        QVERIFY(waitDone(model));
        QCOMPARE(status.count(), 2);
        QVERIFY(log.of("insert").isEmpty());
        QVERIFY(log.of("remove").isEmpty());
        QVERIFY(!log.entries.isEmpty());
        QVERIFY(model.index(70, 0).internalPointer() != before);
        next = 0;
        for (const QString &change : log.entries) {
            QCOMPARE(change.section(' ', 1, 1).toInt(), next);
            next = change.section(' ', 2, 2).toInt() + 1;
        }
        QCOMPARE(next, 120);

        // One row changed, one gone, one new: the changed one is refreshed in place.
        m_db->exec({ "UPDATE file SET category = 'Ringtone' WHERE displayName = 'n0010'",
                     "DELETE FROM file WHERE displayName = 'n0020'" });
        addFiles({ "n0030a" });
        log.entries.clear();
        model.requery();
        QVERIFY(waitDone(model));
        QCOMPARE(log.of("remove"), QStringList { "remove 20 20" });
        QCOMPARE(log.of("insert"), QStringList { "insert 30 30" });
        QCOMPARE(model.index(10, 0).data(FileData::CategoryRole).toString(), "Ringtone");
        QCOMPARE(model.index(30, 0).data(FileData::DisplayNameRole).toString(), "n0030a");
        QCOMPARE(model.count(), 120);

        // A query with no rows ends in one removal.
        m_db->exec("DELETE FROM directory");
        log.entries.clear();
        model.requery();
        QVERIFY(waitDone(model));
        QCOMPARE(log.entries, QStringList { "remove 0 119" });
        QCOMPARE(model.count(), 0);
        QCOMPARE(model.status(), AbstractContentModel::Finished);
    }

    void queuedQueries()
    {
        addFiles(numbered(300));
        addFiles({ "picture" }, "image/jpeg");
        QStringList trace;
        FileModel model;
        QSignalSpy status(&model, &AbstractContentModel::statusChanged);

        // Two requests before the update request arrives: the first is dropped unrun.
        model.query(new TracedParameters("video/*", &trace));
        model.query(new TracedParameters("audio/*", &trace));
        QCOMPARE(trace, QStringList { "video/* dropped" });
        QVERIFY(waitDone(model));
        QCOMPARE(model.count(), 300);
        QTRY_COMPARE(trace, QStringList({ "video/* dropped", "audio/* ran" }));
        QCOMPARE(status.count(), 1);

        // Three while one runs: only the last runs, after the first, and the
        // status stays Querying without a signal until the end.
        trace.clear();
        model.query(new TracedParameters("image/*", &trace));
        model.componentComplete(); // starts it at once
        model.query(new TracedParameters("text/*", &trace));
        model.query(new TracedParameters("video/*", &trace));
        model.query(new TracedParameters("*", &trace));
        // The running one may have ended meanwhile on a slow machine.
        QCOMPARE(trace.filter(" dropped"), QStringList({ "text/* dropped", "video/* dropped" }));
        bool silent = true;
        QVERIFY(QTest::qWaitFor([&]() {
            silent = silent && (status.count() == 1) == (model.status() == AbstractContentModel::Querying);
            return model.status() != AbstractContentModel::Querying;
        }, 10000));
        QVERIFY(silent);
        QCOMPARE(status.count(), 2);
        QCOMPARE(model.status(), AbstractContentModel::Finished);
        QCOMPARE(model.count(), 301);
        QTRY_COMPARE(trace.size(), 4);
        QCOMPARE(trace.filter(" ran"), QStringList({ "image/* ran", "* ran" }));
    }

    void failedQuery()
    {
        // No agent for the type: an error, and the rows that the query did not deliver go.
        FileModel model(99);
        QSignalSpy status(&model, &AbstractContentModel::statusChanged);
        model.requery();
        QVERIFY(waitDone(model));
        QCOMPARE(model.status(), AbstractContentModel::Error);
        QCOMPARE(status.count(), 1);
    }

    void deletedDuringQuery()
    {
        addFiles(numbered(2000));
        QRandomGenerator random(7);
        for (int round = 0; round < 200; ++round) {
            auto *model = new FileModel;
            model->requery();
            model->componentComplete();
            for (int i = random.bounded(4); i > 0; --i)
                QCoreApplication::processEvents();
            delete model;
        }
        // 200 queries of 2000 rows run to their end, slowly in a sanitizer build.
        QVERIFY(QThreadPool::globalInstance()->waitForDone(300000));
        QCoreApplication::processEvents(); // nothing may be posted to the dead models
    }

    void filter()
    {
        addFiles(numbered(10));
        FileModel model;
        fill(model);
        ModelLog log(&model);

        model.filter = [](const Content &) { return false; };
        model.setFiltered(true);
        QCOMPARE(log.entries, QStringList { "remove 0 9" });
        QCOMPARE(model.count(), 0);

        // Rows that start passing come by insertion; while filtering, a change in
        // the index gives no dataChanged for rows that stay.
        model.filter = [](const Content &content) { return content.data()->id % 2 == 0; };
        log.entries.clear();
        model.refilter();
        QVERIFY(log.of("change").isEmpty());
        QCOMPARE(model.count(), 5);
        m_db->exec("UPDATE file SET category = 'Ringtone'");
        log.entries.clear();
        model.requery();
        QVERIFY(waitDone(model));
        QVERIFY(log.entries.isEmpty());
        QCOMPARE(model.index(0, 0).data(FileData::CategoryRole).toString(), QString());

        // Off again: the other rows come back by insertion, the shown ones read the new data.
        model.setFiltered(false);
        QVERIFY(log.of("remove").isEmpty());
        QVERIFY(log.of("change").isEmpty());
        QCOMPARE(displayNames(model), numbered(10));
        QCOMPARE(model.index(0, 0).data(FileData::CategoryRole).toString(), "Ringtone");
    }
};

QTEST_GUILESS_MAIN(tst_ContentModel)
#include "tst_contentmodel.moc"
