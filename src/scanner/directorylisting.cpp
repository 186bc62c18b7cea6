// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "directorylisting.h"

#include <QFile>

#include <algorithm>
#include <cstring>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

bool DirectoryListing::list(const QString &path, QVector<Entry> *files, QVector<Entry> *directories)
{
    const QString prefix = path.endsWith(QLatin1Char('/')) ? path : path + QLatin1Char('/');
    const QByteArray nativePrefix = QFile::encodeName(prefix);
    DIR *directory = ::opendir(nativePrefix.constData());
    if (!directory)
        return false;
    const int directoryFd = ::dirfd(directory);

    while (const struct dirent *entry = ::readdir(directory)) {
        const char *name = entry->d_name;
        if (name[0] == '.') // also "." and ".."
            continue;
        struct stat target;
        if (::fstatat(directoryFd, name, &target, 0) != 0)
            continue; // gone, or a broken link
        bool isLink = entry->d_type == DT_LNK;
        if (entry->d_type == DT_UNKNOWN) {
            struct stat own;
            if (::fstatat(directoryFd, name, &own, AT_SYMLINK_NOFOLLOW) != 0)
                continue;
            isLink = S_ISLNK(own.st_mode);
        }
        const bool isDirectory = S_ISDIR(target.st_mode);
        if (isDirectory ? isLink : !isLink && !S_ISREG(target.st_mode))
            continue;

        Entry listed;
        const size_t length = std::strlen(name);
        if (std::all_of(name, name + length, [](char c) { return uchar(c) < 0x80; })) {
            // ASCII reads the same in any file-name encoding.
            listed.name = QByteArray(name, int(length));
            listed.fileName = QString::fromLatin1(listed.name);
            listed.path = prefix + listed.fileName;
        } else {
            // Decoded as part of the whole path, as QDirIterator does: a name alone
            // would lose a leading U+FEFF as a byte order mark.
            const QByteArray nativePath = nativePrefix + name;
            listed.path = QFile::decodeName(nativePath);
            if (QFile::encodeName(listed.path) != nativePath || !listed.path.startsWith(prefix))
                continue;
            listed.fileName = listed.path.mid(prefix.size());
            listed.name = listed.fileName.toUtf8();
        }
        listed.modified = qint64(target.st_mtim.tv_sec) * 1000 + target.st_mtim.tv_nsec / 1000000;
        (isDirectory ? directories : files)->append(listed);
    }
    ::closedir(directory);
    return true;
}
