// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The module's C++ side: the lists and their difference, and the calls that the lists and Themelet make to themeletd.
#include "contentmodel.h"
#include "dbmanager.h"
#include "declarativethemelet.h"
#include "filequeryagent.h"
#include "messagelog.h"
#include "recordinglist.h"
#include "recordingservice.h"
#include "testdatabase.h"
#include "themeletinterface.h"
#include "themeletmodel.h"

#include <QQmlEngine>
#include <QThreadPool>
#include <QtTest>

namespace {

// A list of files with the protected interface of the base at hand.
class FileModel : public ContentModel<FileData>
{
public:
    FileModel() : ContentModel<FileData>(ThemeletContent::File) {}
    using AbstractContentModel::query;
    using AbstractContentModel::setFiltered;
    void requery() { query(new FileQueryAgent::FileParameters); }
    bool acceptContent(const Content &content) const override { return filter && filter(content); }
    bool (*filter)(const Content &) = nullptr;
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
    std::unique_ptr<RecordingService> m_service;
    QQmlEngine m_engine;

    void addFiles(const QStringList &names)
    {
        QStringList statements { "BEGIN", "INSERT OR IGNORE INTO directory (path, scope) VALUES ('/m', 0)" };
        for (const QString &name : names)
            statements << QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, displayName, permissions) "
                                         "SELECT id, 'audio/ogg', '%1.ogg', '%1', 3 FROM directory WHERE path = '/m'").arg(name);
        QVERIFY(m_db->exec(statements << "COMMIT"));
    }

