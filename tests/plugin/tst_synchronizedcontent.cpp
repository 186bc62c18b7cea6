// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "recordinglist.h"

#include <QRandomGenerator>
#include <QtTest>

namespace {

Content make(qint64 id, int type)
{
    return type == ThemeletContent::Themelet ? Content(new ThemeletData(id, QUrl())) : Content(new FileData(id, QUrl()));
}

// Rows named by type letter and id: "f3" is a file, "t3" a themelet.
QVector<Content> rows(const QString &names)
{
    QVector<Content> result;
    for (const QString &name : names.split(' ', Qt::SkipEmptyParts))
        result << make(name.mid(1).toLongLong(), name.startsWith('t') ? ThemeletContent::Themelet : ThemeletContent::File);
    return result;
}

QString names(const QVector<Content> &list)
{
    QStringList result;
    for (const Content &content : list)
        result << (content.type() == ThemeletContent::Themelet ? "t" : "f") + QString::number(content.data()->id);
    return result.join(' ');
}

struct RecordingAgent : RecordingList
{
    // Keyed: the list keeps the keys of its earlier query, as a model's does, and the
    // batches bring theirs, so that the walk compares keys.
    bool keyed = false;

    QVector<SynchronizedContent::Key> keysOf(const QVector<Content> &rows) const
    {
        QVector<SynchronizedContent::Key> keys;
        for (int i = 0; keyed && i < rows.size(); ++i)
            keys << SynchronizedContent::key(rows.at(i));
        return keys;
    }

    // `before` as an earlier query left it; then `source` in growing batches of these
    // sizes, the rest at the end of the query.
    void mergeInBatches(const QVector<Content> &before, const QVector<Content> &source, const QList<int> &batches)
    {
        QVector<SynchronizedContent::Key> keys = keysOf(before);
        list.finish(before, this, &keys);
        operations.clear();
        QVector<Content> received;
        for (int size : batches) {
            received += source.mid(received.size(), size);
            list.merge(received, this, keysOf(received));
        }
        keys = keysOf(source);
        list.finish(received + source.mid(received.size()), this, &keys);
    }
};

}

class tst_SynchronizedContent : public QObject
{
    Q_OBJECT

private slots:
    // First fills, emptying and refreshes across batches: tst_contentmodel checks them by the row signals.
    void merge_data()
    {
        QTest::addColumn<QString>("before");
        QTest::addColumn<QString>("after");
        QTest::addColumn<QList<int>>("batches");
        QTest::addColumn<QStringList>("operations");

        QTest::newRow("swap of two neighbours") << "f1 f2 f3 f4" << "f1 f3 f2 f4" << QList<int> { 4 }
                << QStringList { "update 0 1 from 0", "insert 1 1 from 1", "update 2 1 from 2", "remove 3 1", "update 3 1 from 3" };
        QTest::newRow("one row replaced") << "f1 f2 f3" << "f1 f4 f3" << QList<int> { 3 }
                << QStringList { "update 0 1 from 0", "remove 1 1", "insert 1 1 from 1", "update 2 1 from 2" };
        // The first batch has no anchor: nothing moves until the next one brings it.
        QTest::newRow("anchor in a later batch") << "f1 f2" << "f3 f4 f1" << QList<int> { 2, 1 }
                << QStringList { "insert 0 2 from 0", "update 2 1 from 2", "remove 3 1" };
    }

    void merge()
    {
        QFETCH(QString, before);
        QFETCH(QString, after);
        QFETCH(QList<int>, batches);
        QFETCH(QStringList, operations);
        for (const bool keyed : { false, true }) {
            RecordingAgent agent;
            agent.keyed = keyed;
            agent.mergeInBatches(rows(before), rows(after), batches);
            QVERIFY(agent.valid);
            QCOMPARE(agent.operations, operations);
            QCOMPARE(names(agent.list), after);
        }
    }

    // Random pairs of lists (same ids across types, ids too large for a key, reversals,
    // long distances, small edits) in random batches, with and without keys: the edits
    // must give exactly the new list and its handles.
    void randomLists()
    {
        for (int seed = 1; seed <= 2000; ++seed) {
            QRandomGenerator random(seed);
            const int ids = 1 + random.bounded(40);
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
            if (seed % 4 == 2) // long distances: the back half moves to the front
                std::rotate(after.begin(), after.begin() + after.size() / 2, after.end());
            for (int i = seed % 4 == 3 ? random.bounded(5) : 0; i > 0; --i) {
                if (!after.isEmpty() && random.bounded(2))
                    after.remove(random.bounded(after.size()));
                else
                    after.insert(random.bounded(after.size() + 1), make(random.bounded(ids), 0));
            }
            for (Content &content : after) // fresh handles: a row left unrefreshed shows
                content = Content(content.data()->clone());

            QList<int> batches;
            for (int delivered = 0; delivered < after.size(); delivered += batches.last())
                batches << 1 + random.bounded(8);
            RecordingAgent agent;
            agent.keyed = seed % 2;
            agent.mergeInBatches(before, after, batches);
            QVERIFY2(agent.valid, qPrintable(QStringLiteral("seed %1: %2").arg(seed).arg(agent.operations.join(", "))));
            QCOMPARE(names(agent.list), names(after));
            for (int i = 0; i < after.size(); ++i)
                QVERIFY2(agent.list.at(i).data() == after.at(i).data(), qPrintable(QStringLiteral("seed %1 row %2").arg(seed).arg(i)));
        }
    }
};

QTEST_GUILESS_MAIN(tst_SynchronizedContent)
#include "tst_synchronizedcontent.moc"
