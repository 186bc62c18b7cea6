#include "changenotifier.h"
#include "wallpaperpalette.h"
#include "waltrimmer.h"

#include <QElapsedTimer>
#include <QPainter>
#include <QSqlQuery>
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

        QTest::newRow("one notice") << QList<int> { 1 } << 1 << 0;
        QTest::newRow("two apart") << QList<int> { 0 } << 2 << 250;
        QTest::newRow("burst") << QList<int> { 0 } << 400 << 1;
        QTest::newRow("two types interleaved") << QList<int> { 0, 2 } << 200 << 2;
    }

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
            // The first notice of a quiet type goes out at once.
            if (noticed[type].size() == 1)
                QCOMPARE(sent[type].size(), 1);
            QTest::qWait(spacing);
        }
        QTest::qWait(350);

        for (int type : types) {
            const QList<qint64> &times = sent[type];
            QVERIFY(!times.isEmpty());
            for (int i = 1; i < times.size(); ++i)
                QVERIFY2(times.at(i) - times.at(i - 1) >= 95, qPrintable(QStringLiteral("signals %1 ms apart").arg(times.at(i) - times.at(i - 1))));
            // Nothing is lost: the last notice is followed by a signal.
            QVERIFY(times.last() >= noticed[type].last());
            QVERIFY(times.size() <= noticed[type].size());
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
        QVERIFY2(sent.at(2) - sent.at(1) >= 95, qPrintable(QStringLiteral("signals %1 ms apart").arg(sent.at(2) - sent.at(1))));
    }

    void palette_data()
    {
        QTest::addColumn<QColor>("background");
        QTest::addColumn<QColor>("patch");
        QTest::addColumn<QSize>("size");
        QTest::addColumn<QStringList>("colors");

        QTest::newRow("red") << QColor(Qt::red) << QColor() << QSize(40, 30)
                             << QStringList { "#ffff4433", "#ff99291f", "#ffffffff", "#a0ffffff" };
        QTest::newRow("big dark blue") << QColor(10, 20, 120) << QColor() << QSize(3000, 2000)
                                       << QStringList { "#ff3344ff", "#ff1f2999", "#ffffffff", "#a0ffffff" };
        QTest::newRow("green beats a smaller red") << QColor(0, 160, 0) << QColor(Qt::red) << QSize(64, 64)
                                                   << QStringList { "#ff33ff44", "#ff1f9929", "#ffffffff", "#a0ffffff" };
        QTest::newRow("grey has no hue") << QColor(200, 200, 200) << QColor(Qt::black) << QSize(64, 64)
                                         << QStringList { "#ffe6e6e6", "#ff969696", "#ff000000", "#a0000000" };
    }

    void palette()
    {
        QFETCH(QColor, background);
        QFETCH(QColor, patch);
        QFETCH(QSize, size);
        QFETCH(QStringList, colors);

        QImage image(size, QImage::Format_RGB32);
        image.fill(background);
        if (patch.isValid())
            QPainter(&image).fillRect(0, 0, size.width() / 4, size.height() / 4, patch);
        const QString path = qEnvironmentVariable("THEMELET_SANDBOX") + "/" + QTest::currentDataTag() + ".png";
        QVERIFY(image.save(path));

        const QImage thumbnail = WallpaperPalette::readThumbnail(path);
        QVERIFY(!thumbnail.isNull() && thumbnail.width() <= 64 && thumbnail.height() <= 64);
        const WallpaperPalette palette(thumbnail);
        QVERIFY(palette.isValid());
        const QStringList derived { palette.highlightColor().name(QColor::HexArgb),
                                    palette.secondaryHighlightColor().name(QColor::HexArgb),
                                    palette.primaryColor().name(QColor::HexArgb),
                                    palette.secondaryColor().name(QColor::HexArgb) };
        QCOMPARE(derived, colors);
        QVERIFY(!WallpaperPalette(QImage()).isValid());
    }

    // The log goes only once no reader is left on an old snapshot, and a try
    // never waits for one.
    void walTrimming()
    {
        const QString path = qEnvironmentVariable("THEMELET_SANDBOX") + "/trim.sqlite";
        QSqlDatabase writer = QSqlDatabase::addDatabase("QSQLITE", "writer");
        writer.setConnectOptions("QSQLITE_OPEN_URI");
        writer.setDatabaseName(QUrl::fromLocalFile(path).toString());
        QSqlDatabase reader = QSqlDatabase::addDatabase("QSQLITE", "reader");
        reader.setDatabaseName(path);
        QVERIFY(writer.open() && reader.open());
        QSqlQuery write(writer), read(reader);
        QVERIFY(write.exec("PRAGMA journal_mode = WAL;") && write.exec("CREATE TABLE t (x BLOB);")
                && write.exec("INSERT INTO t VALUES (1), (2);"));
        read.setForwardOnly(true);
        QVERIFY(read.exec("SELECT x FROM t;") && read.next());
        for (int i = 0; i < 8; ++i)
            QVERIFY(write.exec("INSERT INTO t VALUES (randomblob(262144));"));

        const qint64 limit = 1024 * 1024;
        WalTrimmer trimmer(writer, limit, 60000);
        QElapsedTimer clock;
        clock.start();
        QVERIFY(!trimmer.trim());
        QVERIFY(clock.elapsed() < 1000);
        QVERIFY(QFileInfo(path + "-wal").size() > limit);
        read.finish();
        QVERIFY(trimmer.trim());
        QCOMPARE(QFileInfo(path + "-wal").size(), 0);
        QVERIFY(write.exec("PRAGMA busy_timeout;") && write.next());
        QCOMPARE(write.value(0).toInt(), 5000);
    }
};

QTEST_GUILESS_MAIN(tst_ServiceParts)
#include "tst_serviceparts.moc"
