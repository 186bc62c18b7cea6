#ifndef THEMELETINTERFACE_H
#define THEMELETINTERFACE_H

#include <QDBusAbstractInterface>
#include <QDBusPendingReply>
#include <QVariantMap>

// The client side of themeletd on the session bus. One instance a process;
// every call is asynchronous, and a missing service ends each reply as an error.
class ThemeletInterface : public QDBusAbstractInterface
{
    Q_OBJECT
public:
    static const char *const s_serviceName;
    static const char *const s_objectPath;
    static const char *const s_interfaceName;

    // Null once the process has begun to exit.
    static ThemeletInterface *instance();

public slots:
    QDBusPendingReply<qlonglong> createThemelet(const QString &url);
    QDBusPendingReply<> indexFile(const QString &url);
    QDBusPendingReply<> installPackage(const QString &path);
    QDBusPendingReply<> refreshThemelets();
    QDBusPendingReply<> remove(int contentType, qlonglong contentId);
    QDBusPendingReply<> saveAttributes(int contentType, qlonglong contentId, const QVariantMap &args);
    QDBusPendingReply<qlonglong> setThemelet(const QString &url);
    QDBusPendingReply<bool> setFavorite(const QString &url, bool value);

signals:
    void contentChanged(int type);

protected:
    ThemeletInterface();
};

#endif
