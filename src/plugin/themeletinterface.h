// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

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

    // What goes on the bus for a value: colours as "#AARRGGBB", URLs as text,
    // nothing that the bus can't carry. Maps and lists are converted entry by entry.
    static QVariant dbusValue(const QVariant &value);
    static QVariantMap dbusMap(QVariantMap map);

    // Writes from QML don't wait for their replies, and the caller keeps the
    // value it wrote; a call that fails is told once in the log, as
    // "Orbaline.Themelet: themeletd refused remove(1, 5): <the error>".
    static void warnOnError(const QDBusPendingCall &call, const char *method, int contentType, qlonglong contentId);

public slots:
    QDBusPendingReply<qlonglong> createThemelet(const QString &url);
    QDBusPendingReply<> indexFile(const QString &url);
    QDBusPendingReply<> installPackage(const QString &path);
    QDBusPendingReply<> refreshThemelets();
    QDBusPendingReply<> remove(int contentType, qlonglong contentId);
    // Values are sent in their D-Bus form.
    QDBusPendingReply<> saveAttributes(int contentType, qlonglong contentId, const QVariantMap &args);
    QDBusPendingReply<qlonglong> setThemelet(const QString &url);
    QDBusPendingReply<bool> setFavorite(const QString &url, bool value);

signals:
    void contentChanged(int type);

protected:
    ThemeletInterface();
};

#endif
