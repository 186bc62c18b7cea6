#include "managertestcase.h"

#include "downloadmanager.h"

#include <QUrl>

class TestDownloadManager : public QObject, private ManagerTestCase
{
    Q_OBJECT

private slots:
    void init() { openFreshIndex(), m_sql->exec("INSERT INTO download VALUES (1, 'http://old.example/a.jpg');"); }
    void save_data();
    void save();
    void removeTakesAnInt();
};

void TestDownloadManager::save_data()
{
    QTest::addColumn<QVariantMap>("properties");
    QTest::addColumn<QString>("source"); // after the save; "failed" when its statement fails

    const QVariant url = QUrl("http://new.example/b.jpg");
    QTest::newRow("nothing to save") << QVariantMap { { "Source", url } } << "http://old.example/a.jpg";
    QTest::newRow("second save replaces") << QVariantMap { { "source", url } } << "http://new.example/b.jpg";
    QTest::newRow("not a url") << QVariantMap { { "source", 42 } } << "";
    QTest::newRow("failed statement") << QVariantMap { { "source", url } } << "failed";
}

void TestDownloadManager::save()
{
    QFETCH(QVariantMap, properties);
    QFETCH(QString, source);

    const bool fails = source == "failed";
    if (fails)
        m_sql->exec("CREATE TRIGGER refuse BEFORE INSERT ON download BEGIN SELECT RAISE(ABORT, 'no'); END;");
    DownloadManager manager(*m_db);
    MessageLog log(false);
    QCOMPARE(manager.save(1, properties), !fails);
    compareWarnings(log, fails ? failure("bool DownloadManager::create(qint64, QUrl)", "Failed to execute m_insertDownload.",
                                         "INSERT OR REPLACE INTO download ( fileId, source) VALUES (?, ?);") : QStringList());
    QCOMPARE(m_sql->value("SELECT source FROM download WHERE fileId = 1;").toString(), fails ? "http://old.example/a.jpg" : source);
}

// remove(int) hides the virtual remove(qint64) instead of overriding it.
void TestDownloadManager::removeTakesAnInt()
{
    QVERIFY(dynamic_cast<DownloadManager *>(ContentManager::managerFromType(4)));
    DownloadManager manager(*m_db);
    QVERIFY(!static_cast<ContentManager &>(manager).remove(qint64(1)));
    QCOMPARE(m_sql->value("SELECT COUNT(*) FROM download;").toInt(), 1);
    QVERIFY(manager.remove(1));
    QCOMPARE(m_sql->value("SELECT COUNT(*) FROM download;").toInt(), 0);
}

QTEST_GUILESS_MAIN(TestDownloadManager)
#include "tst_downloadmanager.moc"
