#include "eventloopidle.h"
#include "filemanager.h"
#include "fixturefiles.h"
#include "indexmanager.h"
#include "installmanager.h"
#include "signalrecorder.h"
#include "sysroot.h"
#include "testdatabase.h"

#include <QJsonDocument>
#include <QLocale>
#include <QRegularExpression>
#include <QtTest>

#include <memory>

// Tone packs under the sounds install directory, each with a `tones.index`
// describing its `tones/` directory, read by the install loop alone.
class tst_IndexManager : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void cleanup();

    void translations_data();
    void translations();
    void entries_data();
    void entries();
    void rewrite_data();
    void rewrite();
    void badIndex_data();
    void badIndex();
    void renameCollision();
    void missingDirectory();
    void changeNotices();

private:
    static InstallManager *installer()
    {
        return static_cast<InstallManager *>(ContentManager::managerFromType(6));
    }
    static QString packPath()
    {
        QString name = QString::fromLatin1(QTest::currentTestFunction());
        if (QTest::currentDataTag())
            name += QLatin1Char('-') + QString::fromLatin1(QTest::currentDataTag()).replace(QLatin1Char(' '), QLatin1Char('-'));
        return InstallManager::installPaths().at(1) + QLatin1Char('/') + name;
    }
    static QString toneDir() { return packPath() + QStringLiteral("/tones"); }
    static QString indexPath() { return toneDir() + QStringLiteral(".index"); }

    static bool makeFiles(const QStringList &names)
    {
        for (const QString &name : names) {
            if (!FixtureFiles::write(toneDir() + QLatin1Char('/') + name, QByteArray()))
                return false;
        }
        return true;
    }
    static bool runInstalls()
    {
        installer()->appendDirectory(InstallManager::installPaths().at(1));
        return EventLoopIdle::wait();
    }
    QStringList rows()
    {
        return m_db->rows(QStringLiteral("SELECT fileName, displayName, category FROM file WHERE directoryId = "
                                         "(SELECT id FROM directory WHERE path = '%1') ORDER BY fileName")
                                  .arg(toneDir()));
    }
    QVariant fileId(const QString &name)
    {
        return m_db->value(QStringLiteral("SELECT file.id FROM file JOIN directory ON directory.id = file.directoryId "
                                          "WHERE directory.path = '%1' AND fileName = '%2'")
                                   .arg(toneDir(), name));
    }
    QVariant indexCurrent()
    {
        return m_db->value(QStringLiteral("SELECT metadataCurrent FROM file JOIN directory ON directory.id = file.directoryId "
                                          "WHERE directory.path = '%1' AND fileName = 'tones.index'")
                                   .arg(packPath()));
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
    QVERIFY(m_db->isOpen());
    QVERIFY(runInstalls());
}

void tst_IndexManager::cleanup()
{
    QLocale::setDefault(QLocale::c());
}

void tst_IndexManager::translations_data()
{
    QTest::addColumn<QString>("catalog");
    QTest::addColumn<QString>("locale");
    QTest::addColumn<QStringList>("expected");

    // tone-a is in every catalogue, tone-b only in the engineering one, tone-c
    // in none, and tone-e has an empty translation in the locale catalogues.
    QTest::newRow("plain catalogue in C") << "tones" << "C"
                                          << QStringList { "Plain A", "Engineering B", "tone-c", "Engineering E" };
    QTest::newRow("finnish catalogue") << "tones" << "fi_FI"
                                       << QStringList { "Suomi A", "Engineering B", "tone-c", "Engineering E" };
    QTest::newRow("no catalogue") << "" << "fi_FI" << QStringList { "tone-a", "tone-b", "tone-c", "tone-e" };
    QTest::newRow("unknown catalogue") << "absent" << "C" << QStringList { "tone-a", "tone-b", "tone-c", "tone-e" };
}

