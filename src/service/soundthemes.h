// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef SOUNDTHEMES_H
#define SOUNDTHEMES_H

#include <QSqlDatabase>
#include <QString>

// Sound themes under the install paths (a directory with an index.theme, as
// the system's freedesktop theme): their sound files are listed as tones,
// read-only like a package's. A package holds only .themelet and .index
// files, so the install scan alone would leave them out.
class SoundThemes
{
public:
    // Gives the sound files of every theme a row, and drops the rows of files
    // that are gone. Returns how many rows changed.
    static int update(QSqlDatabase &database);

private:
    static int updateDirectory(QSqlDatabase &database, const QString &directory);
};

#endif
