#include "changenotifier.h"

#include <QTimerEvent>

ChangeNotifier *ChangeNotifier::s_instance = nullptr;

ChangeNotifier::ChangeNotifier(int interval, QObject *parent)
    : QObject(parent)
    , m_interval(interval)
{
    s_instance = this;
}

ChangeNotifier::~ChangeNotifier()
{
    if (s_instance == this)
        s_instance = nullptr;
}

ChangeNotifier *ChangeNotifier::instance()
{
    return s_instance;
}

void ChangeNotifier::notify(int type)
{
    const auto open = m_timerOfType.constFind(type);
    if (open != m_timerOfType.constEnd()) {
        m_windows[*open].pending = true;
        return;
    }
    emit contentChanged(type);
    const int timerId = startTimer(m_interval, Qt::PreciseTimer);
    m_timerOfType.insert(type, timerId);
    m_windows.insert(timerId, { type, false });
}

void ChangeNotifier::timerEvent(QTimerEvent *event)
{
    const auto window = m_windows.find(event->timerId());
    if (window == m_windows.end())
        return QObject::timerEvent(event);
    if (window->pending) {
        // This notice opens the next window, timed from now: a repeating timer
        // keeps its phase, so after a late turn of the loop it would fire again
        // sooner than the interval.
        const int type = window->type;
        killTimer(event->timerId());
        m_windows.erase(window);
        const int timerId = startTimer(m_interval, Qt::PreciseTimer);
        m_timerOfType.insert(type, timerId);
        m_windows.insert(timerId, { type, false });
        emit contentChanged(type);
        return;
    }
    killTimer(event->timerId());
    m_timerOfType.remove(window->type);
    m_windows.erase(window);
}
