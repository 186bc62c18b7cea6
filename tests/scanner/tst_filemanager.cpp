// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexfixture.h"

using namespace Fixture;

namespace {

// Disk, rows under a root of the scope, changes after the scan (read at once), the index after them and the signals (one
// a scan or a read; no index: every file's stored type is QMimeDatabase's, whatever the signals), warnings.
struct Case
{
    int scope;
    QString disk, rows, changes, after;
    int signalCount;
    QStringList warnings = {};
};

// One shell process in the directory, so that all of its events wait for one read.
void run(const QString &directory, const QString &script)
{
    QCOMPARE(QProcess::execute("sh", { "-ec", "mkdir -p '" + directory + "'; cd '" + directory + "'\n" + script }), 0);
}

QString sorted(QStringList entries)
{
    entries.sort();
    return entries.join(' ');
}

}

Q_DECLARE_METATYPE(Case)

// FileManager against real inotify, the index through the service's own connection.
class tst_FileManager : public QObject
{
    Q_OBJECT

    TestDatabase m_sql { serviceIndex() };
    qint64 m_mark = 0; // rows above it are new

    // "f" a file with its time on disk, "f~" an older time, "d/" a directory, "d/=s" a root of scope s ("/=s" root itself).
    void addRows(const QString &root, const QString &rows)
    {
        for (const QString &entry : rows.split(' ', Qt::SkipEmptyParts)) {
            const QString name = entry.section(QRegularExpression("[~=]"), 0, 0);
            const QFileInfo info(root + '/' + name.chopped(name.endsWith('/') ? 1 : 0));
            const QString parent = QString("FROM directory WHERE path = '%1';").arg(info.path());
            if (entry.contains('='))
                m_sql.exec(QString("INSERT INTO directory (path, scope) VALUES ('%1', %2);")
                                   .arg(QDir::cleanPath(info.filePath()), entry.section('=', 1)));
            else if (name.endsWith('/'))
                m_sql.exec(QString("INSERT INTO directory (parentId, path, scope) SELECT id, '%1', 0 ").arg(info.filePath()) + parent);
            else
                m_sql.exec(QString("INSERT INTO file (directoryId, fileName, modificationTime, permissions, metadataCurrent)"
                                   " SELECT id, '%1', '%2', 3, 1 ").arg(info.fileName(), info.lastModified().addSecs(
                                           entry.endsWith('~') ? -60 : 0).toString(Qt::ISODateWithMs)) + parent);
        }
        m_mark = m_sql.value("SELECT MAX(id) FROM file;").toLongLong();
    }

    // Sorted: "d/" a directory ("/" root), "f|metadataCurrent" a file, "+f|..." one newer than the last addRows().
    QString tree(const QString &root)
    {
        const QString where = QString(" WHERE path = '%1' OR path LIKE '%1/%'").arg(root), from = QString::number(root.size() + 2);
        return sorted(m_sql.rows("SELECT substr(path, " + from + ") || '/' FROM directory" + where + " UNION ALL SELECT CASE WHEN "
                                 "file.id > " + QString::number(m_mark) + " THEN '+' ELSE '' END || substr(path || '/' || fileName, "
                                 + from + ") || '|' || metadataCurrent FROM file JOIN directory ON directory.id = directoryId" + where));
    }

private slots:
    void init()
    {
        m_sql.exec({ "DELETE FROM file;", "DELETE FROM directory;" });
        m_mark = 0;
        SignalRecorder::clear();
    }

