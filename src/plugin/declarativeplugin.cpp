// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "declarativeplugin.h"

#include "content.h"
#include "contentinfo.h"
#include "declarativethemelet.h"
#include "photomodel.h"
#include "profilemanager.h"
#include "themeletmodel.h"
#include "tonemodel.h"

#include <QtQml>

void DeclarativePlugin::registerTypes(const char *uri)
{
    qmlRegisterSingletonType<DeclarativeThemelet>(uri, 1, 0, "Themelet", [](QQmlEngine *, QJSEngine *) -> QObject * {
        return new DeclarativeThemelet(nullptr);
    });
    qmlRegisterType<ThemeletModel>(uri, 1, 0, "ThemeletModel");
    qmlRegisterType<ContentInfo>(uri, 1, 0, "ContentInfo");
    qmlRegisterType<PhotoModel>(uri, 1, 0, "PhotoModel");
    qmlRegisterType<ToneModel>(uri, 1, 0, "ToneModel");
    qmlRegisterType<ProfileManager>(uri, 1, 0, "Profile");
}

void DeclarativePlugin::initializeEngine(QQmlEngine *, const char *)
{
}

// What moc writes for the IID and class name, plus "MetaData": {} (key 4, an empty CBOR map).
QT_PLUGIN_METADATA_SECTION
static constexpr unsigned char qt_pluginMetaData[] = {
    'Q', 'T', 'M', 'E', 'T', 'A', 'D', 'A', 'T', 'A', ' ', '!',
    0, QT_VERSION_MAJOR, QT_VERSION_MINOR, qPluginArchRequirements(),
    0xbf,
    0x02, 0x71, 'O', 'r', 'b', 'a', 'l', 'i', 'n', 'e', '.', 'T', 'h', 'e', 'm', 'e', 'l', 'e', 't',
    0x03, 0x71, 'D', 'e', 'c', 'l', 'a', 'r', 'a', 't', 'i', 'v', 'e', 'P', 'l', 'u', 'g', 'i', 'n',
    0x04, 0xa0,
    0xff,
};
QT_MOC_EXPORT_PLUGIN(DeclarativePlugin, DeclarativePlugin)

// Kept for clients without the service: the service (and themeletctl, the
// tests) define the real one, which wins over this one. A QML application
// that loads the module never calls it, but a loader that binds every symbol
// at load time (LD_BIND_NOW, a -z now link, as Debian's hardening does) refuses
// a library with an undefined one, and tst_module loads it that way.
__attribute__((weak)) void Content::signalChanged(int)
{
}
