// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETCONTENT_H
#define THEMELETCONTENT_H

namespace ThemeletContent {
// Held as int everywhere; the numbers are part of the D-Bus and QML interfaces.
// Fixed to int so that any number from the bus, -1 included, is a value.
enum Type : int {
    File = 0,
    Themelet = 1,
    Photo = 2,
    Video = 3,
    Download = 4
};
}

#endif
