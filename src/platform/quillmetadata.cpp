// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "quillmetadata.h"

#include <QDateTime>
#include <QFile>
#include <QFileInfo>

#include <exiv2/exiv2.hpp>

namespace {

// EXIF keeps local time without a zone; XMP uses ISO 8601.
QVariant exifDate(const Exiv2::Value &value)
{
    const QString text = QString::fromStdString(value.toString()).trimmed();
    const QDateTime date = QDateTime::fromString(text, QStringLiteral("yyyy:MM:dd HH:mm:ss"));
    return date.isValid() ? QVariant(date) : QVariant();
}

QVariant xmpDate(const Exiv2::Value &value)
{
    const QString text = QString::fromStdString(value.toString()).trimmed();
    const QDateTime date = QDateTime::fromString(text, Qt::ISODate);
    return date.isValid() ? QVariant(date) : QVariant();
}

QVariant number(const Exiv2::Value &value)
{
    const long result = value.toLong();
    return value.ok() ? QVariant(int(result)) : QVariant();
}

template <typename Data, typename Key>
QVariant read(const Data &data, const char *key, QVariant (*convert)(const Exiv2::Value &))
{
    const auto it = data.findKey(Key(key));
    if (it == data.end() || it->count() == 0)
        return QVariant();
    return convert(it->value());
}

void muteLibraryLog()
{
    // exiv2 writes its own complaints to stderr; a bad picture is not news here.
    static const bool muted = (Exiv2::LogMsg::setLevel(Exiv2::LogMsg::mute), true);
    Q_UNUSED(muted)
}

}

struct QuillMetadataPrivate
{
    std::unique_ptr<Exiv2::Image> image;
    int formats = 0;
};

QuillMetadata::QuillMetadata(const QString &fileName, int formats)
    : d(new QuillMetadataPrivate)
{
    muteLibraryLog();
    d->formats = formats;
    // Only regular files: opening a FIFO would block.
    if (!QFileInfo(fileName).isFile())
        return;
    try {
        std::unique_ptr<Exiv2::Image> image(
                Exiv2::ImageFactory::open(QFile::encodeName(fileName).toStdString()).release());
        if (image) {
            image->readMetadata();
            d->image = std::move(image);
        }
    } catch (...) {
        // Missing, truncated or not a picture: no tags.
    }
}

QuillMetadata::~QuillMetadata() = default;

QVariant QuillMetadata::entry(int tag) const
{
    if (!d->image)
        return QVariant();

    const char *exifKey = nullptr;
    const char *xmpKey = nullptr;
    QVariant (*fromExif)(const Exiv2::Value &) = nullptr;
    QVariant (*fromXmp)(const Exiv2::Value &) = nullptr;
    switch (tag) {
    case DateTaken:
        exifKey = "Exif.Photo.DateTimeOriginal";
        xmpKey = "Xmp.exif.DateTimeOriginal";
        fromExif = exifDate;
        fromXmp = xmpDate;
        break;
    case Orientation:
        exifKey = "Exif.Image.Orientation";
        xmpKey = "Xmp.tiff.Orientation";
        fromExif = number;
        fromXmp = number;
        break;
    default:
        return QVariant();
    }

    try {
        QVariant result;
        if (d->formats & ExifFormat)
            result = read<Exiv2::ExifData, Exiv2::ExifKey>(d->image->exifData(), exifKey, fromExif);
        if (!result.isValid() && (d->formats & XmpFormat))
            result = read<Exiv2::XmpData, Exiv2::XmpKey>(d->image->xmpData(), xmpKey, fromXmp);
        return result;
    } catch (...) {
        return QVariant();
    }
}
