#ifndef PACKAGEFIXTURE_H
#define PACKAGEFIXTURE_H

#include "installmanager.h"
#include "testdatabase.h"

#include <QtTest>

// Packages on disk for the install loop, and the real event loop run until idle.
namespace PackageFixture {

inline InstallManager *installer() { return static_cast<InstallManager *>(ContentManager::managerFromType(6)); }

// A name of its own for each test function and data row.
inline QString uniquePath(const QString &parent)
{
    return parent + QStringLiteral("/%1-%2").arg(QTest::currentTestFunction(), QTest::currentDataTag());
}

// Every write gets a modification time a second later than the one before, so
// that a change is seen however fast the test runs.
inline bool write(const QString &path, const QByteArray &content = QByteArray())
{
    static QDateTime s_time = QDateTime::currentDateTime().addDays(-1);
    QDir().mkpath(QFileInfo(path).absolutePath());
    QFile file(path);
    return file.open(QIODevice::WriteOnly | QIODevice::Truncate) && file.write(content) == content.size() && file.flush()
            && file.setFileTime(s_time = s_time.addSecs(1), QFileDevice::FileModificationTime);
}

inline bool writeTree(const QString &root, const QStringList &files, const QByteArray &content = QByteArray())
{
    return std::all_of(files.begin(), files.end(), [&](const QString &file) { return write(root + QLatin1Char('/') + file, content); });
}

inline QString directoryId(TestDatabase &db, const QString &path)
{
    return db.value(QStringLiteral("SELECT id FROM directory WHERE path = '%1'").arg(path)).toString();
}

// The file rows of a directory by name, the ZEF id at hand as `zefId`.
inline QStringList fileRows(TestDatabase &db, const QString &directory, const QString &columns)
{
    return db.rows(QStringLiteral("SELECT %1 FROM file LEFT JOIN zefId ON zefId.fileId = file.id WHERE directoryId = "
                                  "(SELECT id FROM directory WHERE path = '%2') ORDER BY fileName").arg(columns, directory));
}

// Until two whole rounds go by without a loop step (event 77) or an inotify read (50).
inline bool waitIdle()
{
    struct StepCounter : QObject {
        int steps = 0;
        bool eventFilter(QObject *, QEvent *event) override
        {
            steps += event->type() == QEvent::UpdateRequest || event->type() == QEvent::SockAct;
            return false;
        }
    } counter;
    QCoreApplication::instance()->installEventFilter(&counter);
    QElapsedTimer timer;
    timer.start();
    int quietRounds = 0;
    for (; quietRounds < 2 && !timer.hasExpired(120000); quietRounds = counter.steps ? 0 : quietRounds + 1) {
        counter.steps = 0;
        QCoreApplication::processEvents();
        QCoreApplication::sendPostedEvents();
    }
    QCoreApplication::instance()->removeEventFilter(&counter);
    return quietRounds >= 2;
}

}

#endif
