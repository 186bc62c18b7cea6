#include "changenotifier.h"

#include <QElapsedTimer>
#include <QtTest>

// Coalescing of contentChanged; the service test covers the palette and single notices end to end.
class tst_ServiceParts : public QObject
{
    Q_OBJECT

private slots:
    void coalescing_data()
    {
        QTest::addColumn<QList<int>>("types");
        QTest::addColumn<int>("notices");
        QTest::addColumn<int>("spacing");
        QTest::addColumn<int>("stall"); // ms the loop is blocked after the second notice
        QTest::newRow("two apart") << QList<int> { 0 } << 2 << 250 << 0;
        QTest::newRow("burst") << QList<int> { 0 } << 400 << 1 << 0;
        QTest::newRow("two types interleaved") << QList<int> { 0, 2 } << 200 << 2 << 0;
        // A loop that turns late must not bring the next signal closer than the interval.
        QTest::newRow("late loop") << QList<int> { 0 } << 3 << 5 << 140;
    }

    // The first notice of a quiet type goes out at once, then at most one signal per 100 ms; the last notice is never lost.
    void coalescing()
    {
        QFETCH(QList<int>, types);
        QFETCH(int, notices);
        QFETCH(int, spacing);
        QFETCH(int, stall);
        ChangeNotifier notifier;
        QElapsedTimer clock;
        QHash<int, QList<qint64>> sent, noticed;
        connect(&notifier, &ChangeNotifier::contentChanged, [&](int type) { sent[type].append(clock.elapsed()); });
        clock.start();
        for (int i = 0; i < notices; ++i) {
            const int type = types.at(i % types.size());
            noticed[type].append(clock.elapsed());
            notifier.notify(type);
            QVERIFY(noticed[type].size() > 1 || sent[type].size() == 1);
            QThread::msleep(i == 1 ? stall : 0);
            QTest::qWait(spacing);
        }
        QTest::qWait(350);
        for (int type : types) {
            const QList<qint64> &times = sent[type];
            for (int i = 1; i < times.size(); ++i)
                QVERIFY2(times.at(i) - times.at(i - 1) >= 95, qPrintable(QStringLiteral("%1 ms apart").arg(times.at(i) - times.at(i - 1))));
            QVERIFY(!times.isEmpty() && times.last() >= noticed[type].last());
            QVERIFY(times.size() <= (noticed[type].last() - noticed[type].first()) / 95 + 2);
        }
    }
};

QTEST_GUILESS_MAIN(tst_ServiceParts)
#include "tst_serviceparts.moc"
