// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "contentmodel.h"
#include "dbmanager.h"
#include "filequeryagent.h"
#include "messagelog.h"
#include "recordingservice.h"
#include "testdatabase.h"
#include "themeletmodel.h"

#include <QQmlEngine>
#include <QThreadPool>
#include <QtTest>

#include <functional>
#include <memory>
#include <utility>

namespace {

// A list of files with the protected interface of the base at hand.
class FileModel : public ContentModel<FileData>
{
public:
    FileModel() : ContentModel<FileData>(ThemeletContent::File) {}
    using AbstractContentModel::query;
    using AbstractContentModel::refilter;
    using AbstractContentModel::setFiltered;
    void requery() { query(new FileQueryAgent::FileParameters); }
    bool acceptContent(const Content &content) const override { return filter && filter(content); }
    std::function<bool(const Content &)> filter;
};

// Parameters that tell, when they go, whether their query ran: the runner
// deletes them on a pool thread, a replaced request on the model's thread.
QMutex s_traceMutex;
QStringList s_trace;

QStringList traced(const QString &filter)
{
    const QMutexLocker locker(&s_traceMutex);
    return s_trace.filter(filter);
}

struct TracedParameters : FileQueryAgent::FileParameters
{
    explicit TracedParameters(const char *type) { mimeType = type; }
    ~TracedParameters() override
    {
        const QMutexLocker locker(&s_traceMutex);
        s_trace << mimeType + (QThread::currentThread() == qApp->thread() ? " dropped" : " ran");
    }
};

// The row signals of a model in order: "insert 0 49", "remove 3 3", "change 0 9".
void logRows(QAbstractItemModel *model, QStringList *log)
{
    QObject::connect(model, &QAbstractItemModel::rowsInserted, [log](const QModelIndex &, int f, int l) { *log << QStringLiteral("insert %1 %2").arg(f).arg(l); });
    QObject::connect(model, &QAbstractItemModel::rowsRemoved, [log](const QModelIndex &, int f, int l) { *log << QStringLiteral("remove %1 %2").arg(f).arg(l); });
    QObject::connect(model, &QAbstractItemModel::dataChanged,
                     [log](const QModelIndex &f, const QModelIndex &l) { *log << QStringLiteral("change %1 %2").arg(f.row()).arg(l.row()); });
}

// Whether the log holds row signals of one kind only, covering `rows` rows, at most one a batch of 50.
bool batched(const QStringList &log, const QString &kind, int rows)
{
    int covered = 0;
    for (const QString &entry : log)
        covered += entry.startsWith(kind) ? entry.section(' ', 2, 2).toInt() - entry.section(' ', 1, 1).toInt() + 1 : rows + 1;
    return covered == rows && log.size() <= (rows + 49) / 50;
}

QStringList numbered(int count)
{
    QStringList names;
    for (int i = 0; i < count; ++i)
        names << QStringLiteral("n%1").arg(i, 4, 10, QLatin1Char('0'));
    return names;
}

QStringList displayNames(const QAbstractItemModel &model)
{
    QStringList names;
    for (int row = 0; row < model.rowCount(); ++row)
        names << model.index(row, 0).data(FileData::DisplayNameRole).toString();
    return names;
}

bool finished(const AbstractContentModel &model)
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
        QStringList statements { "BEGIN", "INSERT OR IGNORE INTO directory (path, scope) VALUES ('/m', 0)" };
        for (const QString &name : names)
            statements << QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, displayName, permissions) "
                                         "SELECT id, '%1', '%2.ogg', '%2', 3 FROM directory WHERE path = '/m'").arg(mimeType, name);
        QVERIFY(m_db->exec(statements << "COMMIT"));
    }

