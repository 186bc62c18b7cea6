#include "themeletfile.h"

#include <QDateTime>
#include <QDebug>
#include <QFile>
#include <QFileInfo>
#include <QJsonDocument>
#include <QJsonObject>
#include <QJsonParseError>

namespace {

// A themelet is a few hundred bytes; anything past this is cut off and fails to parse.
constexpr qint64 s_maximumSize = 4 * 1024 * 1024;

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
    // Only regular files: opening a FIFO would block the service.
    QFile file(path);
    if (!QFileInfo(path).isFile() || !file.open(QIODevice::ReadOnly))
        return Unreadable;

    QJsonParseError error { 0, QJsonParseError::NoError };
    // Only what the file holds: read(s_maximumSize) would allocate the whole limit each time.
    const QJsonDocument document = QJsonDocument::fromJson(file.read(qBound<qint64>(0, file.size(), s_maximumSize)), &error);
    if (document.isNull() || !document.isObject()) {
        qWarning() << "Failed to parse themelet file" << path << ", jsonError:" << int(error.error)
                   << ", jsonOffset:" << error.offset;
        return Malformed;
    }
    const QJsonObject object = document.object();

    const QString wallpaper = object.value(QLatin1String("wallpaper")).toString();
    if (wallpaper.isEmpty() || wallpaper.contains(QLatin1Char('/')))
        return Invalid;
    this->directory = directory;
    wallpaperPath = directory + QLatin1String("/images/") + wallpaper;
    if (!QFile::exists(wallpaperPath))
        return Invalid;

    translationCatalog = object.value(QLatin1String("translationCatalog")).toString();
    favorite = object.value(QLatin1String("favorite")).toBool(true);
    displayName = object.value(QLatin1String("displayName")).toString();
    highlightColor = object.value(QLatin1String("highlightColor")).toVariant();
    secondaryHighlightColor = object.value(QLatin1String("secondaryHighlightColor")).toVariant();
    primaryColor = object.value(QLatin1String("primaryColor")).toVariant();
    // Plural in the file, singular everywhere else.
    secondaryColor = object.value(QLatin1String("secondaryColors")).toVariant();
    ringerVolume = object.value(QLatin1String("ringerVolume")).toInt(80);
    partnerSpace = object.value(QLatin1String("partnerSpace")).toString();
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
        tones[i].file = tone.value(QLatin1String("file")).toString();
        // Only a number counts: "enabled": false leaves the tone on.
        tones[i].enabled = tone.value(QLatin1String("enabled")).toInt(1);
    }
    return Valid;
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
        // A path in "file" is refused outright, without falling back.
        return entry.file.contains(QLatin1Char('/'))
                ? QString() : directory + QLatin1String("/sounds/") + entry.file;
    }
    return entry.enabled != 0 ? fallback : QString();
}
