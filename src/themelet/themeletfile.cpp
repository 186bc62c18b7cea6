// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletfile.h"

#include "packagefile.h"

#include <QDateTime>
#include <QDebug>
#include <QJsonDocument>
#include <QJsonObject>
#include <QJsonParseError>

namespace {

QString normalisedTimestamp(const QJsonValue &value, const QString &fallback)
{
    const QDateTime timestamp = QDateTime::fromString(value.toString(), Qt::ISODate);
    return timestamp.isValid() ? timestamp.toString(Qt::ISODate) : fallback;
}

}

ThemeletFile::Status ThemeletFile::read(const QString &directory, const QString &fileName,
                                        const QString &batchTime)
{
    const QString path = directory + QLatin1Char('/') + fileName;
    // Too large is unreadable, not malformed: the row and the user's edits stay.
    QByteArray content;
    if (!PackageFile::read(path, &content))
        return Unreadable;

    QJsonParseError error { 0, QJsonParseError::NoError };
    const QJsonDocument document = QJsonDocument::fromJson(content, &error);
    if (document.isNull() || !document.isObject()) {
        qWarning() << "Failed to parse themelet file" << path << ", jsonError:" << int(error.error)
                   << ", jsonOffset:" << error.offset;
        parseError = error.error == QJsonParseError::NoError ? QStringLiteral("not a JSON object") : error.errorString();
        parseErrorOffset = error.error == QJsonParseError::NoError ? 0 : error.offset;
        return Malformed;
    }
    const QJsonObject object = document.object();
    keys = object.keys();

    // Removing the themelet deletes its wallpaper: it has to be a file of the package.
    this->directory = directory;
    wallpaper = PackageFile::text(object.value(QLatin1String("wallpaper")));
    wallpaperPath = PackageFile::fileInside(directory, QStringLiteral("images"), wallpaper);
    if (wallpaperPath.isEmpty())
        return Invalid;

    translationCatalog = PackageFile::text(object.value(QLatin1String("translationCatalog")));
    favorite = object.value(QLatin1String("favorite")).toBool(true);
    displayName = PackageFile::text(object.value(QLatin1String("displayName")));
    highlightColor = object.value(QLatin1String("highlightColor")).toVariant();
    secondaryHighlightColor = object.value(QLatin1String("secondaryHighlightColor")).toVariant();
    primaryColor = object.value(QLatin1String("primaryColor")).toVariant();
    // Plural in the file, singular everywhere else.
    secondaryColor = object.value(QLatin1String("secondaryColors")).toVariant();
    ringerVolume = object.value(QLatin1String("ringerVolume")).toInt(80);
    partnerSpace = PackageFile::text(object.value(QLatin1String("partnerSpace")));
    timestamp = normalisedTimestamp(object.value(QLatin1String("timestamp")), batchTime);
    // A "version" that is there but no whole number is 0, a missing one 1.
    version = object.contains(QLatin1String("version"))
            ? object.value(QLatin1String("version")).toInt(0) : 1;

    const QStringList keys = ThemeletTones::keys();
    for (int i = 0; i < ThemeletTones::Count; ++i) {
        const QJsonObject tone = object.value(keys.at(i) + QLatin1String("File")).toObject();
        tones[i] = Tone();
        if (tone.isEmpty())
            continue;
        tones[i].present = true;
        tones[i].file = PackageFile::text(tone.value(QLatin1String("file")));
        // Only a number counts: "enabled": false leaves the tone on.
        tones[i].enabled = tone.value(QLatin1String("enabled")).toInt(1);
    }
    return Valid;
}

QStringList ThemeletFile::knownKeys()
{
    QStringList known { QStringLiteral("wallpaper"), QStringLiteral("translationCatalog"),
                        QStringLiteral("favorite"), QStringLiteral("displayName"),
                        QStringLiteral("highlightColor"), QStringLiteral("secondaryHighlightColor"),
                        QStringLiteral("primaryColor"), QStringLiteral("secondaryColors"),
                        QStringLiteral("ringerVolume"), QStringLiteral("partnerSpace"),
                        QStringLiteral("timestamp"), QStringLiteral("version") };
    for (const QString &tone : ThemeletTones::keys())
        known << tone + QLatin1String("File");
    return known;
}

int ThemeletFile::enabledSounds() const
{
    int mask = -1;
    for (int i = 0; i < ThemeletTones::Count; ++i) {
        if (tones[i].present && tones[i].enabled == 0)
            mask &= ~(1 << i);
    }
    return mask;
}

QString ThemeletFile::tonePath(int tone, const QString &fallback) const
{
    const Tone &entry = tones[tone];
    if (!entry.present)
        return QString();
    if (!entry.file.isEmpty()) {
        // A path in "file", or a name that isn't a file of the package, is
        // refused outright, without falling back.
        return PackageFile::fileInside(directory, QStringLiteral("sounds"), entry.file);
    }
    return entry.enabled != 0 ? fallback : QString();
}
