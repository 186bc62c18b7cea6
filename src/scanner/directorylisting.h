// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef DIRECTORYLISTING_H
#define DIRECTORYLISTING_H

#include <QByteArray>
#include <QString>
#include <QVector>

// One directory's entries as QDirIterator(path, Dirs | Files | NoDotAndDotDot)
// lists them, from readdir and one stat an entry: no hidden names, no names
// that aren't valid in the file-name encoding, no special files (a link to one
// is a file), no broken links. Times stay UTC instants.
class DirectoryListing
{
public:
    struct Entry
    {
        QByteArray name; // in UTF-8
        QString path;
        QString fileName;
        qint64 modified = 0; // milliseconds since the epoch, of the link's target
    };

    // Files (also links to them) and directories that are no links; false if
    // the directory can't be read.
    static bool list(const QString &path, QVector<Entry> *files, QVector<Entry> *directories);
};

#endif
