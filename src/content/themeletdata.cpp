// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletdata.h"

#include "themeletcontent.h"

namespace {

QUrl wallpaperUrl(const QString &path)
{
    return path.isEmpty() ? QUrl() : QUrl::fromLocalFile(path);
}

QColor toColor(const QVariant &value)
{
    if (value.userType() == QMetaType::QColor)
        return value.value<QColor>();
    QVariant converted = value;
    if (!converted.convert(QMetaType::QColor))
        return QColor();
    return converted.value<QColor>();
}

}

ThemeletData::ThemeletData(qint64 id, const QUrl &url)
    : FileData(id, url, ThemeletContent::Themelet)
{
}

ContentData *ThemeletData::clone() const
{
    return new ThemeletData(*this);
}

QVariant ThemeletData::data(int role) const
{
    switch (role) {
    case DisplayNameRole: return displayName;
    case FavoriteRole: return favorite;
    case WallpaperUrlRole: return wallpaperUrl(homeWallpaper);
    case ApplicationWallpaperUrlRole: return wallpaperUrl(applicationWallpaper);
    case PrimaryColorRole: return primaryColor;
    case SecondaryColorRole: return secondaryColor;
    case HighlightColorRole: return highlightColor;
    case SecondaryHighlightColorRole: return secondaryHighlightColor;
    case RingerVolumeRole: return ringerVolume;
    case RingerToneEnabledRole:
    case MessageToneEnabledRole:
    case MailToneEnabledRole:
    case InternetCallToneEnabledRole:
    case ChatToneEnabledRole:
    case CalendarToneEnabledRole:
    case ClockAlarmToneEnabledRole:
        return bool(enabledSounds & (1 << (role - RingerToneEnabledRole)));
    case ResourcesRole: return resources;
    case ZefIdRole: return zefId;
    case VersionRole: return version;
    default: return FileData::data(role);
    }
}

bool ThemeletData::setData(int role, const QVariant &value)
{
    switch (role) {
    case DisplayNameRole: displayName = value.toString(); return true;
    case FavoriteRole: favorite = value.toBool(); return true;
    case PrimaryColorRole: primaryColor = toColor(value); return true;
    case SecondaryColorRole: secondaryColor = toColor(value); return true;
    case HighlightColorRole: highlightColor = toColor(value); return true;
    case SecondaryHighlightColorRole: secondaryHighlightColor = toColor(value); return true;
    case RingerVolumeRole: ringerVolume = value.toInt(); return true;
    case RingerToneEnabledRole:
    case MessageToneEnabledRole:
    case MailToneEnabledRole:
    case InternetCallToneEnabledRole:
    case ChatToneEnabledRole:
    case CalendarToneEnabledRole:
    case ClockAlarmToneEnabledRole: {
        const int bit = 1 << (role - RingerToneEnabledRole);
        enabledSounds = value.toBool() ? (enabledSounds | bit) : (enabledSounds & ~bit);
        return true;
    }
    case ResourcesRole: resources = value.toMap(); return true;
    default: return false; // wallpapers, zefId and version are not editable
    }
}

QHash<int, QByteArray> ThemeletData::roleNames()
{
    return {
        { ContentIdRole, "contentId" },
        { UrlRole, "url" },
        { MimeTypeRole, "mimeType" },
        { FileNameRole, "fileName" },
        { ReadOnlyRole, "readOnly" },
        { DisplayNameRole, "displayName" },
        { FavoriteRole, "favorite" },
        { WallpaperUrlRole, "wallpaperUrl" },
        { ApplicationWallpaperUrlRole, "applicationWallpaperUrl" },
        { PrimaryColorRole, "primaryColor" },
        { SecondaryColorRole, "secondaryColor" },
        { HighlightColorRole, "highlightColor" },
        { SecondaryHighlightColorRole, "secondaryHighlightColor" },
        { RingerVolumeRole, "ringerVolume" },
        { RingerToneEnabledRole, "ringerToneEnabled" },
        { MessageToneEnabledRole, "messageToneEnabled" },
        { MailToneEnabledRole, "mailToneEnabled" },
        { InternetCallToneEnabledRole, "internetCallToneEnabled" },
        { ChatToneEnabledRole, "chatToneEnabled" },
        { CalendarToneEnabledRole, "calendarToneEnabled" },
        { ClockAlarmToneEnabledRole, "clockAlarmToneEnabled" },
        { ResourcesRole, "resources" },
        { ZefIdRole, "zefId" },
        { VersionRole, "version" },
    };
}
