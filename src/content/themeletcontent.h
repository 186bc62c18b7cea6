#ifndef THEMELETCONTENT_H
#define THEMELETCONTENT_H

namespace ThemeletContent {
// Held as int everywhere; the numbers are part of the D-Bus and QML interfaces.
enum Type {
    File = 0,
    Themelet = 1,
    Photo = 2,
    Video = 3,
    Download = 4
};
}

#endif
