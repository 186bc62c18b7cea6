// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETTONES_H
#define THEMELETTONES_H

#include <QStringList>

// The seven tones of a themelet. The index of a tone is its bit in
// themelet.enabledSounds, so the order is stored in every index and must never change.
namespace ThemeletTones {

constexpr int Count = 7;

// "ringerTone", "messageTone", ... The file and resource key is the tone key + "File",
// the key of save()'s map the tone key + "Enabled".
QStringList keys();

// Keys of the "fallback" sound profile that name the system's own tone, parallel to keys().
QStringList fallbackProfileKeys();

}

#endif
