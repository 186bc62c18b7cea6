// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "wallpaperpalette.h"

#include <QImageReader>

namespace {

const int ThumbnailSize = 64;
const int BinCount = 36;
const qreal MinimumChroma = 0.2;

}

QImage WallpaperPalette::readThumbnail(const QString &path, bool *tooLarge)
{
    QImageReader reader(path);
    const QSize size = reader.size();
    // Only JPEG decodes at a reduced scale (down to an eighth of each side);
    // the other readers decode the whole picture and scale it afterwards.
    const qint64 divisor = reader.format() == "jpeg" ? 64 : 1;
    const bool large = size.isValid() && qint64(size.width()) * size.height() / divisor > MaxDecodedPixels;
    if (tooLarge)
        *tooLarge = large;
    if (large)
        return QImage();
    // Decoders such as JPEG scale while reading, which keeps big pictures cheap.
    if (size.isValid() && (size.width() > ThumbnailSize || size.height() > ThumbnailSize))
        reader.setScaledSize(size.scaled(ThumbnailSize, ThumbnailSize, Qt::KeepAspectRatio).expandedTo(QSize(1, 1)));
    QImage image = reader.read();
    if (image.isNull())
        return image;
    if (image.width() > ThumbnailSize || image.height() > ThumbnailSize)
        image = image.scaled(ThumbnailSize, ThumbnailSize, Qt::KeepAspectRatio, Qt::FastTransformation);
    return image;
}

WallpaperPalette::WallpaperPalette(const QImage &picture)
{
    if (picture.isNull())
        return;
    QImage image = picture;
    if (image.width() > ThumbnailSize || image.height() > ThumbnailSize)
        image = image.scaled(ThumbnailSize, ThumbnailSize, Qt::KeepAspectRatio, Qt::FastTransformation);
    image = image.convertToFormat(QImage::Format_ARGB32);

    qreal bins[BinCount] = {};
    qreal lumaSum = 0;
    const int pixels = image.width() * image.height();
    for (int y = 0; y < image.height(); ++y) {
        const QRgb *line = reinterpret_cast<const QRgb *>(image.constScanLine(y));
        for (int x = 0; x < image.width(); ++x) {
            const QColor color(line[x]);
            lumaSum += (0.299 * color.red() + 0.587 * color.green() + 0.114 * color.blue()) / 255.0;
            const qreal saturation = color.hsvSaturationF(), value = color.valueF();
            if (saturation < MinimumChroma || value < MinimumChroma || color.hsvHue() < 0)
                continue;
            bins[qMin(color.hsvHue() / 10, BinCount - 1)] += saturation * value;
        }
    }

    int best = -1;
    for (int i = 0; i < BinCount; ++i) {
        if (bins[i] > 0 && (best < 0 || bins[i] > bins[best]))
            best = i;
    }
    if (best >= 0) {
        m_hue = best * 10 + 5;
        m_highlight = QColor::fromHsvF(m_hue / 360.0, 0.8, 1.0);
        m_secondaryHighlight = QColor::fromHsvF(m_hue / 360.0, 0.8, 0.6);
    } else {
        m_highlight = QColor(0xe6, 0xe6, 0xe6);
        m_secondaryHighlight = QColor(0x96, 0x96, 0x96);
    }
    const bool dark = lumaSum / pixels < 0.5;
    m_primary = dark ? QColor(Qt::white) : QColor(Qt::black);
    m_secondary = m_primary;
    m_secondary.setAlpha(0xa0);
    m_valid = true;
}
