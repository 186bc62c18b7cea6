// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletcallbackwatcher.h"

ThemeletCallbackWatcher::ThemeletCallbackWatcher(const QDBusPendingCall &call, const QJSValue &callback,
                                                 QObject *parent)
    : QDBusPendingCallWatcher(call, parent)
    , m_callback(callback)
{
}
