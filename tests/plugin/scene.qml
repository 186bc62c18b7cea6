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
