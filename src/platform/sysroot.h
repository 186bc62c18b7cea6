// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef SYSROOT_H
#define SYSROOT_H

#include <QString>

// The fixed system paths (/usr/share/themelet, /usr/share/sounds, translations,
// profile defaults) are prefixed with $THEMELET_SYSROOT when it is set, so that
// tests and staged installs never touch the real system.
namespace Sysroot {
QString prefix();
QString path(const QString &fixedPath);
}

#endif
