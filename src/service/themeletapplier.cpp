// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletapplier.h"

#include "dconfstore.h"
#include "profilestore.h"
#include "themeletcolor.h"
#include "themelettones.h"

#include <QDebug>

namespace {
const char *const SilentProfile = "silent";
}

const char *const ThemeletApplier::ProfileName = "themelet";

QStringList ThemeletApplier::colorKeys()
{
    return {
        QStringLiteral("/desktop/vorka/themelet/highlight_color"),
        QStringLiteral("/desktop/vorka/themelet/secondary_highlight_color"),
        QStringLiteral("/desktop/vorka/themelet/primary_color"),
        QStringLiteral("/desktop/vorka/themelet/secondary_color"),
    };
}

QString ThemeletApplier::previousProfileKey()
{
    return QStringLiteral("/desktop/vorka/themelet/previous_profile");
}

QStringList ThemeletApplier::toneKeys()
{
    // The fallback profile names the system's tones by the same keys.
    return ThemeletTones::fallbackProfileKeys();
}

QStringList ThemeletApplier::switchKeys()
{
    return toneKeys().replaceInStrings(QStringLiteral(".tone"), QStringLiteral(".enabled"));
}

const char *ThemeletApplier::volumeKey()
{
    return "ringing.alert.volume";
}

bool ThemeletApplier::store(const QString &key, const QVariant &value)
{
    DConfStore *settings = DConfStore::instance();
    if (!settings)
        return false;
    const QVariant current = settings->read(key);
    if (current.isValid() == value.isValid() && (!value.isValid() || current == value))
        return true;
    return settings->write(key, value);
}

bool ThemeletApplier::apply(const Themelet &themelet)
{
    if (themelet.isNull())
        return false;
    const QString profile = QLatin1String(ProfileName);
    bool ok = store(ProfileStore::valueKey(profile, QLatin1String(volumeKey())), themelet->ringerVolume);

    const QStringList tones = ThemeletTones::keys(), profileTones = toneKeys(), switches = switchKeys();
    for (int i = 0; i < ThemeletTones::Count; ++i) {
        const QUrl url = themelet->resources.value(tones.at(i) + QLatin1String("File")).toMap()
                                 .value(QStringLiteral("url")).toUrl();
        const QString path = url.isLocalFile() ? url.toLocalFile() : QString();
        ok &= store(ProfileStore::valueKey(profile, profileTones.at(i)), path.isEmpty() ? QVariant() : QVariant(path));
        const bool enabled = themelet->enabledSounds & (1 << i);
        ok &= store(ProfileStore::valueKey(profile, switches.at(i)), enabled);
    }

    const QColor colors[] = { themelet->highlightColor, themelet->secondaryHighlightColor,
                              themelet->primaryColor, themelet->secondaryColor };
    const QStringList keys = colorKeys();
    for (int i = 0; i < keys.size(); ++i)
        ok &= store(keys.at(i), colors[i].isValid() ? QVariant(colorToString(colors[i])) : QVariant());
    if (!ok)
        qWarning() << "Applying themelet" << themelet->url.toLocalFile() << "failed in part";
    return ok;
}

bool ThemeletApplier::clear()
{
    const QString profile = QLatin1String(ProfileName);
    bool ok = store(ProfileStore::valueKey(profile, QLatin1String(volumeKey())), QVariant());
    for (const QString &key : toneKeys() + switchKeys())
        ok &= store(ProfileStore::valueKey(profile, key), QVariant());
    for (const QString &key : colorKeys())
        ok &= store(key, QVariant());
    if (!ok)
        qWarning() << "Clearing the themelet's colours and sounds failed in part";
    return ok;
}

void ThemeletApplier::enterProfile()
{
    const QString active = ProfileStore::activeProfile();
    if (active == QLatin1String(ProfileName) || active == QLatin1String(SilentProfile))
        return;
    if (!store(previousProfileKey(), active) || !ProfileStore::setActiveProfile(QLatin1String(ProfileName)))
        qWarning() << "themeletd: the profile" << ProfileName << "could not be made active";
}

void ThemeletApplier::leaveProfile()
{
    DConfStore *settings = DConfStore::instance();
    if (!settings)
        return;
    const QString previous = settings->read(previousProfileKey()).toString();
    if (ProfileStore::activeProfile() == QLatin1String(ProfileName))
        ProfileStore::setActiveProfile(previous.isEmpty() ? QLatin1String(ProfileStore::DefaultProfile) : previous);
    store(previousProfileKey(), QVariant());
}
