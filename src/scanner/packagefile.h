// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PACKAGEFILE_H
#define PACKAGEFILE_H

#include <QByteArray>
#include <QJsonValue>
#include <QString>

// Names that package files (.themelet, .index) give for other files. A package
// may come from anyone: a name leads to a regular file in its place or to none.
class PackageFile
{
public:
    // A name of one path element: not empty, no "/", not "." or "..".
    static bool isPlainName(const QString &name);
    // directory/name if that is a plain name of a regular file, else empty.
    static QString regularFile(const QString &directory, const QString &name);
    // Like regularFile in package/subdirectory, and also empty when links lead
    // the file out of the package.
    static QString fileInside(const QString &package, const QString &subdirectory, const QString &name);

    // The string of a JSON value, null if it is none. JSON escapes can make
    // unpaired surrogates, which no encoding can store: each becomes U+FFFD.
    static QString text(const QJsonValue &value);

    // A package file is a few kilobytes; past this it is not read at all.
    static const qint64 MaximumSize = 4 * 1024 * 1024;
    // The whole of a regular file of at most MaximumSize bytes; false, with a
    // warning if it is too large, when it can't be read. Never blocks on a FIFO.
    static bool read(const QString &path, QByteArray *content);
};

#endif
