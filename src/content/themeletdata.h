// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETDATA_H
#define THEMELETDATA_H

#include "filedata.h"

#include <QColor>
#include <QDateTime>
#include <QVariantMap>

class ThemeletData : public FileData
{
public:
    enum Role {
        ContentIdRole = 0,
        UrlRole,
        MimeTypeRole,
        FileNameRole,
        ReadOnlyRole, // answered by FileData: the local path, kept as it always was
        DisplayNameRole,
        FavoriteRole,
        WallpaperUrlRole,
        ApplicationWallpaperUrlRole,
        PrimaryColorRole,
        SecondaryColorRole,
        HighlightColorRole,
        SecondaryHighlightColorRole,
        RingerVolumeRole,
        RingerToneEnabledRole,
        MessageToneEnabledRole,
        MailToneEnabledRole,
        InternetCallToneEnabledRole,
        ChatToneEnabledRole,
        CalendarToneEnabledRole,
        ClockAlarmToneEnabledRole,
        ResourcesRole,
        ZefIdRole,
        VersionRole
    };

    ThemeletData(qint64 id, const QUrl &url);

    ContentData *clone() const override;
    QVariant data(int role) const override;
    bool setData(int role, const QVariant &value) override;

    static QHash<int, QByteArray> roleNames();

    QString displayName;
    QString homeWallpaper;
    QString applicationWallpaper;
    QString partnerSpace;
    QString zefId;
    QColor highlightColor;
    QColor secondaryHighlightColor;
    QColor primaryColor;
    QColor secondaryColor;
    QDateTime timestamp;
    QVariantMap resources;
    int ringerVolume = 80;
    int enabledSounds = -1;
    int version = 2;
    bool favorite = false;
};

#endif
