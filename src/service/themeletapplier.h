// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETAPPLIER_H
#define THEMELETAPPLIER_H

#include "content.h"

#include <QStringList>
#include <QVariant>

// Carries a themelet to the device: its ringer volume, seven tone files and
// seven switches into the sound profile "themelet", and its four colours as
// "#AARRGGBB" strings to four keys of the key-value store:
//
//   /desktop/vorka/themelet/highlight_color
//   /desktop/vorka/themelet/secondary_highlight_color
//   /desktop/vorka/themelet/primary_color
//   /desktop/vorka/themelet/secondary_color
//
// A tone the themelet doesn't have is cleared from the profile, so that the
// profile's default sounds; an invalid colour resets its key. Only values that
// differ from the stored ones are written, so applying the same themelet again
// sends no change notices.
class ThemeletApplier
{
public:
    static const char *const ProfileName;

    static QStringList colorKeys();
    // The profile that was active before a themelet made "themelet" active.
    static QString previousProfileKey();
    // Profile keys of the tone files and of the switches, in the order of ThemeletTones::keys().
    static QStringList toneKeys();
    static QStringList switchKeys();
    static const char *volumeKey();

    bool apply(const Themelet &themelet);
    // Resets the colours and the profile "themelet" to its defaults.
    bool clear();

    // A themelet's sounds are heard: "themelet" becomes the active profile,
    // unless the user chose "silent"; the profile it replaces is remembered.
    void enterProfile();
    // No themelet is active any more: the remembered profile comes back if
    // "themelet" is still the active one.
    void leaveProfile();

private:
    static bool store(const QString &key, const QVariant &value);
};

#endif
