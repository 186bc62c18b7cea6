#include "filemanager.h"
#include "packagefixture.h"
#include "signalrecorder.h"
#include "sysroot.h"
#include "testdatabase.h"

#include <QLocale>
#include <QRegularExpression>
#include <QtTest>

#include <memory>
#include <sys/stat.h>

using namespace PackageFixture;

// Tone packs under the sounds install directory, each with `tones.index`
// describing its `tones/` directory, read by the install loop alone.
class tst_IndexManager : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void cleanup() { QLocale::setDefault(QLocale::c()); }
    void merge_data();
    void merge();
    void unread_data();
    void unread();
    void changeNotices();

private:
    static QString pack() { return uniquePath(InstallManager::installPaths().at(1)); }
    static QString tones() { return pack() + QStringLiteral("/tones"); }
    static QString index() { return tones() + QStringLiteral(".index"); }
    static bool runWith(const QByteArray &content)
    {
        if (!write(index(), content))
            return false;
        installer()->appendDirectory(InstallManager::installPaths().at(1));
        return waitIdle();
    }
    QStringList rows()
    {
        return m_db->rows(QStringLiteral("SELECT fileName, displayName, category FROM file WHERE directoryId = "
                                         "(SELECT id FROM directory WHERE path = '%1') ORDER BY fileName").arg(tones()));
    }
    QVariant value(const QString &column, const QString &where)
    {
        return m_db->value(QStringLiteral("SELECT %1 FROM file JOIN directory ON directory.id = file.directoryId WHERE %2")
                                   .arg(column, where));
    }
    QVariant fileId(const QString &name)
    {
        return value(QStringLiteral("file.id"), QStringLiteral("path = '%1' AND fileName = '%2'").arg(tones(), name));
    }
    int indexCurrent()
    {
        return value(QStringLiteral("metadataCurrent"), QStringLiteral("path = '%1' AND fileName = 'tones.index'").arg(pack())).toInt();
    }

    std::unique_ptr<TestDatabase> m_db;
};

void tst_IndexManager::initTestCase()
{
    const QString translations = Sysroot::path(QStringLiteral("/usr/share/translations/"));
    QVERIFY(QDir().mkpath(translations));
    for (const QString &catalog : { "tones.qm", "tones-fi.qm", "tones_eng_en.qm" })
        QVERIFY(QFile::copy(QStringLiteral(CATALOG_DIR "/") + catalog, translations + catalog));
    QVERIFY(QDir().mkpath(InstallManager::installPaths().at(1)));
    QVERIFY(installer());
    m_db = std::make_unique<TestDatabase>();
}