void tst_IndexManager::translations()
{
    QFETCH(QString, catalog);
    QFETCH(QString, locale);
    QFETCH(QStringList, expected);

    QLocale::setDefault(QLocale(locale));
    QVERIFY(makeFiles({ "a.ogg", "b.ogg", "c.ogg", "e.ogg" }));
    QVERIFY(FixtureFiles::write(indexPath(), QStringLiteral(R"({"translationCatalog": "%1", "files": [
        {"fileName": "a.ogg", "displayName": "tone-a", "category": "ring"},
        {"fileName": "b.ogg", "displayName": "tone-b", "category": "ring"},
        {"fileName": "c.ogg", "displayName": "tone-c", "category": "ring"},
        {"fileName": "e.ogg", "displayName": "tone-e", "category": "ring"}]})").arg(catalog).toUtf8()));
    QVERIFY(runInstalls());

    QCOMPARE(rows(), (QStringList { "a.ogg|" + expected.at(0) + "|ring", "b.ogg|" + expected.at(1) + "|ring",
                                    "c.ogg|" + expected.at(2) + "|ring", "e.ogg|" + expected.at(3) + "|ring" }));
}

void tst_IndexManager::entries_data()
{
    QTest::addColumn<QByteArray>("index");
    QTest::addColumn<QStringList>("expected");
    QTest::addColumn<int>("duplicates");

    QTest::newRow("skipped elements") << QByteArray(R"({"files": [
        {"fileName": "b.ogg", "displayName": "B", "category": "alarm", "comment": "ignored"},
        7, "a.ogg", {}, {"fileName": ""}, {"fileName": "tones/a.ogg"}, {"fileName": "/a.ogg"},
        {"fileName": "missing.ogg", "displayName": "Missing"},
        {"fileName": "a.ogg", "displayName": 5, "category": ["x"]}]})")
                                      << QStringList { "a.ogg|NULL|NULL", "b.ogg|B|alarm" } << 0;
    QTest::newRow("duplicate") << QByteArray(R"({"files": [
        {"fileName": "a.ogg", "displayName": "A", "category": "ring"},
        {"fileName": "b.ogg", "displayName": "B", "category": "ring"},
        {"fileName": "a.ogg", "displayName": "A", "category": "ring"}]})")
                               << QStringList { "a.ogg|A|ring", "b.ogg|B|ring" } << 1;
    QTest::newRow("triplicate last") << QByteArray(R"({"files": [
        {"fileName": "c.ogg"}, {"fileName": "c.ogg"}, {"fileName": "a.ogg"}, {"fileName": "c.ogg"}]})")
                                     << QStringList { "a.ogg|NULL|NULL", "c.ogg|NULL|NULL" } << 2;
    QTest::newRow("not a list") << QByteArray(R"({"files": {"fileName": "a.ogg"}})") << QStringList() << 0;
}

void tst_IndexManager::entries()
{
    QFETCH(QByteArray, index);
    QFETCH(QStringList, expected);
    QFETCH(int, duplicates);

    QVERIFY(makeFiles({ "a.ogg", "b.ogg", "c.ogg" }));
    QVERIFY(FixtureFiles::write(indexPath(), index));
    for (int i = 0; i < duplicates; ++i) {
        QTest::ignoreMessage(QtWarningMsg, "virtual bool IndexManager::updateMetaData()");
        QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^Duplicate fileName in .index file \"[ac].ogg\"$"));
    }
    QVERIFY(runInstalls());

    QCOMPARE(rows(), expected);
    QCOMPARE(m_db->value(QStringLiteral("SELECT count(*) FROM file WHERE directoryId = (SELECT id FROM directory "
                                        "WHERE path = '%1') AND (permissions != 1 OR mimeType != 'audio/ogg')")
                                 .arg(toneDir()))
                     .toInt(),
             0);
    // The described directory hangs below its package, so the next start scans it.
    QCOMPARE(m_db->rows(QStringLiteral("SELECT scope, parentId = (SELECT id FROM directory WHERE path = '%1') "
                                       "FROM directory WHERE path = '%2'")
                                .arg(packPath(), toneDir())),
             QStringList { "3|1" });
    QCOMPARE(indexCurrent().toInt(), 1);
}

