// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// themeletd indexes a fresh tree while two client processes of four threads
// query themelets, files and photos in a loop through the query agents. Every
// query must succeed and be one snapshot (a directory's files are committed
// together, so they are all there or none), and the loop must keep answering:
// readers run niced, so a stall means a lock, not a busy machine.
// THEMELET_READER_FILES sets the tree's size (default 5,000).
#include "servicefixture.h"
#include "filequeryagent.h"
#include "photodata.h"
#include "sysroot.h"
#include "themeletdata.h"
#include "themeletqueryagent.h"

#include <QThread>

#include <cstdio>

#include <unistd.h>

using namespace Fixture;

namespace {

const int FilesPerDirectory = 100, JpegsPerDirectory = 5, Themelets = 3, ReaderThreads = 4;
// The service trims its write-ahead log down from this size once readers let it.
const qint64 MaxLogSize = 8 * 1024 * 1024;

// Checks the batches of one query as they come, without keeping the rows.
struct Checker : QueryAgent::Recipient
{
    Checker(int type, const QString &root) : type(type), root(root) {}
    int type, calls = 0;
    bool closed = false;
    QString root, problem;
    QSet<qint64> ids;
    QHash<QString, int> directories;
    void fail(const QString &text) { if (problem.isEmpty()) problem = text; }
    void contentQueried(const QVector<Content> &batch) override
    {
        ++calls;
        if (closed || batch.size() > QueryAgent::BatchSize)
            fail(QStringLiteral("batch of %1 after the last one or too big").arg(batch.size()));
        closed = batch.size() < QueryAgent::BatchSize;
        for (const Content &content : batch) {
            const qint64 id = content.data() ? content.data()->id : 0;
            const QString path = content.data() ? content.data()->url.toLocalFile() : QString();
            if (id <= 0 || ids.contains(id))
                fail(QStringLiteral("id %1 missing or twice: %2").arg(id).arg(path));
            ids.insert(id);
            if (type == ThemeletContent::File && path.startsWith(root))
                ++directories[path.section('/', 0, -2)];
            const auto *photo = dynamic_cast<const PhotoData *>(content.data());
            if (type == ThemeletContent::Photo && (!photo || photo->mimeType != "image/jpeg" || photo->width != 64 || photo->height != 48))
                fail("not a photo: " + path);
            const auto *themelet = dynamic_cast<const ThemeletData *>(content.data());
            if (type == ThemeletContent::Themelet
                && (!themelet || themelet->resources.value("ringerToneFile").toMap().value("fileName") != "dusk.ogg"))
                fail("themelet without its tone: " + path);
        }
    }
    QString result()
    {
        for (auto it = directories.constBegin(); it != directories.constEnd(); ++it) {
            if (it.value() != FilesPerDirectory)
                fail(QStringLiteral("torn read: %1 of %2 files of %3").arg(it.value()).arg(FilesPerDirectory).arg(it.key()));
        }
        if (type == ThemeletContent::Themelet && ids.size() != Themelets)
            fail(QStringLiteral("%1 themelets").arg(ids.size()));
        return closed ? problem : QStringLiteral("no closing batch");
    }
};

// A client process: four threads query until the stop file appears. Prints
// its queries, failed queries and wrong results.
int readerMain(const QString &stopFile, const QString &root)
{
    [[maybe_unused]] const int niceness = ::nice(10);
    QMutex mutex;
    int totals[3] = {};
    std::vector<std::unique_ptr<QThread>> threads;
    for (int t = 0; t < ReaderThreads; ++t) {
        threads.emplace_back(QThread::create([&, t]() {
            int queries = 0, failures = 0, problems = 0;
            ThemeletQueryAgent::ThemeletParameters themelets;
            FileQueryAgent::FileParameters files;
            for (; queries < 3 || !QFile::exists(stopFile); ++queries) { // each type at least once
                const int type = (queries + t) % 3; // threads start on different types
                Checker checker(type, root + '/');
                QueryAgent *agent = QueryAgent::agentFor(ThemeletContent::Type(type));
                const bool ok = agent && agent->query(&checker, type == ThemeletContent::Themelet
                                        ? static_cast<const QueryAgent::Parameters &>(themelets) : files) && checker.calls;
                failures += !ok;
                const QString problem = ok ? checker.result() : QString();
                if (!problem.isEmpty() && ++problems <= 5)
                    qWarning("wrong result: %s", qPrintable(problem));
            }
            QMutexLocker locker(&mutex);
            totals[0] += queries, totals[1] += failures, totals[2] += problems;
        }));
        threads.back()->start();
    }
    for (auto &thread : threads)
        thread->wait();
    std::printf("%d %d %d\n", totals[0], totals[1], totals[2]);
    return 0;
}

}

class tst_Readers : public QObject
{
    Q_OBJECT

