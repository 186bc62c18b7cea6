// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETSETTINGS_H
#define THEMELETSETTINGS_H

#include "mgconfitem.h"

#include <QObject>
#include <QString>
#include <QUrl>

// The three configuration values that name the active themelet and the
// pictures of the home screen and of applications. Nothing is cached, and
// the setters emit nothing: every signal comes from the store, also for a
// change made through this very object.
class ThemeletSettings : public QObject
{
    Q_OBJECT
public:
    explicit ThemeletSettings(QObject *parent = nullptr);

    // The local path of the active themelet's file, as a url.
    QUrl source() const;
    // A url that isn't local stores an empty path.
    void setSource(const QUrl &source);

    QString applicationImagePath() const;
    void setApplicationImagePath(const QString &path);

    QString homeImagePath() const;
    void setHomeImagePath(const QString &path);

signals:
    void sourceChanged();
    void applicationImageChanged();
    void homeImageChanged();

private:
    MGConfItem m_sourceItem;
    MGConfItem m_applicationImageItem;
    MGConfItem m_homeImageItem;
};

#endif
