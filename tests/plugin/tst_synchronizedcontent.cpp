#include "synchronizedcontent.h"

#include <QRandomGenerator>
#include <QtTest>

namespace {

Content make(qint64 id, int type)
{
    return type == ThemeletContent::Themelet ? Content(new ThemeletData(id, QUrl())) : Content(new FileData(id, QUrl()));
}

// A row named by its type letter and id: "f3" is a file, "t3" a themelet.
Content row(const QString &name)
{
    const int type = name.at(0) == QLatin1Char('t') ? ThemeletContent::Themelet : ThemeletContent::File;
    return make(name.mid(1).toLongLong(), type);
}

QVector<Content> rows(const QString &names)
{
    QVector<Content> result;
    for (const QString &name : names.split(QLatin1Char(' '), Qt::SkipEmptyParts))
        result.append(row(name));
    return result;
}

QString names(const QVector<Content> &list)
{
    QStringList result;
    for (const Content &content : list)
        result << QLatin1Char(content.type() == ThemeletContent::Themelet ? 't' : 'f') + QString::number(content.data()->id);
    return result.join(QLatin1Char(' '));
}

// Applies each edit to its list and writes it down; an edit out of range fails the test.
struct RecordingAgent : SynchronizationInterface
{
    SynchronizedContent list;
    QStringList operations;
    bool valid = true;

    void check(bool condition) { valid = valid && condition; }

    void insertRange(int index, int count, const QVector<Content> &source, int sourceIndex) override
    {
        check(count > 0 && index >= 0 && index <= list.size() && sourceIndex >= 0 && sourceIndex + count <= source.size());
        operations << QStringLiteral("insert %1 %2 from %3").arg(index).arg(count).arg(sourceIndex);
        if (valid)
            list.insertRange(index, count, source, sourceIndex);
    }
    void removeRange(int index, int count) override
    {
        check(count > 0 && index >= 0 && index + count <= list.size());
        operations << QStringLiteral("remove %1 %2").arg(index).arg(count);
        if (valid)
            list.removeRange(index, count);
    }
    void updateRange(int index, int count, const QVector<Content> &source, int sourceIndex) override
    {
        check(count > 0 && index >= 0 && index + count <= list.size() && sourceIndex + count <= source.size());
        for (int i = 0; valid && i < count; ++i)
            check(list.at(index + i) == source.at(sourceIndex + i));
        operations << QStringLiteral("update %1 %2 from %3").arg(index).arg(count).arg(sourceIndex);
        if (valid)
            list.updateRange(index, count, source, sourceIndex);
    }

    // Delivers `source` in batches of the given sizes, the rest in the last one,
    // and closes like the end of a query.
    void mergeInBatches(const QVector<Content> &source, const QList<int> &batches)
    {
        QVector<Content> received;
        for (int size : batches) {
            received += source.mid(received.size(), size);
            list.merge(received, this);
        }
        list.finish(received + source.mid(received.size()), this);
    }
};

}

class tst_SynchronizedContent : public QObject
{
    Q_OBJECT

private slots:
    void merge_data()
    {
        QTest::addColumn<QString>("before");
        QTest::addColumn<QString>("after");
        QTest::addColumn<QList<int>>("batches");
        QTest::addColumn<QStringList>("operations");

        QTest::newRow("swap of two neighbours") << "f1 f2 f3 f4" << "f1 f3 f2 f4" << QList<int> { 4 }
                << QStringList { "update 0 1 from 0", "insert 1 1 from 1", "update 2 1 from 2", "remove 3 1", "update 3 1 from 3" };
        QTest::newRow("empty list: one insertion a batch") << "" << "f1 f2 f3" << QList<int> { 2, 1 }
                << QStringList { "insert 0 2 from 0", "insert 2 1 from 2" };
        QTest::newRow("all gone at the end") << "f1 f2 f3" << "" << QList<int> {}
                << QStringList { "remove 0 3" };
        // A batch border inside a stretch: one refresh a pass, from the stretch's start.
        QTest::newRow("same rows, two batches") << "f1 f2 f3 f4" << "f1 f2 f3 f4" << QList<int> { 2, 2 }
                << QStringList { "update 0 2 from 0", "update 2 2 from 2" };
        // Same id, other type: a different row.
        QTest::newRow("type tells rows apart") << "f1 f2" << "t1 f2" << QList<int> { 2 }
                << QStringList { "remove 0 1", "insert 0 1 from 0", "update 1 1 from 1" };
        QTest::newRow("reversal") << "f1 f2 f3" << "f3 f2 f1" << QList<int> { 3 }
                << QStringList { "remove 0 1", "insert 0 1 from 0", "update 1 1 from 1", "remove 2 1", "insert 2 1 from 2" };
        // Nothing in common within the first batch: nothing moves until the end.
        QTest::newRow("no anchor") << "f1 f2" << "f3 f4" << QList<int> { 2 }
                << QStringList { "remove 0 2", "insert 0 2 from 0" };
        QTest::newRow("row appended behind the old end") << "f1 f2" << "f1 f2 f3" << QList<int> { 1, 1, 1 }
                << QStringList { "update 0 1 from 0", "update 1 1 from 1", "insert 2 1 from 2" };
    }

