// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef INDEXFILE_H
#define INDEXFILE_H

#include <QString>
#include <QStringList>
#include <QVector>

// What one .index file says about the directory of the same name beside it,
// before names are translated and merged into the index.
class IndexFile
{
public:
    struct Entry
    {
        QString fileName;
        QString path; // a regular file of the directory
        QString displayName; // untranslated
        QString category;
        QStringList aliases; // former names, none empty
    };

    // An entry of "files" that names no file of the directory.
    struct Skipped
    {
        enum Reason { NotAnObject, NotAPlainName, NoSuchFile };
        int position;
        QString fileName;
        Reason reason;
    };

    // False, with the same warning as always, when the file can't be read or
    // is no JSON object.
    bool read(const QString &indexPath);

    static QStringList knownKeys();
    static QStringList knownEntryKeys();

    QString directory;
    QString translationCatalog;
    QVector<Entry> entries;

    // For diagnostics: why reading failed, the keys as written, and what was left out.
    QString parseError;
    int parseErrorOffset = -1;
    QStringList keys;
    QVector<QStringList> entryKeys; // by position in "files"
    QVector<Skipped> skipped;
};

#endif