private slots:
    void initTestCase()
    {
        QVERIFY(DbManager::instance().isOpen());
        m_db.reset(new TestDatabase);
    }

    void init()
    {
        m_db->exec("DELETE FROM directory");
        m_service.reset(new RecordingService);
        QVERIFY(m_service->start());
    }

    void cleanup()
    {
        m_service.reset();
        QVERIFY(QThreadPool::globalInstance()->waitForDone(10000));
    }

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

        // One row changed, one replaced in place.
        m_db->exec({ "UPDATE file SET category = 'Ringtone' WHERE displayName = 'n0010'", "DELETE FROM file WHERE displayName = 'n0020'" });
        addFiles({ "n0020a" });
        QVERIFY(requery());
        QCOMPARE(log.filter(QRegularExpression("^(insert|remove)")), QStringList({ "remove 20 20", "insert 20 20" }));
        QCOMPARE(model.index(10, 0).data(FileData::CategoryRole).toString(), "Ringtone");

        // No rows at all: one removal.
        m_db->exec("DELETE FROM directory");
        QVERIFY(requery());
        QCOMPARE(log, QStringList { "remove 0 119" });
        QCOMPARE(status.count(), 4);
        QCOMPARE(model.status(), AbstractContentModel::Finished);
    }

    // Random pairs of lists (same ids across types, ids too large for a key, reversals, the same list,
    // small edits) in random batches, with and without keys, as a model keeps them between queries:
    // the edits must give exactly the new list and its handles.
    void listDifference()
    {
        for (int seed = 1; seed <= 2000; ++seed) {
            QRandomGenerator random(seed);
            const int ids = 1 + random.bounded(40);
            const auto make = [](qint64 id, int type) {
                return type == ThemeletContent::Themelet ? Content(new ThemeletData(id, QUrl())) : Content(new FileData(id, QUrl()));
            };
            const auto randomList = [&]() {
                QVector<Content> list(random.bounded(31));
                for (Content &content : list)
                    content = make(qint64(random.bounded(ids)) << (random.bounded(8) ? 0 : 57), random.bounded(2));
                return list;
            };
            const QVector<Content> before = randomList();
            QVector<Content> after = seed % 4 == 0 ? randomList() : before;
            if (seed % 4 == 1)
                std::reverse(after.begin(), after.end());
            for (int i = seed % 4 == 3 ? random.bounded(5) : 0; i > 0; --i) {
                if (!after.isEmpty() && random.bounded(2))
                    after.remove(random.bounded(after.size()));
                else
                    after.insert(random.bounded(after.size() + 1), make(random.bounded(ids), 0));
            }
            for (Content &content : after) // fresh handles: a row left unrefreshed shows
                content = Content(content.data()->clone());

            const auto keysOf = [keyed = seed % 2 == 1](const QVector<Content> &rows) {
                QVector<SynchronizedContent::Key> keys;
                for (int i = 0; keyed && i < rows.size(); ++i)
                    keys << SynchronizedContent::key(rows.at(i));
                return keys;
            };
            RecordingList agent;
            QVector<SynchronizedContent::Key> keys = keysOf(before);
            agent.list.finish(before, &agent, &keys);
            QVector<Content> received;
            while (received.size() < after.size()) {
                received += after.mid(received.size(), 1 + random.bounded(8));
                agent.list.merge(received, &agent, keysOf(received));
            }
            keys = keysOf(after);
            agent.list.finish(received, &agent, &keys);
            const bool same = std::equal(agent.list.cbegin(), agent.list.cend(), after.cbegin(), after.cend(),
                                         [](const Content &a, const Content &b) { return a.data() == b.data(); });
            QVERIFY2(agent.valid && same, qPrintable(QString("seed %1: %2").arg(seed).arg(agent.operations.join(", "))));
        }
    }

    void deletedDuringQuery()
    {
        addFiles(numbered(2000));
        QRandomGenerator random(7);
        for (int round = 0; round < 200; ++round) {
            FileModel model;
            model.requery();
            model.componentComplete();
            for (int i = random.bounded(4); i > 0; --i)
                QCoreApplication::processEvents();
        }
        // 200 queries of 2000 rows run to their end, slowly in a sanitizer build.
        QVERIFY(QThreadPool::globalInstance()->waitForDone(300000));
        QCoreApplication::processEvents(); // nothing may be posted to the dead models
    }

    void writes()
    {
        addFiles({ "bell", "sea" }); // a themelet by its row in the themelet table
        QVERIFY(m_db->exec({ "INSERT INTO themelet (fileId, favorite, timestamp, highlightColor) SELECT id, 0, '001', '#112233' "
                             "FROM file WHERE fileName = 'sea.ogg'",
                             "INSERT INTO resource SELECT t.id, 'ringerTone', f.id FROM file t, file f "
                             "WHERE t.fileName = 'sea.ogg' AND f.fileName = 'bell.ogg'" }));
        const qlonglong id = m_db->value("SELECT id FROM file WHERE fileName = 'sea.ogg'").toLongLong();

        ThemeletModel model;
        QQmlEngine::setContextForObject(&model, m_engine.rootContext());
        model.componentComplete();
        QVERIFY(finished(model));
        QCOMPARE(model.indexOf("displayName", "sea"), 0);

        QSignalSpy changed(&model, &QAbstractItemModel::dataChanged);
        const Content held(static_cast<ContentData *>(model.index(0, 0).internalPointer()));
        model.setProperty(0, "highlightColor", QColor(255, 0, 0, 128));
        QCOMPARE(model.index(0, 0).data(ThemeletData::HighlightColorRole).value<QColor>(), QColor(255, 0, 0, 128));
        QCOMPARE(held.data()->data(ThemeletData::HighlightColorRole).value<QColor>(), QColor("#112233")); // cloned, not shared
        QCOMPARE(changed.at(0).at(2).value<QVector<int>>(), QVector<int> { ThemeletData::HighlightColorRole });
        QCOMPARE(m_service->take(1), QVariantList { QVariant(QVariantList { "saveAttributes", 1, id, QVariantMap { { "highlightColor", "#80ff0000" } } }) });

        // Roles that can't be written, rows that don't exist: nothing goes out.
        model.setProperty(0, "wallpaperUrl", "file:///w.jpg");
        model.remove(1);
        QCOMPARE(m_service->take(), QVariantList());

        // One set is one call and one signal; a nested map sends only the keys given,
        // and the row holds the merged whole.
        model.set(0, m_engine.evaluate("({ displayName: 'Bay', nope: 2, resources: { ringerTone: { displayName: 'Bell 2' } } })"));
        QCOMPARE(changed.count(), 2); // none from the writes that went nowhere
        QCOMPARE(changed.at(1).at(2).value<QVector<int>>(), QVector<int>({ ThemeletData::DisplayNameRole, ThemeletData::ResourcesRole }));
        const QVariantMap sent { { "ringerTone", QVariantMap { { "displayName", "Bell 2" } } } };
        QCOMPARE(m_service->take(1), QVariantList { QVariant(QVariantList { "saveAttributes", 1, id, QVariantMap { { "displayName", "Bay" }, { "resources", sent } } }) });
        const QVariantMap resources = model.index(0, 0).data(ThemeletData::ResourcesRole).toMap();
        QCOMPARE(resources.value("ringerTone").toMap(),
                 QVariantMap({ { "url", QUrl::fromLocalFile("/m/bell.ogg") }, { "fileName", "bell.ogg" }, { "displayName", "Bell 2" } }));

        // Removal is the service's: the row stays until a new query. A refusal is told once in the log.
        m_service->errorMessage = "No way";
        const MessageLog messages;
        model.remove(0);
        QTRY_COMPARE(messages.warnings(), QStringList(QString("Orbaline.Themelet: themeletd refused remove(1, %1): No way").arg(id)));
        QCOMPARE(m_service->take(), QVariantList { QVariant(QVariantList { "remove", 1, id }) });
        QCOMPARE(model.count(), 1);
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

        // A query keeps the filter.
        model.filter = [](const Content &content) { return content.data()->id % 2 == 0; };
        model.setFiltered(true);
        m_db->exec("UPDATE file SET category = 'Ringtone'");
        model.requery();
        QVERIFY(finished(model));
        QCOMPARE(model.count(), 5);
        // Off again: the other rows come back by insertion, the shown ones read the new data without a signal.
        model.setFiltered(false);
        QCOMPARE(log.filter("change"), QStringList());
        QCOMPARE(displayNames(model), numbered(10));
        QCOMPARE(model.index(0, 0).data(FileData::CategoryRole).toString(), "Ringtone");

        // A handler of a row signal turns the filter on in the middle of a merge:
        // the merge ends on the full list first.
        m_db->exec("DELETE FROM file WHERE displayName = 'n0003'");
        addFiles({ "n0005a", "n0007a" });
        QMetaObject::Connection connection;
        connection = connect(&model, &QAbstractItemModel::rowsRemoved, [&]() {
            disconnect(connection);
            model.filter = [](const Content &) { return false; };
            model.setFiltered(true);
        });
        model.requery();
        QVERIFY(finished(model));
        QCOMPARE(model.count(), 0); // the handler ran
        model.setFiltered(false);
        QCOMPARE(displayNames(model).join(' '), "n0000 n0001 n0002 n0004 n0005 n0005a n0006 n0007 n0007a n0008 n0009");
    }

    // Values in their D-Bus form, and nothing that would make libdbus abort.
    void attributesReachService()
    {
        const QVariantMap attributes { { "favorite", true }, { "none", QVariant() }, { "object", QVariant::fromValue<QObject *>(this) },
                                       { "resources", QVariantMap { { "k", QColor(Qt::red) }, { "u", QVariantList { QUrl("file:///u"), QVariant() } } } } };
        ThemeletInterface::instance()->saveAttributes(1, 5, attributes);
        const QVariantMap sent { { "favorite", true }, { "none", "" }, { "object", "" },
                                 { "resources", QVariantMap { { "k", "#ffff0000" }, { "u", QVariantList { "file:///u", "" } } } } };
        QCOMPARE(m_service->take(1), QVariantList { QVariant(QVariantList { "saveAttributes", 1, 5, sent }) });
    }

    // The callback gets the id that the service answers; a refusal is told on the item instead.
    void themelet()
    {
        m_service->replyId = 12;
        m_engine.globalObject().setProperty("calls", m_engine.newArray());
        const QJSValue function = m_engine.evaluate("(function() { calls.push(Array.prototype.slice.call(arguments)); })");
        DeclarativeThemelet themelet;
        const QString url = QUrl::fromLocalFile("/t/sea #1.themelet").toString();
        themelet.setThemelet(url, function);
        QCOMPARE(m_service->take(1), QVariantList { QVariant(QVariantList { "setThemelet", url }) });
        QTRY_COMPARE(m_engine.evaluate("JSON.stringify(calls)").toString(), "[[12]]");
        // Writing the property is the same call, made even for the current value.
        themelet.setProperty("source", themelet.source());
        QCOMPARE(m_service->take(1), QVariantList { QVariant(QVariantList { "setThemelet", themelet.source().toString() }) });

        m_service->errorMessage = "no such file";
        const MessageLog log;
        themelet.create(url, function);
        QCOMPARE(m_service->take(1), QVariantList { QVariant(QVariantList { "createThemelet", url }) });
        const QRegularExpression refusal("QML DeclarativeThemelet: Error creating themelet: no such file$");
        QTRY_COMPARE(log.records().filter(refusal).size(), 1);
        QCOMPARE(m_engine.evaluate("JSON.stringify(calls)").toString(), "[[12]]");

        // Only the hue counts; the colours come back as RGB, which QColor's equality tells apart.
        const QColor dimmer = themelet.highlightDimmerColor(QColor(0, 0, 80, 20));
        const QColor background = themelet.highlightBackgroundColor(QColor(0, 0, 80, 20));
        QCOMPARE(dimmer.name(QColor::HexArgb) + background.name(QColor::HexArgb), "#ff000033#ff0000e6");
        QVERIFY(dimmer == dimmer.toRgb() && background == background.toRgb());
    }
};

QTEST_MAIN(tst_ContentModel)
#include "tst_contentmodel.moc"