void tst_IndexManager::rewrite_data()
{
    QTest::addColumn<QByteArray>("first");
    QTest::addColumn<QString>("renamed");
    QTest::addColumn<QStringList>("removed");
    QTest::addColumn<QByteArray>("second");
    QTest::addColumn<int>("secondRuns");
    QTest::addColumn<QStringList>("expected");

    const QByteArray ab = R"({"files": [{"fileName": "a.ogg", "displayName": "A", "category": "x"},
                                        {"fileName": "b.ogg", "displayName": "B", "category": "x"}]})";
    QTest::newRow("alias keeps the row")
            << ab << "b.ogg>c.ogg" << QStringList()
            << QByteArray(R"({"files": [{"fileName": "a.ogg", "displayName": "A", "category": "x"},
                                        {"fileName": "c.ogg", "displayName": "B", "category": "x",
                                         "aliases": ["", 3, "b.ogg", "gone.ogg"]}]})")
            << 1 << QStringList { "a.ogg|A|x", "c.ogg|B|x" };
    QTest::newRow("changed values") << ab << "" << QStringList()
                                    << QByteArray(R"({"files": [{"fileName": "a.ogg", "displayName": "A2", "category": "y"},
                                                                {"fileName": "b.ogg", "displayName": "B", "category": "x"}]})")
                                    << 1 << QStringList { "a.ogg|A2|y", "b.ogg|B|x" };
    QTest::newRow("empty files") << ab << "" << QStringList() << QByteArray(R"({"files": []})") << 1 << QStringList();
    QTest::newRow("no files key") << ab << "" << QStringList() << QByteArray(R"({})") << 1 << QStringList();
    QTest::newRow("file gone") << ab << "" << QStringList { "a.ogg" } << ab << 1 << QStringList { "b.ogg|B|x" };
    QTest::newRow("unnamed row") << ab << "" << QStringList()
                                 << QByteArray(R"({"files": [{"fileName": "b.ogg", "displayName": "B", "category": "x"}]})")
                                 << 1 << QStringList { "b.ogg|B|x" };
    // A row that sorts after every entry is passed over while an entry is
    // being inserted in front of it, and only goes in the next pass.
    const QByteArray c = R"({"files": [{"fileName": "c.ogg", "displayName": "C", "category": "x"}]})";
    const QByteArray a = R"({"files": [{"fileName": "a.ogg", "displayName": "A", "category": "x"}]})";
    QTest::newRow("gap row stays") << c << "" << QStringList() << a << 1 << QStringList { "a.ogg|A|x", "c.ogg|C|x" };
    QTest::newRow("gap row goes next") << c << "" << QStringList() << a << 2 << QStringList { "a.ogg|A|x" };
}

void tst_IndexManager::rewrite()
{
    QFETCH(QByteArray, first);
    QFETCH(QString, renamed);
    QFETCH(QStringList, removed);
    QFETCH(QByteArray, second);
    QFETCH(int, secondRuns);
    QFETCH(QStringList, expected);

    QVERIFY(makeFiles({ "a.ogg", "b.ogg", "c.ogg" }));
    QVERIFY(FixtureFiles::write(indexPath(), first));
    QVERIFY(runInstalls());

    const QStringList rename = renamed.split(QLatin1Char('>'));
    QVariant renamedId;
    if (rename.size() == 2) {
        // Both files stay on disk, so that only the index tells of the rename.
        renamedId = fileId(rename.at(0));
        QVERIFY(renamedId.isValid());
    }
    for (const QString &name : removed)
        QVERIFY(QFile::remove(toneDir() + QLatin1Char('/') + name));

    for (int run = 0; run < secondRuns; ++run) {
        QVERIFY(FixtureFiles::write(indexPath(), second));
        QVERIFY(runInstalls());
    }

    QCOMPARE(rows(), expected);
    if (renamedId.isValid())
        QCOMPARE(fileId(rename.at(1)), renamedId);
}

void tst_IndexManager::badIndex_data()
{
    QTest::addColumn<QByteArray>("content");

    QTest::newRow("root array") << QByteArray("[{\"fileName\": \"b.ogg\"}]");
    QTest::newRow("truncated") << QByteArray("{\"files\": [");
    QTest::newRow("not text") << QByteArray("\xff\xfe\x00\x01", 4);
    QTest::newRow("empty") << QByteArray();
}

