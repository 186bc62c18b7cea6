// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexfixture.h"

#include "downloadmanager.h"

using namespace Fixture;

class TestDownloadManager : public QObject
{
    Q_OBJECT

private slots:
    void saveAndRemove()
    {
        TestDatabase sql(serviceIndex());
        sql.exec({ "DELETE FROM download;", "INSERT INTO download VALUES (1, 'http://old.example/a.jpg');" });
        const auto source = [&sql] { return sql.rows("SELECT source FROM download;"); };
        QVERIFY(dynamic_cast<DownloadManager *>(ContentManager::managerFromType(4)));
        for (int type : { 3, 5, 8, -1 })
            QVERIFY2(!ContentManager::managerFromType(type), qPrintable(QString::number(type)));
        DownloadManager manager(DbManager::instance());
        QVERIFY(manager.save(1, { { "Source", QUrl("http://new.example/b.jpg") } })); // only "source" counts
        // remove(int) hides the virtual remove(qint64) instead of overriding it.
        QVERIFY(!static_cast<ContentManager &>(manager).remove(qint64(1)));
        QCOMPARE(source(), QStringList { "http://old.example/a.jpg" });
        QVERIFY(manager.save(1, { { "source", QUrl("http://new.example/b.jpg") } }));
        QCOMPARE(source(), QStringList { "http://new.example/b.jpg" });
        QVERIFY(manager.save(1, { { "source", 42 } })); // not a URL: an empty one
        QCOMPARE(source(), QStringList { "" });
        QVERIFY(manager.remove(1));
        QCOMPARE(source(), QStringList());
    }
};

QTEST_GUILESS_MAIN(TestDownloadManager)
#include "tst_downloadmanager.moc"
