// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexcreator.h"

#include "dbmanager.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QSqlDatabase>

#include <cstdio>
#include <fcntl.h>
#include <unistd.h>

namespace {

const char s_connection[] = "themeletd-new-index";

void removeTemporary(const QString &temporary)
{
    for (const char *suffix : { "", "-journal", "-wal", "-shm" })
        QFile::remove(temporary + QLatin1String(suffix));
}

bool createSchema(const QString &temporary)
{
    QSqlDatabase database = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QLatin1String(s_connection));
    database.setDatabaseName(temporary);
    // The default rollback journal: the write-ahead log is switched on later,
    // by the writing connection, under the final name.
    bool ok = database.open() && database.transaction();
    ok = ok && DbManager::createDatabaseSchema(database);
    ok = ok && database.commit();
    database.close();
    return ok;
}

void syncDirectory(const QString &directory)
{
    const int fd = ::open(QFile::encodeName(directory).constData(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (fd >= 0) {
        ::fsync(fd);
        ::close(fd);
    }
}

}

QString IndexCreator::temporaryPath(const QString &path)
{
    return path + QLatin1String(".new");
}

bool IndexCreator::ensure(const QString &path)
{
    const QString temporary = temporaryPath(path);
    // What a kill left half-made is never used.
    removeTemporary(temporary);
    if (QFileInfo::exists(path))
        return true;
    const QString directory = QFileInfo(path).absolutePath();
    if (!QDir().mkpath(directory))
        return false;

    const bool ok = createSchema(temporary);
    QSqlDatabase::removeDatabase(QLatin1String(s_connection));
    // rename() replaces atomically; a file that appeared meanwhile is whole too.
    if (!ok || ::rename(QFile::encodeName(temporary).constData(), QFile::encodeName(path).constData()) != 0) {
        qWarning("themeletd: could not create the index %s", qPrintable(temporary));
        removeTemporary(temporary);
        return false;
    }
    syncDirectory(directory);
    return true;
}