void tst_IndexManager::merge_data()
{
    QTest::addColumn<QString>("locale");
    QTest::addColumn<QByteArray>("first");
    QTest::addColumn<QByteArray>("second");
    QTest::addColumn<int>("runs");
    QTest::addColumn<int>("duplicates");
    QTest::addColumn<QString>("renamed");
    QTest::addColumn<QStringList>("expected");

    const QByteArray ab = R"({"files": [{"fileName": "a.ogg", "displayName": "A", "category": "x"},
                                        {"fileName": "b.ogg", "displayName": "B", "category": "x"}]})";
    const QByteArray a = R"({"files": [{"fileName": "a.ogg", "displayName": "A", "category": "x"}]})";
    const QByteArray c = R"({"files": [{"fileName": "c.ogg", "displayName": "C", "category": "x"}]})";
    // Catalogues: tone-a is in every one, tone-b only in the engineering one,
    // tone-c in none, and tone-e has an empty translation for the locales.
    const QByteArray translated = R"({"translationCatalog": "tones", "files": [{"fileName": "a.ogg", "displayName": "tone-a"},
        {"fileName": "b.ogg", "displayName": "tone-b"}, {"fileName": "c.ogg", "displayName": "tone-c"},
        {"fileName": "e.ogg", "displayName": "tone-e"}]})";
    QTest::newRow("plain catalogue in C") << "C" << translated << QByteArray() << 0 << 0 << ""
            << QStringList { "a.ogg|Plain A|NULL", "b.ogg|Engineering B|NULL", "c.ogg|tone-c|NULL", "e.ogg|Engineering E|NULL" };
    QTest::newRow("finnish catalogue") << "fi_FI" << translated << QByteArray() << 0 << 0 << ""
            << QStringList { "a.ogg|Suomi A|NULL", "b.ogg|Engineering B|NULL", "c.ogg|tone-c|NULL", "e.ogg|Engineering E|NULL" };
    QTest::newRow("unknown catalogue") << "C" << QByteArray(translated).replace("\"tones\"", "\"absent\"") << QByteArray() << 0 << 0
            << "" << QStringList { "a.ogg|tone-a|NULL", "b.ogg|tone-b|NULL", "c.ogg|tone-c|NULL", "e.ogg|tone-e|NULL" };
    QTest::newRow("skipped elements") << "C" << QByteArray(R"({"files": [{"fileName": "b.ogg", "displayName": "B", "category": "x", "more": 1},
        7, "a.ogg", {}, {"fileName": ""}, {"fileName": "tones/a.ogg"}, {"fileName": "missing.ogg", "displayName": "M"},
        {"fileName": "a.ogg", "displayName": 5, "category": ["x"]}]})") << QByteArray() << 0 << 0 << ""
                                      << QStringList { "a.ogg|NULL|NULL", "b.ogg|B|x" };
    QTest::newRow("duplicates") << "C" << QByteArray(R"({"files": [{"fileName": "c.ogg"}, {"fileName": "c.ogg"}, {"fileName": "a.ogg"},
        {"fileName": "c.ogg"}]})") << QByteArray() << 0 << 2 << "" << QStringList { "a.ogg|NULL|NULL", "c.ogg|NULL|NULL" };
    QTest::newRow("alias keeps the row") << "C" << ab << QByteArray(R"({"files": [{"fileName": "a.ogg", "displayName": "A", "category": "x"},
        {"fileName": "c.ogg", "displayName": "B", "category": "x", "aliases": ["", 3, "b.ogg", "gone.ogg"]}]})")
                                         << 1 << 0 << "b.ogg>c.ogg" << QStringList { "a.ogg|A|x", "c.ogg|B|x" };
    QTest::newRow("changed values") << "C" << ab << QByteArray(R"({"files": [{"fileName": "a.ogg", "displayName": "A2", "category": "y"},
        {"fileName": "b.ogg", "displayName": "B", "category": "x"}]})") << 1 << 0 << "a.ogg>a.ogg"
                                    << QStringList { "a.ogg|A2|y", "b.ogg|B|x" };
    QTest::newRow("empty files") << "C" << ab << QByteArray(R"({"files": []})") << 1 << 0 << "" << QStringList();
    QTest::newRow("no files") << "C" << ab << QByteArray("{}") << 1 << 0 << "" << QStringList();
    QTest::newRow("row not named") << "C" << ab << QByteArray(R"({"files": [{"fileName": "b.ogg", "displayName": "B", "category": "x"}]})")
                                   << 1 << 0 << "" << QStringList { "b.ogg|B|x" };
    // A row behind the last entry, in hand when that entry is inserted, is
    // neither compared nor deleted in that pass: it goes in the next one.
    QTest::newRow("gap row stays") << "C" << c << a << 1 << 0 << "" << QStringList { "a.ogg|A|x", "c.ogg|C|x" };
    QTest::newRow("gap row goes next") << "C" << c << a << 2 << 0 << "" << QStringList { "a.ogg|A|x" };
}

void tst_IndexManager::merge()
{
    QFETCH(QString, locale);
    QFETCH(QByteArray, first);
    QFETCH(QByteArray, second);
    QFETCH(int, runs);
    QFETCH(int, duplicates);
    QFETCH(QString, renamed);
    QFETCH(QStringList, expected);

    QLocale::setDefault(QLocale(locale));
    for (const char *name : { "/a.ogg", "/b.ogg", "/c.ogg", "/e.ogg" })
        QVERIFY(write(tones() + QLatin1String(name), QByteArray()));
    for (int i = 0; i < duplicates; ++i) {
        QTest::ignoreMessage(QtWarningMsg, "virtual bool IndexManager::updateMetaData()");
        QTest::ignoreMessage(QtWarningMsg, "Duplicate fileName in .index file \"c.ogg\"");
    }
    QVERIFY(runWith(first));
    const QVariant id = fileId(renamed.section(QLatin1Char('>'), 0, 0));
    for (int run = 0; run < runs; ++run)
        QVERIFY(runWith(second));

    QCOMPARE(rows(), expected);
    if (!renamed.isEmpty())
        QCOMPARE(fileId(renamed.section(QLatin1Char('>'), 1)), id);
    QCOMPARE(value("count(*)", QStringLiteral("path = '%1' AND (permissions != 1 OR mimeType != 'audio/ogg')").arg(tones())).toInt(), 0);
    // Below the package, so that the next start scans it; described by the index alone.
    QCOMPARE(m_db->rows(QStringLiteral("SELECT scope, parentId = (SELECT id FROM directory WHERE path = '%1') FROM directory "
                                       "WHERE path = '%2'").arg(pack(), tones())), QStringList { "3|1" });
    QCOMPARE(indexCurrent(), 1);
}

