// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef DECLARATIVETHEMELET_H
#define DECLARATIVETHEMELET_H

#include "themeletsettings.h"

#include <QColor>
#include <QDBusPendingReply>
#include <QJSValue>
#include <QObject>
#include <QUrl>

class QDBusPendingCallWatcher;

// The Themelet singleton of QML: the active themelet and its wallpapers, and
// the requests to set or create one.
class DeclarativeThemelet : public QObject
{
    Q_OBJECT
    Q_PROPERTY(QUrl source READ source WRITE setSource NOTIFY sourceChanged)
    Q_PROPERTY(QUrl applicationWallpaper READ applicationWallpaper NOTIFY applicationWallpaperChanged)
    Q_PROPERTY(QUrl homeWallpaper READ homeWallpaper NOTIFY homeWallpaperChanged)
public:
    explicit DeclarativeThemelet(QObject *parent = nullptr);

    QUrl source() const;
    // Asks the service; the value changes when the settings do.
    void setSource(const QUrl &source);
    QUrl applicationWallpaper() const;
    QUrl homeWallpaper() const;

    // A callable callback gets the content id as a number once the service answers.
    Q_INVOKABLE void setThemelet(const QUrl &source, const QJSValue &callback = QJSValue());
    Q_INVOKABLE void create(const QUrl &source, const QJSValue &callback = QJSValue());

    Q_INVOKABLE QColor highlightDimmerColor(const QColor &color) const;
    Q_INVOKABLE QColor highlightBackgroundColor(const QColor &color) const;

signals:
    void sourceChanged();
    void applicationWallpaperChanged();
    void homeWallpaperChanged();

private slots:
    void callFinished(QDBusPendingCallWatcher *watcher);

private:
    void watch(const QDBusPendingReply<qlonglong> &reply, const QJSValue &callback);

    ThemeletSettings m_settings;
};

#endif