    void scanAndEvents_data()
    {
        QTest::addColumn<Case>("c");

        // A known subdirectory is walked in every scope, under its own scope (0).
        const QString disk = "mkdir fresh k; touch a b c k/x", rows = "b c~ d gone/ gone/v k/";
        QTest::newRow("user") << Case { 0, disk, rows, "", "/ +a|0 b|1 c|0 fresh/ k/ +k/x|0", 3 };
        QTest::newRow("install") << Case { 1, disk, rows, "", "/ b|1 c|0 k/ +k/x|0", 2 };
        QTest::newRow("package") << Case { 2, disk, rows, "", "/ b|1 c|1 k/ +k/x|0", 2 };
        QTest::newRow("empty listing") << Case { 0, "", "a b", "", "/", 1 };
        // The row fetched when the listing runs out stays until the next scan; the rows after it go.
        QTest::newRow("gap at the end of the listing") << Case { 0, "touch a b", "c d", "", "/ +a|0 +b|0 c|1", 1 };
        // U+FF21 sorts before U+1F600 in UTF-8, after it in UTF-16.
        const QString wide = QString::fromUtf8("\xef\xbc\xa1"), emoji = QString::fromUtf8("\xf0\x9f\x98\x80");
        QTest::newRow("utf-8 byte order") << Case { 0, "touch " + emoji + ' ' + wide + " Z a", wide + ' ' + emoji + " a", "",
                                                    "/ +Z|0 a|1 " + emoji + "|1 " + wide + "|1", 1 };
        QTest::newRow("hidden entries and links")
                << Case { 0, "mkdir .hd d; touch t .h .hd/i; ln -s t lf; ln -s d ld", "", "", "/ d/ +lf|0 +t|0", 2 };
        QTest::newRow("breadth first, a directory a step") << Case { 0, "mkdir -p A/C B; touch r A/a B/b A/C/c", "", "",
                "/ A/ A/C/ B/ +A/a|0 +A/C/c|0 +B/b|0 +r|0", 4 };
        // S is a root of its own: inserting it as a child fails, the parent's scan rolls back and the loop stops.
        QTest::newRow("a known root is not adopted") << Case { 0, "mkdir S; touch r", "S/=1", "", "/ S/", 0,
                failure("bool FileManager::scanDirectory()", "Failed to execute m_directoryInsert.", "INSERT INTO directory",
                        "UNIQUE constraint failed: directory.path") };

        QTest::newRow("move onto a known file") << Case { 0, "touch a b", "a b", "mv a b", "/ b|0", 2 };
        QTest::newRow("create, delete, create: rolled back") << Case { 0, "", "", "touch f; rm f; touch f", "/", 1,
                failure("bool FileManager::readEvent()", "Failed to execute m_fileInsert.", "INSERT INTO file") };
        // By kind, not in the order of the events: deletes last.
        QTest::newRow("move away, create again") << Case { 0, "touch a", "a", "mv a ..; touch a", "/", 2 };
        // The scope 3 watch reports changes only: no new files.
        QTest::newRow("index scope events") << Case { 3, "touch a", "a", "touch n; echo x >> a", "/ a|0", 2 };
        QStringList many { "/" };
        for (int i = 0; i < 200; ++i)
            many << QString::asprintf("+file-with-a-longer-name-%03d|0", i);
        QTest::newRow("more than 4096 bytes") << Case { 0, "", "", "touch $(seq -f file-with-a-longer-name-%03g 0 199)", many.join(' '), 2 };
        // Unlike a scan, an event adds a hidden file.
        QTest::newRow("hidden file") << Case { 0, "", "", "touch mine .h", "/ +.h|0 +mine|0", 2 };
        QTest::newRow("name not in UTF-8") << Case { 0, "", "", "touch \"$(printf 'bad\\377')\" ok", "/ +ok|0", 2,
                { "^Skipping a file name that is not valid UTF-8 \".*/\" \"bad\\\\xFF\"$" } };
        // Stored as on disk though SQLite takes a bound leading U+FEFF for a BOM: else every scan would replace the row.
        const auto bom = [](char c) { return QString("\"$(printf '\\357\\273\\277%1')\"").arg(c); };
        QTest::newRow("leading U+FEFF") << Case { 0, "touch " + bom('b'), "", "rm " + bom('b') + "; touch " + bom('c'),
                                                  QString("/ +") + QChar(0xFEFF) + "c|0", 2 };
        const QString tree = "mkdir S; touch r S/s", treeRows = "r S/ S/s";
        QTest::newRow("directory created") << Case { 0, tree, treeRows, "mkdir N; touch N/n", "/ N/ +N/n|0 S/ S/s|1 r|1", 4 };
        QTest::newRow("IN_DELETE_SELF") << Case { 0, tree, treeRows, "rm -r S", "/ r|1", 3 };
        // The directory's watch and its row go; the IN_IGNORED of the removed watch is passed over.
        QTest::newRow("IN_MOVE_SELF") << Case { 0, tree, treeRows, "mv S ../moved-S", "/ r|1", 4 };
        // Swapped for a link between the event that queues it and its scan.
        QTest::newRow("directory now a link") << Case { 0, "mkdir -p ../outside; touch ../outside/secret", "",
                "mkdir N; rmdir N; ln -s ../outside N", "/ N/ +N|0", 2, { "^Skipping a directory that is a symbolic link \".*/N\"$" } };

        // Stored types are QMimeDatabase's, also where the content decides and for files that aren't regular.
        const auto types = [](const char *tag, const QString &disk, const QString &changes) {
            QTest::newRow(tag) << Case { 0, disk, "", changes, "", 0 };
        };
        const QString vorbis = "printf 'OggS\\0\\2%022d\\001vorbis' 0 >", png = "printf '\\211PNG\\r\\n\\032\\n' >";
        types("types: ogg", vorbis + " v.ogg; : > e.ogg; echo x > t.ogg; printf 'OggS\\0\\2%022dOpusHead' 0 > o.ogg",
              vorbis + " v2.ogg; : > e2.ogg; echo y > t2.ogg; " + png + " p.ogg");
        types("types: globs", "touch a.1 b.9 c.0 x.so.1 123.vdr core makefile README.md f~ Makefile.am a.anim1",
              "touch d.1 e.so.2 456.vdr");
        types("types: own and dotted", "echo x > a.themelet; echo '[x]' > b.index; touch c.tar.gz d.gz e.x.mp3 .h.wav",
              "touch f.tar.gz g.themelet h.index");
        types("types: not regular files", "touch t.txt", "mkfifo f.txt; ln -s t.txt l.mp3; ln -s gone g.ogg");
    }

