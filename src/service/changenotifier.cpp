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
    const int type = window->type;
    const bool pending = window->pending;
    killTimer(event->timerId());
    m_timerOfType.remove(type);
    m_windows.erase(window);
    if (pending) {
        // A fresh timer rather than a repeating one: a late tick would let a
        // repeating timer catch up and send two signals less than an interval apart.
        notify(type);
    }
}
