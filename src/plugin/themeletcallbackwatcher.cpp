#include "themeletcallbackwatcher.h"

ThemeletCallbackWatcher::ThemeletCallbackWatcher(const QDBusPendingCall &call, const QJSValue &callback,
                                                 QObject *parent)
    : QDBusPendingCallWatcher(call, parent)
    , m_callback(callback)
{
}
