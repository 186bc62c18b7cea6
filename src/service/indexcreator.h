// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef INDEXCREATOR_H
#define INDEXCREATOR_H

#include <QString>

// Makes the very first index whole or not at all: the schema is written into
// a file beside the index under another name, which is renamed into place only
// once it is complete. A kill at any moment leaves no index or a whole one.
class IndexCreator
{
public:
    // Creates the index at `path` if there is none. False only if a new one
    // could not be made; the writing connection then reports and handles it.
    static bool ensure(const QString &path);

    static QString temporaryPath(const QString &path);
};

#endif
