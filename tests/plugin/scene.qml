// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// Loaded by qmlscene, as an interface developer would first try the module.
import QtQuick 2.0
import Orbaline.Themelet 1.0

Item {
    ThemeletModel {}
    PhotoModel {}
    ToneModel {}
    ContentInfo {}
    Profile {}
    property url wallpaper: Themelet.homeWallpaper
}
