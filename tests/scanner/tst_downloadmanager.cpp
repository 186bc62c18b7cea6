#include "managertestcase.h"

#include "contentmanager.h"
#include "downloadmanager.h"

#include <QUrl>

class TestDownloadManager : public QObject, private ManagerTestCase
{
    Q_OBJECT

private slots:
    void init();
    void cleanup() { closeIndex(); }
    void save_data();
    void save();
    void removeTakesAnInt();
    void failedSave();

private:
    QStringList downloads() { return m_sql->rows("SELECT fileId, source FROM download ORDER BY fileId;"); }
};

void TestDownloadManager::init()
{
    openFreshIndex();
    m_sql->exec(QStringLiteral("INSERT INTO download VALUES (1, 'http://old.example/a.jpg');"));
}

void TestDownloadManager::save_data()
{
    QTest::addColumn<QVariantMap>("properties");
    QTest::addColumn<QString>("expected");

    QTest::newRow("nothing to save") << QVariantMap { { "Source", "http://new.example/b.jpg" } }
                                     << "1|http://old.example/a.jpg";
    QTest::newRow("second save replaces") << QVariantMap { { "source", QUrl("http://new.example/b.jpg") } }
                                          << "1|http://new.example/b.jpg";
    QTest::newRow("text converts") << QVariantMap { { "source", "http://new.example/c.jpg" } }
                                   << "1|http://new.example/c.jpg";
    QTest::newRow("not a url") << QVariantMap { { "source", 42 } } << "1|";
}

void TestDownloadManager::save()
{
    QFETCH(QVariantMap, properties);
    QFETCH(QString, expected);

    DownloadManager manager(*m_db);
    QVERIFY(manager.save(1, properties));
    QCOMPARE(downloads(), QStringList { expected });
}

// remove(int) hides the virtual remove(qint64) instead of overriding it.
void TestDownloadManager::removeTakesAnInt()
{
    ContentManager *base = ContentManager::managerFromType(4);
    QVERIFY(dynamic_cast<DownloadManager *>(base));
    DownloadManager manager(*m_db);
    base = &manager;
    QVERIFY(!base->remove(qint64(1)));
    QCOMPARE(downloads().size(), 1);

    QVERIFY(manager.remove(1));
    QVERIFY(downloads().isEmpty());
    QVERIFY(manager.remove(1));
}

// A failed statement changes nothing and doesn't get in the way of the next call.
void TestDownloadManager::failedSave()
{
    DownloadManager manager(*m_db);
    const QVariantMap properties { { "source", QUrl("http://new.example/b.jpg") } };
    m_sql->exec(QStringLiteral("CREATE TRIGGER refuse BEFORE INSERT ON download BEGIN SELECT RAISE(ABORT, 'no'); END;"));
    expectQueryWarning("bool DownloadManager::create(qint64, QUrl)", "Failed to execute m_insertDownload.",
                       "INSERT OR REPLACE INTO download ( fileId, source) VALUES (?, ?);");
    QVERIFY(!manager.save(1, properties));
    QCOMPARE(downloads(), QStringList { "1|http://old.example/a.jpg" });

    m_sql->exec(QStringLiteral("DROP TRIGGER refuse;"));
    QVERIFY(manager.save(1, properties));
    QCOMPARE(downloads(), QStringList { "1|http://new.example/b.jpg" });
}

QTEST_GUILESS_MAIN(TestDownloadManager)

#include "tst_downloadmanager.moc"
