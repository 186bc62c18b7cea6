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
    m_typeOfTimer.insert(window.timerId, type);
}

void ChangeNotifier::timerEvent(QTimerEvent *event)
{
    const auto due = m_typeOfTimer.find(event->timerId());
    if (due == m_typeOfTimer.end())
        return QObject::timerEvent(event);
    const int type = *due;
    m_typeOfTimer.erase(due);
    killTimer(event->timerId());
    Window &window = m_windows[type];
    window.timerId = 0;
    send(type, window);
}

void ChangeNotifier::send(int type, Window &window)
{
    // Timed from the signal itself, so that a late turn of the loop can't
    // bring the next one closer than the interval.
    window.sent.start();
    emit contentChanged(type);
}
