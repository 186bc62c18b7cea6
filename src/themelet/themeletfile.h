// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETFILE_H
#define THEMELETFILE_H

#include "themelettones.h"

#include <QString>
#include <QStringList>
#include <QVariant>

// What one .themelet file says, before its name is translated and its tones are
// registered. The file is input only: nothing ever writes one.
class ThemeletFile
{
public:
    enum Status {
        Unreadable, // can't be opened: not an error, the file just counts as read
        Malformed,  // no JSON object; logged
        Invalid,    // no usable wallpaper; not logged
        Valid
    };

    struct Tone
    {
        bool present = false; // an object with at least one key
        QString file;
        int enabled = 1;
    };

    // `batchTime` stands in for a missing or unparsable "timestamp".
    Status read(const QString &directory, const QString &fileName, const QString &batchTime);

    // The keys a file may have; others are ignored.
    static QStringList knownKeys();

    // All bits set but those of tones that say "enabled": 0.
    int enabledSounds() const;
    // The file a tone refers to: its own sound, the system's fallback, or none.
    QString tonePath(int tone, const QString &fallback) const;

    // Why a file is Malformed: the parser's error and its byte offset.
    QString parseError;
    int parseErrorOffset = -1;
    // The file's keys and its "wallpaper" as written, for diagnostics.
    QStringList keys;
    QString wallpaper;

    QString directory;
    QString wallpaperPath;
    QString translationCatalog;
    QString displayName;
    QVariant highlightColor;
    QVariant secondaryHighlightColor;
    QVariant primaryColor;
    QVariant secondaryColor;
    QString partnerSpace;
    QString timestamp;
    int favorite = 1;
    int ringerVolume = 80;
    int version = 1;
    Tone tones[ThemeletTones::Count];
};

#endif
