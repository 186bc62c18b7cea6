// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETCALLBACKWATCHER_H
#define THEMELETCALLBACKWATCHER_H

#include <QDBusPendingCallWatcher>
#include <QJSValue>

// A pending call of DeclarativeThemelet together with the script function
// that hears of its success.
class ThemeletCallbackWatcher : public QDBusPendingCallWatcher
{
    Q_OBJECT
public:
    ThemeletCallbackWatcher(const QDBusPendingCall &call, const QJSValue &callback, QObject *parent);

    QJSValue callback() const { return m_callback; }

private:
    QJSValue m_callback;
};

#endif
