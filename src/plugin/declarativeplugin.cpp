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

// The service defines the real one, and its definition wins over this one.
// A process that only loads the module never calls it, but a loader that
// binds every symbol at load time (LD_BIND_NOW, -z now) needs a definition.
__attribute__((weak)) void Content::signalChanged(int)
{
}