    const QString m_sandbox = qEnvironmentVariable("THEMELET_SANDBOX");
    const QString m_root = m_sandbox + "/watched";
    const QString m_log = m_sandbox + "/themeletd.log";
    const int m_files = qEnvironmentVariableIsSet("THEMELET_READER_FILES") ? qEnvironmentVariableIntValue("THEMELET_READER_FILES") : 5000;
    QProcess m_service;

private slots:
    void initTestCase()
    {
        QFile jpeg(m_sandbox + "/picture.jpg");
        QVERIFY(writeJpeg(jpeg.fileName()) && jpeg.open(QIODevice::ReadOnly));
        const QByteArray picture = jpeg.readAll();
        for (int d = 0; d < m_files / FilesPerDirectory; ++d) {
            const QString directory = QStringLiteral("%1/g%2/d%3/").arg(m_root).arg(d / 32).arg(d);
            for (int f = 0; f < FilesPerDirectory; ++f)
                QVERIFY(f < JpegsPerDirectory ? write(directory + QStringLiteral("f%1.jpg").arg(f), picture)
                                              : write(directory + QStringLiteral("f%1.%2").arg(f).arg(f % 2 ? "mp3" : "txt"), "text"));
        }
        const QString package = Sysroot::path("/usr/share/themelet/pack");
        QVERIFY(write(package + "/sounds/dusk.ogg", "x"));
        const QString themelet = R"({"wallpaper": "w%1.jpg", "displayName": "T%1", "ringerToneFile": {"file": "dusk.ogg", "enabled": 1}})";
        for (int i = 0; i < Themelets; ++i)
            QVERIFY(write(QStringLiteral("%1/images/w%2.jpg").arg(package).arg(i), picture)
                    && write(QStringLiteral("%1/t%2.themelet").arg(package).arg(i), themelet.arg(i).toUtf8()));
    }

    // Indexes the tree from an empty index while the readers query, probing the
    // service's loop with a cheap call all along and until the log is trimmed.
    void readersUnderWriter()
    {
        const QString stopFile = m_sandbox + "/stop";
        QElapsedTimer timer;
        timer.start();
        QVERIFY(Service::start(m_service, { m_root }, m_log));
        TestDatabase db;
        QVERIFY(QTest::qWaitFor([&] { return db.value("SELECT count(*) FROM resource").toInt() == Themelets; }, 60000));
        std::vector<std::unique_ptr<QProcess>> clients;
        for (int i = 0; i < 2; ++i) {
            clients.emplace_back(new QProcess);
            clients.back()->setProcessChannelMode(QProcess::ForwardedErrorChannel);
            clients.back()->start(QCoreApplication::applicationFilePath(), { "reader", stopFile, m_root });
        }
        const QString done = QStringLiteral("SELECT (SELECT count(*) FROM file JOIN directory ON directoryId = directory.id WHERE path "
                                            "LIKE '%1/%') = %2 AND NOT EXISTS (SELECT 1 FROM file WHERE metadataCurrent = 0 AND "
                                            "mimeType GLOB 'image/*')").arg(m_root).arg(m_files);
        QVector<int> samples;
        qint64 doneAt = -1, wal = 0, walEnd = 0;
        while (doneAt < 0 || (wal > MaxLogSize && !timer.hasExpired(doneAt + 20000))) {
            QElapsedTimer call;
            call.start();
            QVERIFY(!timer.hasExpired(1800000) && Service::answers());
            samples << int(call.elapsed());
            if (samples.size() % 20 == 0) {
                wal = QFileInfo(TestDatabase::indexPath() + "-wal").size();
                if (doneAt < 0 && db.value(done).toBool())
                    doneAt = timer.elapsed(), walEnd = wal;
            }
            QTest::qSleep(10);
        }
        QFile(stopFile).open(QIODevice::WriteOnly);
        int totals[3] = {};
        for (auto &client : clients) {
            // A client that hung, crashed or failed a sanitizer leaves no line of three numbers.
            QVERIFY(client->waitForFinished(120000) && client->exitStatus() == QProcess::NormalExit && client->exitCode() == 0);
            const QStringList numbers = QString::fromUtf8(client->readAllStandardOutput()).trimmed().split(' ');
            QCOMPARE(numbers.size(), 3);
            for (int i = 0; i < 3; ++i)
                totals[i] += numbers.at(i).toInt();
        }
        QVERIFY(Service::stop(m_service));
        std::sort(samples.begin(), samples.end());
        qInfo("%d files indexed in %lld ms; loop round trip max %d ms, p99 %d ms over %d calls; -wal %lld KiB when done, "
              "%lld KiB %lld ms later", m_files, doneAt, samples.last(), samples.at(samples.size() * 99 / 100), int(samples.size()),
              walEnd / 1024, wal / 1024, timer.elapsed() - doneAt);
        qInfo("readers: %d queries, %d failed, %d wrong", totals[0], totals[1], totals[2]);
        QVERIFY(wal <= MaxLogSize);
        // A writer waiting on a reader's lock would stall for the busy timeout, 5 s.
        QVERIFY2(samples.last() < 4500, qPrintable(QString::number(samples.last())));
        QVERIFY(totals[0] >= 2 * ReaderThreads * 3);
        QCOMPARE(totals[1], 0);
        QCOMPARE(totals[2], 0);
        QFile log(m_log);
        QVERIFY(log.open(QIODevice::ReadOnly));
        QVERIFY2(!log.peek(log.size()).contains("QSqlError"), log.readAll().constData());
    }
};

int main(int argc, char *argv[])
{
    QCoreApplication app(argc, argv);
    if (argc == 4 && qstrcmp(argv[1], "reader") == 0)
        return readerMain(app.arguments().at(2), app.arguments().at(3));
    tst_Readers test;
    QTEST_SET_MAIN_SOURCE_PATH
    return QTest::qExec(&test, argc, argv);
}

#include "tst_readers.moc"