private slots:
    void initTestCase()
    {
        QVERIFY(DbManager::instance().isOpen());
        m_db.reset(new TestDatabase);
    }

    void init() { m_db->exec("DELETE FROM directory"); }

    void cleanup() { QVERIFY(QThreadPool::globalInstance()->waitForDone(10000)); }

    void queryAndRequery()
    {
        addFiles(numbered(120));
        QStringList log;
        FileModel model;
        logRows(&model, &log);
        QSignalSpy status(&model, &AbstractContentModel::statusChanged), count(&model, &AbstractContentModel::countChanged);
        const auto requery = [&]() {
            log.clear();
            model.requery();
            return finished(model);
        };
        model.requery();
        QCOMPARE(model.status(), AbstractContentModel::Querying);
        model.componentComplete();
        QVERIFY(finished(model));
        QCOMPARE(status.count(), 1);
        QCOMPARE(displayNames(model), numbered(120));
        QVERIFY2(batched(log, "insert", 120), qPrintable(log.join(", ")));
        QCOMPARE(count.count(), log.size());

        // Identical rows: refreshed in place, fresh records behind every row.
        const void *before = model.index(70, 0).internalPointer();
        QVERIFY(requery());
        QVERIFY2(batched(log, "change", 120), qPrintable(log.join(", ")));
        QVERIFY(model.index(70, 0).internalPointer() != before);

        // One row changed, one gone, one new.
        m_db->exec({ "UPDATE file SET category = 'Ringtone' WHERE displayName = 'n0010'", "DELETE FROM file WHERE displayName = 'n0020'" });
        addFiles({ "n0030a" });
        QVERIFY(requery());
        QCOMPARE(log.filter(QRegularExpression("^(insert|remove)")), QStringList({ "remove 20 20", "insert 30 30" }));
        QCOMPARE(model.index(10, 0).data(FileData::CategoryRole).toString(), "Ringtone");
        QCOMPARE(model.count(), 120);

        // No rows at all: one removal.
        m_db->exec("DELETE FROM directory");
        QVERIFY(requery());
        QCOMPARE(log, QStringList { "remove 0 119" });
        QCOMPARE(status.count(), 4);
        QCOMPARE(model.status(), AbstractContentModel::Finished);
    }

    // Three requests while one runs: only the last runs, after the first, and the
    // status stays Querying without a signal until the end.
    void queuedQueries()
    {
        addFiles(numbered(300));
        addFiles({ "picture" }, "image/jpeg");
        FileModel model;
        QSignalSpy status(&model, &AbstractContentModel::statusChanged);
        model.query(new TracedParameters("image/*"));
        model.componentComplete(); // starts it at once
        model.query(new TracedParameters("text/*"));
        model.query(new TracedParameters("video/*"));
        model.query(new TracedParameters("*"));
        // The running query may already have ended on its pool thread.
        QCOMPARE(traced(" dropped"), QStringList({ "text/* dropped", "video/* dropped" }));
        QVERIFY(finished(model));
        QCOMPARE(status.count(), 1); // a status that left Querying in between would have signalled
        QCOMPARE(model.count(), 301);
        QTRY_COMPARE(traced(" ran"), QStringList({ "image/* ran", "* ran" }));
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
        QVERIFY(m_db->exec({ "INSERT INTO directory (path, scope) VALUES ('/t', 0)",
                             "INSERT INTO file (directoryId, mimeType, fileName, displayName, permissions) SELECT id, "
                             "'application/x-vorka-themelet', 'sea.themelet', 'Sea', 3 FROM directory WHERE path = '/t'",
                             "INSERT INTO themelet (fileId, favorite, timestamp, highlightColor) SELECT id, 0, '001', '#112233' "
                             "FROM file WHERE fileName = 'sea.themelet'",
                             "INSERT INTO resource SELECT t.id, 'ringerTone', f.id FROM file t, file f "
                             "WHERE t.fileName = 'sea.themelet' AND f.fileName = 'bell.ogg'" }));
        const qlonglong id = m_db->value("SELECT id FROM file WHERE fileName = 'sea.themelet'").toLongLong();

        QQmlEngine engine;
        ThemeletModel model;
        QQmlEngine::setContextForObject(&model, engine.rootContext());
        model.componentComplete();
        QVERIFY(finished(model));
        QCOMPARE(model.indexOf("displayName", "Sea"), 0);
        QCOMPARE(model.indexOf("displayName", "Land"), -1);

        QSignalSpy changed(&model, &QAbstractItemModel::dataChanged);
        const Content held(static_cast<ContentData *>(model.index(0, 0).internalPointer()));
        model.setProperty(0, "highlightColor", QColor(255, 0, 0, 128));
        QCOMPARE(model.index(0, 0).data(ThemeletData::HighlightColorRole).value<QColor>(), QColor(255, 0, 0, 128));
        QCOMPARE(held.data()->data(ThemeletData::HighlightColorRole).value<QColor>(), QColor("#112233")); // cloned, not shared
        QCOMPARE(changed.count(), 1);
        QCOMPARE(changed.at(0).at(2).value<QVector<int>>(), QVector<int> { ThemeletData::HighlightColorRole });
        QCOMPARE(service.take(1), QVariantList { QVariant(QVariantList { "saveAttributes", 1, id, QVariantMap { { "highlightColor", "#80ff0000" } } }) });

        // Unknown names, roles that can't be written, rows that don't exist: nothing goes out.
        model.setProperty(0, "nope", 1);
        model.setProperty(0, "wallpaperUrl", "file:///w.jpg");
        model.setProperty(5, "displayName", "x");
        model.set(0, engine.evaluate("({ nope: 1 })"));
        model.set(1, engine.evaluate("({ displayName: 'x' })"));
        model.remove(1);
        QCOMPARE(service.take(), QVariantList());
        QCOMPARE(changed.count(), 1);

        // One set is one call and one signal; a nested map sends only the keys given,
        // and the row holds the merged whole.
        model.set(0, engine.evaluate("({ displayName: 'Bay', nope: 2,"
                                     "  resources: { ringerTone: { displayName: 'Bell 2' }, messageTone: { url: 'file:///m.ogg' } } })"));
        QCOMPARE(changed.count(), 2);
        QCOMPARE(changed.at(1).at(2).value<QVector<int>>(), QVector<int>({ ThemeletData::DisplayNameRole, ThemeletData::ResourcesRole }));
        const QVariantMap sent { { "ringerTone", QVariantMap { { "displayName", "Bell 2" } } },
                                 { "messageTone", QVariantMap { { "url", "file:///m.ogg" } } } };
        QCOMPARE(service.take(1), QVariantList { QVariant(QVariantList { "saveAttributes", 1, id, QVariantMap { { "displayName", "Bay" }, { "resources", sent } } }) });
        const QVariantMap resources = model.index(0, 0).data(ThemeletData::ResourcesRole).toMap();
        QCOMPARE(resources.value("ringerTone").toMap(),
                 QVariantMap({ { "url", QUrl::fromLocalFile("/m/bell.ogg") }, { "fileName", "bell.ogg" }, { "displayName", "Bell 2" } }));
        QCOMPARE(resources.value("messageTone"), sent.value("messageTone"));

        // Removal is the service's: the row stays until a new query.
        model.remove(0);
        QCOMPARE(service.take(1), QVariantList { QVariant(QVariantList { "remove", 1, id }) });
        QCOMPARE(model.count(), 1);

        // A write that the service refuses is told once in the log; the local row is left to the next query.
        service.errorMessage = "No way";
        const MessageLog messages;
        model.remove(0);
        model.setProperty(0, "displayName", "Cove");
        QTRY_COMPARE(messages.warnings(), QStringList({ QString("Orbaline.Themelet: themeletd refused remove(1, %1): No way").arg(id),
                                                        QString("Orbaline.Themelet: themeletd refused saveAttributes(1, %1): No way").arg(id) }));
        QCOMPARE(model.index(0, 0).data(ThemeletData::DisplayNameRole).toString(), QString("Cove"));
    }

    void filter()
    {
        addFiles(numbered(10));
        QStringList log;
        FileModel model;
        model.requery();
        model.componentComplete();
        QVERIFY(finished(model));
        logRows(&model, &log);

        model.filter = [](const Content &) { return false; };
        model.setFiltered(true);
        QCOMPARE(log, QStringList { "remove 0 9" });

        // Rows that start passing come by insertion; while filtering, a change in
        // the index gives no dataChanged for rows that stay.
        model.filter = [](const Content &content) { return content.data()->id % 2 == 0; };
        model.refilter();
        QCOMPARE(model.count(), 5);
        m_db->exec("UPDATE file SET category = 'Ringtone'");
        model.requery();
        QVERIFY(finished(model));
        QCOMPARE(model.count(), 5);
        QCOMPARE(model.index(0, 0).data(FileData::CategoryRole).toString(), QString());

        // Off again: the other rows come back by insertion, the shown ones read the new data.
        model.setFiltered(false);
        QCOMPARE(log.filter(QRegularExpression("^(change|remove)")), QStringList { "remove 0 9" });
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
        QObject context;
        connect(&model, &QAbstractItemModel::rowsRemoved, &context, filterNow);
        connect(&model, &QAbstractItemModel::rowsInserted, &context, filterNow);
        model.requery();
        QVERIFY(finished(model));
        QVERIFY(!once);
        QCOMPARE(model.count(), 0);
        model.setFiltered(false);
        QCOMPARE(displayNames(model).join(' '), "n0000 n0001 n0002 n0004 n0005 n0005a n0006 n0007 n0007a n0008 n0009");
    }
};

QTEST_MAIN(tst_ContentModel)
#include "tst_contentmodel.moc"
