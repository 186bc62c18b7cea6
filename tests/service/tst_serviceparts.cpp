// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "changenotifier.h"
#include "waltrimmer.h"

#include <QElapsedTimer>
#include <QSqlQuery>
#include <QtTest>

// Coalescing of contentChanged and trimming of the log; the service test covers the palette and single notices end to end.
class tst_ServiceParts : public QObject
{
    Q_OBJECT

private slots:
    // The first notice of a quiet type goes out at once, then at most one signal per 100 ms; the last notice is never lost.
    // Two types interleave in a burst; the loop is blocked once, and turning late must not bring the next signal closer.
    void coalescing()
    {
        ChangeNotifier notifier;
        QElapsedTimer clock;
        QHash<int, QList<qint64>> sent, noticed;
        connect(&notifier, &ChangeNotifier::contentChanged, [&](int type) { sent[type].append(clock.elapsed()); });
        clock.start();
        for (int i = 0; i < 200; ++i) {
            const int type = i % 2 ? 2 : 0;
            noticed[type].append(clock.elapsed());
            notifier.notify(type);
            QVERIFY(noticed[type].size() > 1 || sent[type].size() == 1);
            QThread::msleep(i == 2 ? 140 : 0);
            QTest::qWait(2);
        }
        QTest::qWait(350);
        for (int type : { 0, 2 }) {
            const QList<qint64> &times = sent[type];
            for (int i = 1; i < times.size(); ++i)
                QVERIFY2(times.at(i) - times.at(i - 1) >= 95, qPrintable(QStringLiteral("%1 ms apart").arg(times.at(i) - times.at(i - 1))));
            QVERIFY(!times.isEmpty() && times.last() >= noticed[type].last());
            QVERIFY(times.size() <= (noticed[type].last() - noticed[type].first()) / 95 + 2);
        }
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
