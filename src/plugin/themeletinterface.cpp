// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletinterface.h"

#include <QColor>
#include <QDBusConnection>
#include <QDBusMetaType>
#include <QDBusPendingCallWatcher>
#include <QDebug>
#include <QUrl>

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
    return asyncCallWithArgumentList(QStringLiteral("saveAttributes"), { contentType, contentId, dbusMap(args) });
}

QDBusPendingReply<qlonglong> ThemeletInterface::setThemelet(const QString &url)
{
    return asyncCallWithArgumentList(QStringLiteral("setThemelet"), { url });
}

QDBusPendingReply<bool> ThemeletInterface::setFavorite(const QString &url, bool value)
{
    return asyncCallWithArgumentList(QStringLiteral("setFavorite"), { url, value });
}

void ThemeletInterface::warnOnError(const QDBusPendingCall &call, const char *method, int contentType, qlonglong contentId)
{
    ThemeletInterface *owner = instance();
    if (!owner)
        return;
    auto *watcher = new QDBusPendingCallWatcher(call, owner);
    const QString what = QStringLiteral("%1(%2, %3):").arg(QLatin1String(method)).arg(contentType).arg(contentId);
    connect(watcher, &QDBusPendingCallWatcher::finished, watcher, [what](QDBusPendingCallWatcher *finished) {
        if (finished->isError())
            qWarning().noquote() << "Orbaline.Themelet: themeletd refused" << what << finished->error().message();
        finished->deleteLater();
    });
}

QVariant ThemeletInterface::dbusValue(const QVariant &value)
{
    switch (value.userType()) {
    case QMetaType::QColor:
        return value.value<QColor>().name(QColor::HexArgb);
    case QMetaType::QUrl:
        return value.toUrl().toString();
    case QMetaType::QVariantMap:
        return dbusMap(value.toMap());
    case QMetaType::QVariantList: {
        QVariantList list = value.toList();
        for (QVariant &item : list)
            item = dbusValue(item);
        return list;
    }
    default:
        if (QDBusMetaType::typeToSignature(value.userType()))
            return value;
        // libdbus aborts the process on a value that it can't write (an undefined
        // one from script, an object): such a value goes as its text, or empty.
        return value.canConvert<QString>() ? value.toString() : QString();
    }
}

QVariantMap ThemeletInterface::dbusMap(QVariantMap map)
{
    for (QVariant &value : map)
        value = dbusValue(value);
    return map;
}