    void scanAndEvents()
    {
        QFETCH(Case, c);
        const QString root = uniquePath();
        run(root, c.disk);
        addRows(root, QString("/=%1 ").arg(c.scope) + c.rows);
        MessageLog log(false);
        FileManager manager(DbManager::instance(), nullptr); // queues the roots
        for (int i = 0; i < 10 && manager.isUpdateQueued(); ++i)
            QCoreApplication::sendPostedEvents(&manager, QEvent::UpdateRequest);
        QVERIFY(!manager.isUpdateQueued());
        run(root, c.changes);
        QVERIFY(waitIdle());

        compareWarnings(log, c.warnings);
        if (c.after.isEmpty()) {
            const QStringList rows = m_sql.rows("SELECT fileName, mimeType FROM file ORDER BY fileName;");
            QVERIFY(rows.size() > 3);
            const QMimeDatabase types;
            for (const QString &row : rows)
                QCOMPARE(row, row.section('|', 0, 0) + '|' + types.mimeTypeForFile(root + '/' + row.section('|', 0, 0)).name());
        } else {
            QCOMPARE(tree(root), sorted(c.after.split(' ')));
            QCOMPARE(SignalRecorder::calls(), QVector<int>(c.signalCount, 0).toList());
        }
    }

    void appendDirectory()
    {
        // Times of both passes through the repeated hour of Helsinki's autumn clock change.
        const QString root = uniquePath();
        run(root, "touch f; touch -d @1761438600 early; touch -d @1761442200 late");
        const QByteArray zone = qgetenv("TZ");
        setTimeZone("Europe/Helsinki");
        FileManager manager(DbManager::instance(), nullptr);
        const qint64 id = manager.appendDirectory(root, FileManager::UserScope, FileManager::ScanNew);
        QVERIFY(id > 0 && waitIdle());

        // A restart in another zone finds both stored times equal to the files'.
        m_sql.exec("UPDATE file SET metadataCurrent = 1 WHERE fileName IN ('early', 'late');");
        setTimeZone("Asia/Tokyo");
        {
            FileManager restarted(DbManager::instance(), nullptr);
            QVERIFY(waitIdle());
        }
        setTimeZone(zone);
        QCOMPARE(tree(root), QString("+early|1 +f|0 +late|1 /"));
        addRows(root, "absent");

        QCOMPARE(manager.appendDirectory(root, FileManager::UserScope, FileManager::ScanNew), id);
        QVERIFY(!manager.isUpdateQueued());
        QCOMPARE(manager.appendDirectory(root + "/missing", FileManager::UserScope, FileManager::ScanAlways), 0);
        QVERIFY(!manager.isUpdateQueued());
        // A live watch means the directory is in step: the queued scan passes over it.
        QCOMPARE(manager.appendDirectory(root, FileManager::UserScope, FileManager::ScanAlways), id);
        QVERIFY(manager.isUpdateQueued());
        QVERIFY(waitIdle());
        QCOMPARE(tree(root), QString("/ absent|1 early|1 f|0 late|1"));

        // A file's unknown directory becomes a root of scope 1: scanned in that scope, and watched.
        const QString other = root + "-file";
        run(other, "touch t.txt other");
        QCOMPARE(manager.insertFile(other + "/missing"), 0);
        const qint64 file = manager.insertFile(other + "/t.txt");
        QVERIFY(file > 0);
        QCOMPARE(manager.insertFile(other + "/t.txt"), file);
        // An inserted file's time is stored as the scan stores it: UTC text, whatever the zone.
        QCOMPARE(m_sql.value("SELECT modificationTime FROM file WHERE id = " + QString::number(file)).toString(),
                 QFileInfo(other + "/t.txt").lastModified().toUTC().toString(Qt::ISODateWithMs));
        QCOMPARE(m_sql.rows("SELECT parentId, scope, mimeType, permissions FROM directory JOIN file ON directoryId = directory.id"
                            " WHERE path = '" + other + "';"), QStringList { "NULL|1|text/plain|3" });
        QVERIFY(waitIdle());
        QCOMPARE(tree(other), QString("+t.txt|0 /"));
        run(other, "echo x >> t.txt");
        QVERIFY(pendingBytes(manager) > 0);
    }

