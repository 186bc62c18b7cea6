// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PACKAGECHECKER_H
#define PACKAGECHECKER_H

#include <QString>
#include <QVector>

// Checks a package directory, a .themelet or an .index file with the engine's
// own readers, before it ships: what the engine would refuse, skip or ignore.
class PackageChecker
{
public:
    struct Problem
    {
        QString file;
        QString field; // empty for the file as a whole
        QString message;
    };

    void check(const QString &path);

    QVector<Problem> problems() const { return m_problems; }

private:
    void checkPackage(const QString &directory);
    void checkThemelet(const QString &path);
    void checkIndex(const QString &path);
    // The file is no larger than the readers take, and it can be read.
    bool checkReadable(const QString &path);
    void checkJson(const QString &path, const QString &error, int offset);
    void checkKeys(const QString &path, const QString &prefix, const QStringList &keys, const QStringList &known);
    void checkCatalogue(const QString &path, const QString &catalogue, const QString &localeSuffix);
    // Why `name` is no regular file of `directory` that stays inside `root`.
    void checkName(const QString &path, const QString &field, const QString &root, const QString &subdirectory,
                   const QString &name);
    void add(const QString &file, const QString &field, const QString &message);

    QVector<Problem> m_problems;
};

#endif
