// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef QUILLMETADATA_H
#define QUILLMETADATA_H

#include <QString>
#include <QVariant>

#include <memory>

struct QuillMetadataPrivate;

// The picture tags that the index keeps, read from a file's EXIF block, or
// from its XMP packet when EXIF lacks the tag. A file that can't be read
// (missing, truncated, not a picture) simply has no tags.
class QuillMetadata
{
public:
    enum Tag {
        DateTaken = 6,   // QDateTime
        Orientation = 17 // int, the EXIF orientation code
    };

    // Bit 0 is not a format.
    enum Format {
        ExifFormat = 0x2,
        XmpFormat = 0x4,
        AllFormats = ~0x1
    };

    explicit QuillMetadata(const QString &fileName, int formats = AllFormats);
    ~QuillMetadata();

    // An invalid QVariant when the tag is absent or unreadable.
    QVariant entry(int tag) const;

private:
    std::unique_ptr<QuillMetadataPrivate> d;

    Q_DISABLE_COPY(QuillMetadata)
};

#endif
