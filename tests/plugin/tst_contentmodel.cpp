#include "contentmodel.h"
#include "dbmanager.h"
#include "filequeryagent.h"
#include "messagelog.h"
#include "recordingservice.h"
#include "testdatabase.h"
#include "themeletqueryagent.h"
#include "themeletinterface.h"

#include <QJSEngine>
#include <QQmlComponent>
#include <QQmlEngine>
#include <QThreadPool>
#include <QtTest>

#include <functional>
#include <utility>
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

class ThemeletList : public ContentModel<ThemeletData>
{
public:
    ThemeletList() : ContentModel<ThemeletData>(ThemeletContent::Themelet) {}
    void requery() { query(new ThemeletQueryAgent::ThemeletParameters); }
};

// Parameters that tell, when they go, whether their query ran: the runner
// deletes them on a pool thread, a replaced request on the model's thread.
QMutex s_traceMutex;

// The entries of a trace that a pool thread may still be writing to.
QStringList traced(const QStringList &trace, const QString &filter = QString())
{
    QMutexLocker locker(&s_traceMutex);
    return filter.isEmpty() ? trace : trace.filter(filter);
}

class TracedParameters : public FileQueryAgent::FileParameters
{
public:
    TracedParameters(const QString &mimeType, QStringList *trace) : m_trace(trace) { this->mimeType = mimeType; }
    ~TracedParameters() override
    {
        QMutexLocker locker(&s_traceMutex);
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
        QStringList statements { QStringLiteral("BEGIN"), QStringLiteral("INSERT OR IGNORE INTO directory (path, scope) VALUES ('/m', 0)") };
        for (const QString &name : names)
            statements << QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, displayName, permissions) "
                                         "SELECT id, '%1', '%2.ogg', '%2', 3 FROM directory WHERE path = '/m'").arg(mimeType, name);
        m_db->exec(statements << QStringLiteral("COMMIT"));
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
        QCOMPARE(traced(trace), QStringList { "video/* dropped" });
        QVERIFY(waitDone(model));
        QCOMPARE(model.count(), 300);
        QTRY_COMPARE(traced(trace), QStringList({ "video/* dropped", "audio/* ran" }));
        QCOMPARE(status.count(), 1);

        // Three while one runs: only the last runs, after the first, and the
        // status stays Querying without a signal until the end.
        trace.clear();
        model.query(new TracedParameters("image/*", &trace));
        model.componentComplete(); // starts it at once
        model.query(new TracedParameters("text/*", &trace));
        model.query(new TracedParameters("video/*", &trace));
        model.query(new TracedParameters("*", &trace));
        // The running query may already have ended on its pool thread.
        QCOMPARE(traced(trace, " dropped"), QStringList({ "text/* dropped", "video/* dropped" }));
        bool silent = true;
        QVERIFY(QTest::qWaitFor([&]() {
            silent = silent && (status.count() == 1) == (model.status() == AbstractContentModel::Querying);
            return model.status() != AbstractContentModel::Querying;
        }, 10000));
        QVERIFY(silent);
        QCOMPARE(status.count(), 2);
        QCOMPARE(model.status(), AbstractContentModel::Finished);
        QCOMPARE(model.count(), 301);
        QTRY_COMPARE(traced(trace, " ran"), QStringList({ "image/* ran", "* ran" }));
    }

    void failedQuery()
    {
        // No agent for the type: an error, and the rows that the query did not deliver go.
        FileModel model(ThemeletContent::Video);
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
        int midQuery = 0;
        for (int round = 0; round < 200; ++round) {
            auto *model = new FileModel;
            model->requery();
            model->componentComplete();
            for (int i = random.bounded(4); i > 0; --i)
                QCoreApplication::processEvents();
            midQuery += model->status() == AbstractContentModel::Querying;
            delete model;
        }
        QVERIFY(midQuery > 100);
        // 200 queries of 2000 rows run to their end, slowly in a sanitizer build.
        QVERIFY(QThreadPool::globalInstance()->waitForDone(300000));
        QCoreApplication::processEvents(); // nothing may be posted to the dead models
    }

    void writes()
    {
        RecordingService service;
        QVERIFY(service.start());
        addFiles({ "bell" });
        m_db->exec({ "INSERT INTO directory (path, scope) VALUES ('/t', 0)",
                     "INSERT INTO file (directoryId, mimeType, fileName, displayName, permissions) SELECT id, "
                     "'application/x-vorka-themelet', 'sea.themelet', 'Sea', 3 FROM directory WHERE path = '/t'",
                     "INSERT INTO themelet (fileId, favorite, timestamp, highlightColor) SELECT id, 0, '001', '#112233' "
                     "FROM file WHERE fileName = 'sea.themelet'",
                     "INSERT INTO resource SELECT t.id, 'ringerTone', f.id FROM file t, file f "
                     "WHERE t.fileName = 'sea.themelet' AND f.fileName = 'bell.ogg'" });
        const qlonglong id = m_db->value("SELECT id FROM file WHERE fileName = 'sea.themelet'").toLongLong();

        QQmlEngine engine;
        QQmlComponent quick(&engine); // brings the colour type of Qt.rgba
        quick.setData("import QtQuick 2.0; QtObject {}", QUrl());
        std::unique_ptr<QObject> quickObject(quick.create());
        ThemeletList model;
        QQmlEngine::setContextForObject(&model, engine.rootContext());
        model.requery();
        QVERIFY(waitDone(model));
        QCOMPARE(model.count(), 1);
        QCOMPARE(model.get(0).property("displayName").toString(), "Sea");
        QVERIFY(model.get(1).isUndefined());
        QCOMPARE(model.indexOf("displayName", "Sea"), 0);
        QCOMPARE(model.indexOf("displayName", "Land"), -1);
        QCOMPARE(model.indexOf("nope", "Sea"), -1);

        // Calls cross the bus in order: a last known one tells that nothing else came.
        const auto callsUpTo = [&service](const QString &fence) {
            ThemeletInterface::instance()->indexFile(fence);
            if (!QTest::qWaitFor([&]() { return !service.calls.isEmpty() && service.calls.last().method == "indexFile"; }))
                return QList<RecordingService::Call>();
            QList<RecordingService::Call> calls = service.calls;
            calls.removeLast();
            service.calls.clear();
            return calls;
        };

        QSignalSpy changed(&model, &QAbstractItemModel::dataChanged);
        const Content held(static_cast<ContentData *>(model.index(0, 0).internalPointer()));
        model.setProperty(0, "highlightColor", QColor(255, 0, 0, 128));
        QCOMPARE(model.index(0, 0).data(ThemeletData::HighlightColorRole).value<QColor>(), QColor(255, 0, 0, 128));
        QCOMPARE(held.data()->data(ThemeletData::HighlightColorRole).value<QColor>(), QColor("#112233")); // cloned, not shared
        QCOMPARE(changed.count(), 1);
        QCOMPARE(changed.at(0).at(2).value<QVector<int>>(), QVector<int> { ThemeletData::HighlightColorRole });
        auto calls = callsUpTo("1");
        QCOMPARE(calls.size(), 1);
        QCOMPARE(calls.at(0).method, "saveAttributes");
        QCOMPARE(calls.at(0).arguments, QVariantList({ 1, id, QVariantMap { { "highlightColor", "#80ff0000" } } }));

        // Unknown names, roles that can't be written, rows that don't exist: nothing goes out.
        model.setProperty(0, "nope", 1);
        model.setProperty(0, "wallpaperUrl", "file:///w.jpg");
        model.setProperty(5, "displayName", "x");
        model.set(0, engine.evaluate("({ nope: 1, zefId: 'z' })"));
        model.set(1, engine.evaluate("({ displayName: 'x' })"));
        model.remove(-1);
        model.remove(1);
        QCOMPARE(callsUpTo("2").size(), 0);
        QCOMPARE(changed.count(), 1);

        // One set is one call and one signal; a nested map sends only the keys given.
        model.set(0, engine.evaluate("({ displayName: 'Bay', nope: 2, secondaryColor: Qt.rgba(0, 0, 1, 1),"
                                     "  resources: { ringerTone: { displayName: 'Bell 2' }, messageTone: { url: 'file:///m.ogg' } } })"));
        QCOMPARE(changed.count(), 2);
        QCOMPARE(changed.at(1).at(2).value<QVector<int>>(),
                 QVector<int>({ ThemeletData::DisplayNameRole, ThemeletData::SecondaryColorRole, ThemeletData::ResourcesRole }));
        calls = callsUpTo("3");
        QCOMPARE(calls.size(), 1);
        QCOMPARE(calls.at(0).arguments.at(2).toMap(),
                 QVariantMap({ { "displayName", "Bay" }, { "secondaryColor", "#ff0000ff" },
                               { "resources", QVariantMap { { "ringerTone", QVariantMap { { "displayName", "Bell 2" } } },
                                                            { "messageTone", QVariantMap { { "url", "file:///m.ogg" } } } } } }));
        const QVariantMap resources = model.index(0, 0).data(ThemeletData::ResourcesRole).toMap();
        QCOMPARE(resources.value("ringerTone").toMap(),
                 QVariantMap({ { "url", QUrl::fromLocalFile("/m/bell.ogg") }, { "fileName", "bell.ogg" }, { "displayName", "Bell 2" } }));
        QCOMPARE(resources.value("messageTone").toMap(), QVariantMap({ { "url", "file:///m.ogg" } }));

        // What the bus can't carry as it is: undefined, an object, a URL deep in a map.
        model.set(0, engine.evaluate("({ displayName: undefined, resources: { ringerTone: { fileName: [undefined, 1] } } })"));
        model.setProperty(0, "ringerVolume", QVariant::fromValue<QObject *>(&model));
        model.setProperty(0, "resources", QVariantMap { { "a", QVariantList { QVariantMap { { "url", QUrl("file:///a") } } } } });
        calls = callsUpTo("5");
        QCOMPARE(calls.size(), 3);
        QCOMPARE(calls.at(0).arguments.at(2).toMap(),
                 QVariantMap({ { "displayName", "" }, { "resources", QVariantMap { { "ringerTone", QVariantMap { { "fileName", QVariantList { "", 1 } } } } } } }));
        QCOMPARE(calls.at(1).arguments.at(2).toMap(), QVariantMap({ { "ringerVolume", "" } }));
        QCOMPARE(calls.at(2).arguments.at(2).toMap(),
                 QVariantMap({ { "resources", QVariantMap { { "a", QVariantList { QVariantMap { { "url", "file:///a" } } } } } } }));

        // Removal is the service's: the row stays until a new query.
        QSignalSpy count(&model, &AbstractContentModel::countChanged);
        model.remove(0);
        calls = callsUpTo("4");
        QCOMPARE(calls.size(), 1);
        QCOMPARE(calls.at(0).method, "remove");
        QCOMPARE(calls.at(0).arguments, QVariantList({ 1, id }));
        QCOMPARE(model.count(), 1);
        QCOMPARE(count.count(), 0);
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

        // A handler of a row signal turns the filter on in the middle of a merge:
        // the merge ends on the full list first.
        m_db->exec("DELETE FROM file WHERE displayName = 'n0003'");
        addFiles({ "n0005a", "n0007a" });
        bool once = true;
        const auto filterNow = [&]() {
            if (std::exchange(once, false)) {
                model.filter = [](const Content &) { return false; };
                model.setFiltered(true);
            }
        };
        const auto removed = connect(&model, &QAbstractItemModel::rowsRemoved, this, filterNow);
        const auto inserted = connect(&model, &QAbstractItemModel::rowsInserted, this, filterNow);
        model.requery();
        QVERIFY(waitDone(model));
        disconnect(removed);
        disconnect(inserted);
        QVERIFY(!once);
        QCOMPARE(model.count(), 0);
        model.setFiltered(false);
        QCOMPARE(displayNames(model), QStringList({ "n0000", "n0001", "n0002", "n0004", "n0005", "n0005a", "n0006",
                                                    "n0007", "n0007a", "n0008", "n0009" }));
    }
};

QTEST_MAIN(tst_ContentModel)
#include "tst_contentmodel.moc"
