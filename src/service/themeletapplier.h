#ifndef THEMELETAPPLIER_H
#define THEMELETAPPLIER_H

#include "content.h"

#include <QStringList>

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
// profile's default sounds; an invalid colour resets its key.
class ThemeletApplier
{
public:
    static const char *const ProfileName;

    static QStringList colorKeys();
    // Profile keys of the tone files and of the switches, in the order of ThemeletTones::keys().
    static QStringList toneKeys();
    static QStringList switchKeys();
    static const char *volumeKey();

    bool apply(const Themelet &themelet);
};

#endif