    void merge()
    {
        QFETCH(QString, before);
        QFETCH(QString, after);
        QFETCH(QList<int>, batches);
        QFETCH(QStringList, operations);
        RecordingAgent agent;
        agent.list = rows(before);
        agent.mergeInBatches(rows(after), batches);
        QVERIFY(agent.valid);
        QCOMPARE(agent.operations, operations);
        QCOMPARE(names(agent.list), after);
        QCOMPARE(agent.list.index(), 0);
        QCOMPARE(agent.list.sourceIndex(), 0);
    }

    void cursorsWaitForAnchor()
    {
        RecordingAgent agent;
        agent.list = rows("f1 f2");
        const QVector<Content> source = rows("f3 f4");
        agent.list.merge(source, &agent);
        QVERIFY(agent.operations.isEmpty());
        QCOMPARE(agent.list.index(), 0);
        QCOMPARE(agent.list.sourceIndex(), 0);

        // The next batch brings the anchor: the old row survives, the new ones come before it.
        agent.list.merge(source + rows("f1"), &agent);
        QCOMPARE(agent.operations, QStringList({ "insert 0 2 from 0", "update 2 1 from 2" }));
        QCOMPARE(agent.list.index(), 3);
        QCOMPARE(agent.list.sourceIndex(), 3);
        QCOMPARE(names(agent.list), "f3 f4 f1 f2");
    }

    // Random pairs of lists, delivered in random batches: the edits must turn the
    // old list into the new one exactly, holding the new handles.
    void randomLists()
    {
        for (int seed = 1; seed <= 2000; ++seed) {
            QRandomGenerator random(seed);
            const auto randomList = [&random](int maxSize, int ids) {
                QVector<Content> list;
                const int size = random.bounded(maxSize + 1);
                for (int i = 0; i < size; ++i)
                    list.append(make(random.bounded(ids), random.bounded(2)));
                return list;
            };
            const int ids = 1 + random.bounded(40);
            QVector<Content> before = randomList(30, ids);
            QVector<Content> after;
            switch (seed % 4) {
            case 0: after = randomList(30, ids); break;
            case 1: after = before; std::reverse(after.begin(), after.end()); break;
            case 2: // long distances: a block moved from the front to the back
                after = before.mid(before.size() / 2) + before.mid(0, before.size() / 2);
                break;
            default: // a few edits of an otherwise equal list
                after = before;
                for (int i = random.bounded(5); i > 0; --i) {
                    if (!after.isEmpty() && random.bounded(2))
                        after.remove(random.bounded(after.size()));
                    else
                        after.insert(random.bounded(after.size() + 1), make(random.bounded(ids), 0));
                }
                break;
            }
            // Fresh handles, so that a row left without its refresh is seen.
            for (Content &content : after)
                content = Content(content.data()->clone());

            QList<int> batches;
            for (int delivered = 0; delivered < after.size();) {
                batches << 1 + random.bounded(8);
                delivered += batches.last();
            }
            RecordingAgent agent;
            agent.list = before;
            agent.mergeInBatches(after, batches);
            QVERIFY2(agent.valid, qPrintable(QStringLiteral("seed %1: %2").arg(seed).arg(agent.operations.join(", "))));
            QCOMPARE(names(agent.list), names(after));
            for (int i = 0; i < after.size(); ++i)
                QVERIFY2(agent.list.at(i).data() == after.at(i).data(), qPrintable(QStringLiteral("seed %1 row %2").arg(seed).arg(i)));
        }
    }
};

QTEST_GUILESS_MAIN(tst_SynchronizedContent)
#include "tst_synchronizedcontent.moc"