void tst_IndexManager::badIndex()
{
    QFETCH(QByteArray, content);

    QVERIFY(makeFiles({ "a.ogg", "b.ogg" }));
    QVERIFY(FixtureFiles::write(indexPath(), R"({"files": [{"fileName": "a.ogg", "displayName": "A"}]})"));
    QVERIFY(runInstalls());
    const QStringList before = rows();
    QCOMPARE(before, QStringList { "a.ogg|A|NULL" });

    QJsonParseError error;
    QJsonDocument::fromJson(content, &error);
    if (content.startsWith('['))
        QCOMPARE(error.errorString(), QStringLiteral("no error occurred"));
    const QString message = QStringLiteral("Error parsing index from file \"%1\" , offset: %2 , errorString: \"%3\"")
                                    .arg(indexPath())
                                    .arg(error.offset)
                                    .arg(error.errorString());
    QTest::ignoreMessage(QtWarningMsg, qPrintable(message));
    QVERIFY(FixtureFiles::write(indexPath(), content));
    QVERIFY(runInstalls());

    QCOMPARE(rows(), before);
    QCOMPARE(indexCurrent().toInt(), 1);
}

void tst_IndexManager::renameCollision()
{
    QVERIFY(makeFiles({ "a.ogg", "b.ogg" }));
    QVERIFY(FixtureFiles::write(indexPath(), R"({"files": [{"fileName": "a.ogg", "displayName": "A"},
                                                           {"fileName": "b.ogg", "displayName": "B"}]})"));
    QVERIFY(runInstalls());
    const QVariant idA = fileId(QStringLiteral("a.ogg"));

    QTest::ignoreMessage(QtWarningMsg, "virtual bool IndexManager::updateMetaData()");
    QTest::ignoreMessage(QtWarningMsg, "Failed to execute m_renameQuery.");
    QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^QSqlError.*UNIQUE constraint failed"));
    QTest::ignoreMessage(QtWarningMsg, "\"UPDATE file SET fileName = ? WHERE directoryId = ? AND fileName = ?;\"");
    QVERIFY(FixtureFiles::write(indexPath(), R"({"files": [{"fileName": "a.ogg", "displayName": "A2"},
                                                           {"fileName": "b.ogg", "aliases": ["a.ogg"]}]})"));
    QVERIFY(runInstalls());

    QCOMPARE(rows(), (QStringList { "a.ogg|A|NULL", "b.ogg|B|NULL" }));
    QCOMPARE(fileId(QStringLiteral("a.ogg")), idA);
    QCOMPARE(indexCurrent().toInt(), 1);
}

void tst_IndexManager::missingDirectory()
{
    QVERIFY(FixtureFiles::write(indexPath(), R"({"files": [{"fileName": "a.ogg", "displayName": "A"}]})"));
    QVERIFY(runInstalls());

    QCOMPARE(indexCurrent().toInt(), 1);
    QVERIFY(!m_db->value(QStringLiteral("SELECT id FROM directory WHERE path = '%1'").arg(toneDir())).isValid());
}

void tst_IndexManager::changeNotices()
{
    QVERIFY(makeFiles({ "a.ogg" }));
    QVERIFY(FixtureFiles::write(indexPath(), R"({"files": [{"fileName": "a.ogg", "displayName": "A"}]})"));
    QVERIFY(runInstalls());

    ContentManager *indexes = ContentManager::managerFromType(7);
    QObject *files = static_cast<FileManager *>(ContentManager::managerFromType(0));
    EventLoopIdle::StepCounter fileSteps;
    files->installEventFilter(&fileSteps);
    const QString markStale = QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE fileName = 'tones.index' AND "
                                             "directoryId = (SELECT id FROM directory WHERE path = '%1')")
                                      .arg(packPath());

    // Read again unchanged: no change notice, but the file loop is woken all the same.
    QVERIFY(m_db->exec(markStale));
    SignalRecorder::clear();
    QVERIFY(indexes->updateMetaData());
    QCOMPARE(SignalRecorder::calls(), QList<int>());
    QVERIFY(EventLoopIdle::wait());
    QVERIFY(fileSteps.steps > 0);

    QVERIFY(FixtureFiles::write(indexPath(), R"({"files": [{"fileName": "a.ogg", "displayName": "A2"}]})"));
    QVERIFY(m_db->exec(markStale));
    SignalRecorder::clear();
    QVERIFY(indexes->updateMetaData());
    QCOMPARE(SignalRecorder::calls(), QList<int> { 0 });
    QCOMPARE(rows(), QStringList { "a.ogg|A2|NULL" });

    QVERIFY(!indexes->updateMetaData());
    files->removeEventFilter(&fileSteps);
}

QTEST_GUILESS_MAIN(tst_IndexManager)
#include "tst_indexmanager.moc"
