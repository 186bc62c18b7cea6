// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef INDEXFIXTURE_H
#define INDEXFIXTURE_H

#include "dbmanager.h"
#include "filemanager.h"
#include "installmanager.h"
#include "messagelog.h"
#include "signalrecorder.h"
#include "testdatabase.h"

#include <QImage>
#include <QProcess>
#include <QtTest>

#include <sys/ioctl.h>

#include <ctime>

// Files on disk for the managers of the index, and the real event loop run until they are idle.
namespace Fixture {

// The index as the service's own connection makes it, for a TestDatabase to fill and read.
inline QString serviceIndex()
{
    DbManager::instance();
    return TestDatabase::indexPath();
}

// A name of its own for each test function and data row.
inline QString uniquePath(const QString &parent = qEnvironmentVariable("THEMELET_SANDBOX"))
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

// A 64x48 JPEG; tags are exiv2 modify commands.
inline bool writeJpeg(const QString &path, const QStringList &tags = {})
{
    QImage image(64, 48, QImage::Format_RGB32);
    image.fill(Qt::darkCyan);
    QStringList arguments;
    for (const QString &tag : tags)
        arguments << QStringLiteral("-M") << tag;
    return image.save(path, "JPG") && (tags.isEmpty() || QProcess::execute("exiv2", arguments << path) == 0);
}

// Bytes of inotify events that the manager hasn't read yet.
inline int pendingBytes(const FileManager &manager)
{
    int size = 0;
    ioctl(int(manager.socket()), FIONREAD, &size);
    return size;
}

// Until two whole rounds go by without a loop step (UpdateRequest) or an inotify read (SockAct).
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

// As after a journey: local time changes, file times don't.
inline void setTimeZone(const QByteArray &zone)
{
    qputenv("TZ", zone);
    tzset();
}

inline InstallManager *installer() { return static_cast<InstallManager *>(ContentManager::managerFromType(6)); }

// The install loop walks the directory, and all loops run until idle.
inline bool installFrom(const QString &directory)
{
    installer()->appendDirectory(directory);
    return waitIdle();
}

// The records of a failed statement, as patterns: function, message, error, statement.
inline QStringList failure(const char *function, const char *message, const QString &statement,
                           const QString &error = QString())
{
    return { '^' + QRegularExpression::escape(function) + '$', '^' + QRegularExpression::escape(message) + '$',
             "^QSqlError\\(.*" + QRegularExpression::escape(error), "^\"" + QRegularExpression::escape(statement) };
}

// The warnings match these patterns, in this order, and there are no others.
inline void compareWarnings(const MessageLog &log, const QStringList &patterns)
{
    QStringList warnings = log.warnings();
    for (int i = 0; i < qMin(warnings.size(), patterns.size()); ++i) {
        if (QRegularExpression(patterns.at(i)).match(warnings.at(i)).hasMatch())
            warnings[i] = patterns.at(i);
    }
    QCOMPARE(warnings, patterns);
}

}

#endif
