// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexfixture.h"
#include "sysroot.h"

using namespace Fixture;

// Tone packs in the sounds install directory: `tones.index` describes `tones/`, read by the install loop.
class tst_IndexManager : public QObject
{
    Q_OBJECT

    TestDatabase m_db { serviceIndex() };

    static QString pack() { return uniquePath(InstallManager::installPaths().at(1)); }
    static QString tones() { return pack() + QStringLiteral("/tones"); }
    static bool runWith(const QByteArray &content)
    {
        return write(tones() + QStringLiteral(".index"), content) && installFrom(InstallManager::installPaths().at(1));
    }

private slots:
    void initTestCase()
    {
        const QString translations = Sysroot::path(QStringLiteral("/usr/share/translations/"));
        QVERIFY(QDir().mkpath(translations));
        for (const char *catalog : { "tones.qm", "tones-fi.qm", "tones_eng_en.qm" })
            QVERIFY(QFile::copy(QStringLiteral(CATALOG_DIR "/") + catalog, translations + catalog));
        QVERIFY(installer());
    }

    void merge_data()
    {
        QTest::addColumn<QByteArrayList>("indexes"); // read in turn
        QTest::addColumn<QStringList>("expected");   // the last column: a row made after the first index
        QTest::addColumn<QStringList>("warnings");   // "%1" the index file
        const auto add = [](const char *tag, const QByteArrayList &indexes, const QStringList &expected,
                            const QStringList &warnings = {}) {
            QTest::newRow(tag) << indexes << expected << warnings;
        };
        const QByteArray ab = R"({"files": [{"fileName": "a.ogg", "displayName": "A", "category": "x"}, )"
                              R"({"fileName": "b.ogg", "displayName": "B", "category": "x"}]})";
        // In Finnish: tone-a in every catalogue, tone-b in the engineering one, tone-c in none, tone-e empty but for engineering.
        const QByteArray translated = R"({"translationCatalog": "tones", "files": [{"fileName": "a.ogg", "displayName": "tone-a"}, )"
            R"({"fileName": "b.ogg", "displayName": "tone-b"}, {"fileName": "c.ogg", "displayName": "tone-c"}, )"
            R"({"fileName": "e.ogg", "displayName": "tone-e"}]})";
        add("locale catalogue", { translated }, { "a.ogg|Suomi A|NULL|0", "b.ogg|Engineering B|NULL|0", "c.ogg|tone-c|NULL|0",
                                                  "e.ogg|Engineering E|NULL|0" });
        // Wrong types count as absent; "a.ogg" and "./a.ogg" are names, not rows.
        add("skipped elements", { R"({"files": [{"fileName": "b.ogg", "displayName": "B", "category": "x", "more": 1}, 7, )"
            R"("a.ogg", {}, {"fileName": ""}, {"fileName": "./a.ogg"}, {"fileName": "missing.ogg"}, {"fileName": "."}, {"fileName": ".."}, )"
            R"({"fileName": "a.ogg", "displayName": 5, "category": ["x"]}]})" }, { "a.ogg|NULL|NULL|0", "b.ogg|B|x|0" });
        add("duplicate", { R"({"files": [{"fileName": "c.ogg"}, {"fileName": "a.ogg"}, {"fileName": "c.ogg"}]})" },
            { "a.ogg|NULL|NULL|0", "c.ogg|NULL|NULL|0" },
            { "virtual bool IndexManager::updateMetaData()", "Duplicate fileName in .index file \"c.ogg\"" });
        add("alias keeps the row", { ab, R"({"files": [{"fileName": "a.ogg", "displayName": "A", "category": "x"}, )"
            R"({"fileName": "c.ogg", "displayName": "B", "category": "x", "aliases": ["", 3, "b.ogg", "gone.ogg"]}]})" },
            { "a.ogg|A|x|0", "c.ogg|B|x|0" });
        add("changed and unnamed", { ab, R"({"files": [{"fileName": "b.ogg", "displayName": "B2", "category": "y"}]})" },
            { "b.ogg|B2|y|0" });
        // A bad index leaves the rows of its directory as they are.
        add("root array", { ab, R"([{"fileName": "b.ogg"}])" }, { "a.ogg|A|x|0", "b.ogg|B|x|0" },
            { "Error parsing index from file \"%1\" , offset: 0 , errorString: \"no error occurred\"" });
    }

    void merge()
    {
        QFETCH(QByteArrayList, indexes);
        QFETCH(QStringList, expected);
        QFETCH(QStringList, warnings);

        QLocale::setDefault(QLocale("fi_FI"));
        QVERIFY(writeTree(tones(), { "a.ogg", "b.ogg", "c.ogg", "e.ogg" }));
        MessageLog log(false);
        QVERIFY(runWith(indexes.first()));
        const QString firstMax = m_db.value(QStringLiteral("SELECT max(id) FROM file")).toString();
        for (const QByteArray &index : indexes.mid(1))
            QVERIFY(runWith(index));

        QCOMPARE(log.warnings(), warnings.replaceInStrings("%1", tones() + QStringLiteral(".index")));
        QCOMPARE(m_db.fileRows(tones(), QStringLiteral("fileName, displayName, category, id > %1").arg(firstMax)), expected);
        QCOMPARE(m_db.fileRows(tones(), "permissions, mimeType").removeAll("1|audio/ogg"), expected.size());
        // Below the package, so that the next start scans it; described by the index alone.
        QCOMPARE(m_db.rows(QStringLiteral("SELECT scope, parentId = (SELECT id FROM directory WHERE path = '%1') FROM directory "
                                          "WHERE path = '%2'").arg(pack(), tones())), QStringList { "3|1" });
        // Read, and not tried again even when bad.
        QCOMPARE(m_db.fileRows(pack(), "metadataCurrent"), QStringList { "1" });
    }

    void changeNotices()
    {
        const QString index = tones() + QStringLiteral(".index");
        QVERIFY(write(tones() + QStringLiteral("/a.ogg")) && runWith(R"({"files": [{"fileName": "a.ogg"}]})"));
        const QString markStale = QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE directoryId = %1").arg(m_db.directoryId(pack()));
        ContentManager *indexes = ContentManager::managerFromType(7);

        // A notice only when rows change, one file a call.
        SignalRecorder::clear();
        QVERIFY(!FileManager::instance()->isUpdateQueued() && m_db.exec(markStale) && indexes->updateMetaData());
        QCOMPARE(SignalRecorder::calls(), QList<int>());
        // Pictures named by an index are read by the other loop: its step is queued.
        QVERIFY(FileManager::instance()->isUpdateQueued() && waitIdle());
        QVERIFY(write(index, R"({"files": [{"fileName": "a.ogg", "displayName": "A"}]})") && m_db.exec(markStale));
        QVERIFY(indexes->updateMetaData() && !indexes->updateMetaData());
        QCOMPARE(SignalRecorder::calls(), QList<int> { 0 });
        // A described directory that is a link is not followed.
        const QString outside = uniquePath();
        QVERIFY(write(outside + QStringLiteral("/b.ogg")) && QDir(tones()).removeRecursively() && QFile::link(outside, tones()));
        QVERIFY(write(index, R"({"files": [{"fileName": "b.ogg"}]})") && m_db.exec(markStale));
        QTest::ignoreMessage(QtWarningMsg, qPrintable("Skipping a directory that is a symbolic link \"" + tones() + '"'));
        QVERIFY(indexes->updateMetaData());
        QCOMPARE(m_db.fileRows(tones(), "fileName"), QStringList { "a.ogg" });
    }
};

QTEST_GUILESS_MAIN(tst_IndexManager)
#include "tst_indexmanager.moc"
