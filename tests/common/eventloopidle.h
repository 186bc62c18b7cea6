#ifndef EVENTLOOPIDLE_H
#define EVENTLOOPIDLE_H

#include <QCoreApplication>
#include <QElapsedTimer>
#include <QEvent>
#include <QObject>

// Runs the real event loop until both update loops have stopped: two whole
// rounds in which no loop step (event 77) and no inotify read (event 50) ran.
namespace EventLoopIdle {

class StepCounter : public QObject
{
public:
    int steps = 0;

protected:
    bool eventFilter(QObject *, QEvent *event) override
    {
        if (event->type() == QEvent::UpdateRequest || event->type() == QEvent::SockAct)
            ++steps;
        return false;
    }
};

inline bool wait(int timeoutMs = 120000)
{
    StepCounter counter;
    QCoreApplication::instance()->installEventFilter(&counter);
    QElapsedTimer timer;
    timer.start();
    int quietRounds = 0;
    while (quietRounds < 2 && timer.elapsed() < timeoutMs) {
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