    // A new directory and a picture in one read: the next loop step scans the directory, a later one reads the picture.
    void roadOfChange()
    {
        const QString pictures = uniquePath();
        FileManager *manager = FileManager::instance();
        QVERIFY(QDir().mkpath(pictures) && manager->appendDirectory(pictures, FileManager::UserScope, FileManager::ScanNew) > 0);
        QVERIFY(waitIdle() && write(pictures + "/new/a") && writeJpeg(pictures + "/shot.jpg") && pendingBytes(*manager) > 0);
        SignalRecorder::clear();
        QEvent read(QEvent::SockAct);
        QCoreApplication::sendEvent(manager, &read);
        QCoreApplication::sendPostedEvents(manager, QEvent::UpdateRequest);
        QCOMPARE(m_sql.rows("SELECT fileName, metadataCurrent FROM file ORDER BY fileName"), (QStringList { "a|0", "shot.jpg|0" }));
        QVERIFY(waitIdle());
        QCOMPARE(SignalRecorder::calls(), QList<int>({ 0, 0, 2 }));
        QCOMPARE(m_sql.rows("SELECT metadataCurrent, width FROM file JOIN image ON fileId = id"), QStringList { "1|64" });
    }
};

QTEST_GUILESS_MAIN(tst_FileManager)
#include "tst_filemanager.moc"
