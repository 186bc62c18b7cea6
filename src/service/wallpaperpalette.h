// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef WALLPAPERPALETTE_H
#define WALLPAPERPALETTE_H

#include <QColor>
#include <QImage>
#include <QString>

// The four colours of a themelet made from a picture. Deterministic: the same
// pixels always give the same colours.
//
// The picture is looked at as a copy of at most 64x64 pixels. Each pixel with
// saturation and value of at least 0.2 votes for its hue's 10-degree bin with
// the weight saturation * value; the heaviest bin (the lowest one on a tie)
// is the dominant hue, its centre the highlight's hue.
// - highlight: that hue at saturation 0.8, value 1.0
// - secondary highlight: the same hue at saturation 0.8, value 0.6
// - primary: white on a dark picture, black on a light one, by the mean
//   luma (0.299 R + 0.587 G + 0.114 B) against 0.5, so that text stays readable
// - secondary: the primary colour at alpha 0xA0
// A picture without colour (no pixel votes) gets a light and a mid grey as
// highlights.
class WallpaperPalette
{
public:
    explicit WallpaperPalette(const QImage &picture);

    // A down-scaled reading of the picture at path; null when it can't be read,
    // or when decoding it would take more than MaxDecodedPixels (`tooLarge`).
    static QImage readThumbnail(const QString &path, bool *tooLarge = nullptr);

    // 128 MiB as 32-bit pixels: a decompression bomb is refused from its header.
    static const qint64 MaxDecodedPixels = 32 * 1024 * 1024;

    bool isValid() const { return m_valid; }
    // -1 when the picture has no colour.
    int dominantHue() const { return m_hue; }

    QColor highlightColor() const { return m_highlight; }
    QColor secondaryHighlightColor() const { return m_secondaryHighlight; }
    QColor primaryColor() const { return m_primary; }
    QColor secondaryColor() const { return m_secondary; }

private:
    QColor m_highlight;
    QColor m_secondaryHighlight;
    QColor m_primary;
    QColor m_secondary;
    int m_hue = -1;
    bool m_valid = false;
};

#endif
