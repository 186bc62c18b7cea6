// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

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
    Window &window = m_windows[type];
    if (window.timerId)
        return;
    const qint64 age = window.sent.isValid() ? window.sent.elapsed() : m_interval;
    if (age >= m_interval) {
        send(type, window);
        return;
    }
    window.timerId = startTimer(int(m_interval - age), Qt::PreciseTimer);
}

void ChangeNotifier::timerEvent(QTimerEvent *event)
{
    // A few content types: a walk over them finds the timer's.
    for (auto window = m_windows.begin(); window != m_windows.end(); ++window) {
        if (window->timerId == event->timerId()) {
            killTimer(window->timerId);
            window->timerId = 0;
            send(window.key(), *window);
            return;
        }
    }
    QObject::timerEvent(event);
}

void ChangeNotifier::send(int type, Window &window)
{
    // Timed from the signal itself, so that a late turn of the loop can't
    // bring the next one closer than the interval.
    window.sent.start();
    emit contentChanged(type);
}
