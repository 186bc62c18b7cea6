#include "changenotifier.h"
#include "wallpaperpalette.h"

#include <QElapsedTimer>
#include <QPainter>
#include <QtTest>

class tst_ServiceParts : public QObject
{
    Q_OBJECT

private slots:
    void coalescing_data()
    {
        QTest::addColumn<QList<int>>("types");
        QTest::addColumn<int>("notices");
        QTest::addColumn<int>("spacing");
        QTest::newRow("two apart") << QList<int> { 0 } << 2 << 250;
        QTest::newRow("burst") << QList<int> { 0 } << 400 << 1;
        QTest::newRow("two types interleaved") << QList<int> { 0, 2 } << 200 << 2;
    }

    // The first notice of a quiet type goes out at once, then at most one signal per 100 ms, and the last notice is never lost.
    void coalescing()
    {
        QFETCH(QList<int>, types);
        QFETCH(int, notices);
        QFETCH(int, spacing);
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

    // A loop that turns late must not bring the next signal closer than the interval.
    void coalescingLateLoop()
    {
        ChangeNotifier notifier;
        QElapsedTimer clock;
        QList<qint64> sent;
        connect(&notifier, &ChangeNotifier::contentChanged, [&](int) { sent.append(clock.elapsed()); });
        clock.start();
        notifier.notify(0);
        notifier.notify(0);
        QThread::msleep(140);
        QTRY_COMPARE(sent.size(), 2);
        notifier.notify(0);
        QTRY_COMPARE_WITH_TIMEOUT(sent.size(), 3, 1000);
        QVERIFY2(sent.at(2) - sent.at(1) >= 95, qPrintable(QStringLiteral("%1 ms apart").arg(sent.at(2) - sent.at(1))));
    }

    // The service test covers a plain blue picture read from a file.
    void palette_data()
    {
        QTest::addColumn<QColor>("background");
        QTest::addColumn<QColor>("patch");
        QTest::addColumn<QStringList>("colors");
        QTest::newRow("green beats a smaller red") << QColor(0, 160, 0) << QColor(Qt::red)
                                                   << QStringList { "#ff33ff44", "#ff1f9929", "#ffffffff", "#a0ffffff" };
        QTest::newRow("grey has no hue") << QColor(200, 200, 200) << QColor(Qt::black)
                                         << QStringList { "#ffe6e6e6", "#ff969696", "#ff000000", "#a0000000" };
    }

    void palette()
    {
        QFETCH(QColor, background);
        QFETCH(QColor, patch);
        QFETCH(QStringList, colors);
        QImage image(64, 64, QImage::Format_RGB32);
        image.fill(background);
        QPainter(&image).fillRect(0, 0, 16, 16, patch);
        const WallpaperPalette palette(image);
        QVERIFY(palette.isValid() && !WallpaperPalette(QImage()).isValid());
        QCOMPARE(QStringList({ palette.highlightColor().name(QColor::HexArgb), palette.secondaryHighlightColor().name(QColor::HexArgb),
                               palette.primaryColor().name(QColor::HexArgb), palette.secondaryColor().name(QColor::HexArgb) }), colors);
    }
};

QTEST_GUILESS_MAIN(tst_ServiceParts)
#include "tst_serviceparts.moc"
