// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themelettones.h"

namespace ThemeletTones {

QStringList keys()
{
    return {
        QStringLiteral("ringerTone"),
        QStringLiteral("messageTone"),
        QStringLiteral("mailTone"),
        QStringLiteral("internetCallTone"),
        QStringLiteral("chatTone"),
        QStringLiteral("calendarTone"),
        QStringLiteral("clockAlarmTone"),
    };
}

QStringList fallbackProfileKeys()
{
    return {
        QStringLiteral("ringing.alert.tone"),
        QStringLiteral("sms.alert.tone"),
        QStringLiteral("email.alert.tone"),
        QStringLiteral("voip.alert.tone"),
        QStringLiteral("im.alert.tone"),
        QStringLiteral("calendar.alert.tone"),
        QStringLiteral("clock.alert.tone"),
    };
}

}
