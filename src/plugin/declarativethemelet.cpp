// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "declarativethemelet.h"

#include "themeletcallbackwatcher.h"
#include "themeletinterface.h"

#include <QDBusArgument>
#include <QQmlInfo>

namespace {

QColor hueOnly(const QColor &color, qreal value)
{
    QColor result;
    result.setHsvF(color.hueF(), 1.0, value, 1.0);
    return result.toRgb();
}

qlonglong replyId(const QVariant &value)
{
    if (value.userType() == qMetaTypeId<QDBusArgument>())
        return qdbus_cast<qlonglong>(value.value<QDBusArgument>());
    if (value.userType() == QMetaType::LongLong)
        return value.toLongLong();
    if (value.canConvert<qlonglong>())
        return value.toLongLong();
    return 0;
}

}

DeclarativeThemelet::DeclarativeThemelet(QObject *parent)
    : QObject(parent)
{
    connect(&m_settings, &ThemeletSettings::sourceChanged, this, &DeclarativeThemelet::sourceChanged);
    connect(&m_settings, &ThemeletSettings::applicationImageChanged, this,
            &DeclarativeThemelet::applicationWallpaperChanged);
    connect(&m_settings, &ThemeletSettings::homeImageChanged, this, &DeclarativeThemelet::homeWallpaperChanged);
}

QUrl DeclarativeThemelet::source() const
{
    return m_settings.source();
}

void DeclarativeThemelet::setSource(const QUrl &source)
{
    setThemelet(source);
}

QUrl DeclarativeThemelet::applicationWallpaper() const
{
    return QUrl::fromLocalFile(m_settings.applicationImagePath());
}

QUrl DeclarativeThemelet::homeWallpaper() const
{
    return QUrl::fromLocalFile(m_settings.homeImagePath());
}

void DeclarativeThemelet::setThemelet(const QUrl &source, const QJSValue &callback)
{
    ThemeletInterface *interface = ThemeletInterface::instance();
    if (interface)
        watch(interface->setThemelet(source.toString()), callback);
}

void DeclarativeThemelet::create(const QUrl &source, const QJSValue &callback)
{
    ThemeletInterface *interface = ThemeletInterface::instance();
    if (interface)
        watch(interface->createThemelet(source.toString()), callback);
}

void DeclarativeThemelet::watch(const QDBusPendingReply<qlonglong> &reply, const QJSValue &callback)
{
    // Without a function to tell, the reply is dropped unread.
    if (!callback.isCallable())
        return;
    auto *watcher = new ThemeletCallbackWatcher(reply, callback, this);
    connect(watcher, &QDBusPendingCallWatcher::finished, this, &DeclarativeThemelet::callFinished);
}

void DeclarativeThemelet::callFinished(QDBusPendingCallWatcher *watcher)
{
    watcher->deleteLater();
    const QDBusPendingReply<qlonglong> reply = *watcher;
    if (reply.isValid()) {
        QJSValue callback = static_cast<ThemeletCallbackWatcher *>(watcher)->callback();
        callback.call({ QJSValue(double(replyId(reply.argumentAt(0)))) });
    } else if (reply.isError()) {
        qmlInfo(this) << QStringLiteral("Error creating themelet: ") + reply.error().message();
    }
}

QColor DeclarativeThemelet::highlightDimmerColor(const QColor &color) const
{
    return hueOnly(color, 0.2);
}

QColor DeclarativeThemelet::highlightBackgroundColor(const QColor &color) const
{
    return hueOnly(color, 0.9);
}
