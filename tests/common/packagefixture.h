#ifndef PACKAGEFIXTURE_H
#define PACKAGEFIXTURE_H

#include "installmanager.h"

#include <QCoreApplication>
#include <QDateTime>
#include <QDir>
#include <QElapsedTimer>
#include <QEvent>
#include <QFile>
#include <QFileInfo>
#include <QTest>

// Packages on disk for the install loop, and the real event loop run until idle.
namespace PackageFixture {

inline InstallManager *installer()
{
    return static_cast<InstallManager *>(ContentManager::managerFromType(6));
}

// A name of its own for each test function and data row.
inline QString uniquePath(const QString &parent)
{
    QString name = QString::fromLatin1(QTest::currentTestFunction());
    if (QTest::currentDataTag())
        name += QLatin1Char('-') + QString::fromLatin1(QTest::currentDataTag()).replace(QLatin1Char(' '), QLatin1Char('-'));
    return parent + QLatin1Char('/') + name;
}

// Every write gets a modification time a second later than the one before, so
// that a change is seen however fast the test runs.
inline bool touch(QFile &file)
{
    static QDateTime s_time = QDateTime::currentDateTime().addDays(-1);
    s_time = s_time.addSecs(1);
    return file.flush() && file.setFileTime(s_time, QFileDevice::FileModificationTime);
}

inline bool write(const QString &path, const QByteArray &content)
{
    QDir().mkpath(QFileInfo(path).absolutePath());
    QFile file(path);
    return file.open(QIODevice::WriteOnly | QIODevice::Truncate) && file.write(content) == content.size()
            && touch(file);
}

class StepCounter : public QObject
{
public:
    int steps = 0;

protected:
    bool eventFilter(QObject *, QEvent *event) override
    {
        steps += event->type() == QEvent::UpdateRequest || event->type() == QEvent::SockAct;
        return false;
    }
};

// Until two whole rounds run no loop step (event 77) and no inotify read (50).
inline bool waitIdle()
{
    StepCounter counter;
    QCoreApplication::instance()->installEventFilter(&counter);
    QElapsedTimer timer;
    timer.start();
    int quietRounds = 0;
    while (quietRounds < 2 && timer.elapsed() < 120000) {
        counter.steps = 0;
        QCoreApplication::processEvents(QEventLoop::AllEvents);
        QCoreApplication::sendPostedEvents();
        quietRounds = counter.steps == 0 ? quietRounds + 1 : 0;
    }
    QCoreApplication::instance()->removeEventFilter(&counter);
    return quietRounds >= 2;
}

}

#endif