void tst_IndexManager::unread_data()
{
    QTest::addColumn<bool>("directory");
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QStringList>("warnings");

    const QString parse = QStringLiteral("^Error parsing index from file \"%1\" , offset: %2 , errorString: \"%3\"$");
    QTest::newRow("root array") << true << QByteArray(R"([{"fileName": "b.ogg"}])")
                                << QStringList { parse.arg("%1", "0", "no error occurred") };
    QTest::newRow("truncated") << true << QByteArray(R"({"files": [)") << QStringList { parse.arg("%1", "\\d+", "[^\"]+") };
    QTest::newRow("rename collision") << true << QByteArray(R"({"files": [{"fileName": "b.ogg", "aliases": ["a.ogg"]}]})")
                                      << QStringList { "^virtual bool IndexManager::updateMetaData\\(\\)$",
                                                       "^Failed to execute m_renameQuery.$", "^QSqlError.*UNIQUE constraint failed",
                                                       "^\"UPDATE file SET fileName = \\? WHERE directoryId = \\? AND fileName = \\?;\"$" };
    QTest::newRow("no directory") << false << QByteArray(R"({"files": [{"fileName": "a.ogg"}]})") << QStringList();
}

void tst_IndexManager::unread()
{
    QFETCH(bool, directory);
    QFETCH(QByteArray, content);
    QFETCH(QStringList, warnings);

    if (directory) {
        QVERIFY(write(tones() + QStringLiteral("/a.ogg"), QByteArray()));
        QVERIFY(write(tones() + QStringLiteral("/b.ogg"), QByteArray()));
    }
    QVERIFY(runWith(R"({"files": [{"fileName": "a.ogg", "displayName": "A"}, {"fileName": "b.ogg", "displayName": "B"}]})"));
    const QStringList before = rows();
    QCOMPARE(before.size(), directory ? 2 : 0);
    const QVariant id = fileId(QStringLiteral("a.ogg"));

    for (QString warning : warnings)
        QTest::ignoreMessage(QtWarningMsg, QRegularExpression(warning.replace("%1", QRegularExpression::escape(index()))));
    QVERIFY(runWith(content));

    // A bad index leaves the rows of its directory as they are, and isn't tried again.
    QCOMPARE(rows(), before);
    QCOMPARE(fileId(QStringLiteral("a.ogg")), id);
    QCOMPARE(indexCurrent(), 1);
    QCOMPARE(m_db->value(QStringLiteral("SELECT count(*) FROM directory WHERE path = '%1'").arg(tones())).toInt(), int(directory));
}

void tst_IndexManager::changeNotices()
{
    QVERIFY(write(tones() + QStringLiteral("/a.ogg"), QByteArray()));
    QVERIFY(runWith(R"({"files": [{"fileName": "a.ogg", "displayName": "A"}]})"));

    ContentManager *indexes = ContentManager::managerFromType(7);
    StepCounter fileSteps;
    static_cast<FileManager *>(ContentManager::managerFromType(0))->installEventFilter(&fileSteps);
    const QString markStale = QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE id = %1")
                                      .arg(value("file.id", QStringLiteral("path = '%1' AND fileName = 'tones.index'").arg(pack())).toString());

    // Read again unchanged: no change notice, but the file loop is woken all the same.
    QVERIFY(m_db->exec(markStale));
    SignalRecorder::clear();
    QVERIFY(indexes->updateMetaData());
    QCOMPARE(SignalRecorder::calls(), QList<int>());
    QVERIFY(waitIdle());
    QVERIFY(fileSteps.steps > 0);

    QVERIFY(write(index(), R"({"files": [{"fileName": "a.ogg", "displayName": "A2"}]})"));
    QVERIFY(m_db->exec(markStale));
    QVERIFY(indexes->updateMetaData());
    QCOMPARE(SignalRecorder::calls(), QList<int> { 0 });
    QCOMPARE(rows(), QStringList { "a.ogg|A2|NULL" });
    QVERIFY(!indexes->updateMetaData());

    // An index that became a FIFO is passed over, not waited for.
    QVERIFY(QFile::remove(index()) && ::mkfifo(QFile::encodeName(index()).constData(), 0644) == 0);
    QVERIFY(m_db->exec(markStale));
    QVERIFY(indexes->updateMetaData());
    QCOMPARE(rows(), QStringList { "a.ogg|A2|NULL" });
}

QTEST_GUILESS_MAIN(tst_IndexManager)
#include "tst_indexmanager.moc"
