#include "themeletinterface.h"

#include <QDBusConnection>

const char *const ThemeletInterface::s_serviceName = "com.vorka.themeletd";
const char *const ThemeletInterface::s_objectPath = "/com/vorka/themeletd";
const char *const ThemeletInterface::s_interfaceName = "com.vorka.themeletd";

namespace {
// The constructor is not public: the process-wide instance is the only one.
class ProcessInterface : public ThemeletInterface
{
};
Q_GLOBAL_STATIC(ProcessInterface, s_instance)
}

ThemeletInterface::ThemeletInterface()
    : QDBusAbstractInterface(QLatin1String(s_serviceName), QLatin1String(s_objectPath), s_interfaceName,
                             QDBusConnection::sessionBus(), nullptr)
{
}

ThemeletInterface *ThemeletInterface::instance()
{
    return s_instance.isDestroyed() ? nullptr : s_instance();
}

QDBusPendingReply<qlonglong> ThemeletInterface::createThemelet(const QString &url)
{
    return asyncCallWithArgumentList(QStringLiteral("createThemelet"), { url });
}

QDBusPendingReply<> ThemeletInterface::indexFile(const QString &url)
{
    return asyncCallWithArgumentList(QStringLiteral("indexFile"), { url });
}

QDBusPendingReply<> ThemeletInterface::installPackage(const QString &path)
{
    return asyncCallWithArgumentList(QStringLiteral("installPackage"), { path });
}

QDBusPendingReply<> ThemeletInterface::refreshThemelets()
{
    return asyncCallWithArgumentList(QStringLiteral("refreshThemelets"), {});
}

QDBusPendingReply<> ThemeletInterface::remove(int contentType, qlonglong contentId)
{
    return asyncCallWithArgumentList(QStringLiteral("remove"), { contentType, contentId });
}

QDBusPendingReply<> ThemeletInterface::saveAttributes(int contentType, qlonglong contentId, const QVariantMap &args)
{
    return asyncCallWithArgumentList(QStringLiteral("saveAttributes"), { contentType, contentId, args });
}

QDBusPendingReply<qlonglong> ThemeletInterface::setThemelet(const QString &url)
{
    return asyncCallWithArgumentList(QStringLiteral("setThemelet"), { url });
}

QDBusPendingReply<bool> ThemeletInterface::setFavorite(const QString &url, bool value)
{
    return asyncCallWithArgumentList(QStringLiteral("setFavorite"), { url, value });
}
