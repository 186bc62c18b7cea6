// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "installmanager.h"

#include "filemanager.h"
#include "queryagentdatabase.h"
#include "sysroot.h"

#include <QCoreApplication>
#include <QDateTime>
#include <QDebug>
#include <QDirIterator>
#include <QEvent>
#include <QFileInfo>
#include <QPair>
#include <QVector>

#include <algorithm>

namespace {

const char *const ConstructorSignature = "InstallManager::InstallManager(QueryAgentDatabase&, QObject*)";
const char *const ScanSignature = "bool InstallManager::scanInstallDirectory()";
const char *const InstallSignature = "bool InstallManager::install(const QString&, const QString&, bool)";
const char *const FavoriteSignature = "bool InstallManager::setFavorite(const QString&, bool)";

const char *const SelectChildDirectories = "SELECT id, path FROM directory WHERE parentId = ? ORDER BY path ASC;";
const char *const UpdateFavorite = "UPDATE themelet SET favorite = ? WHERE homeWallpaper = ?;";

const QEvent::Type UpdateEvent = QEvent::UpdateRequest;

// Name below the install directory, as the sort key of the merge.
QByteArray keyBelow(const QString &parent, const QString &path)
{
    return path.mid(parent.size() + 1).toUtf8();
}

}

struct InstallManager::FileEntry
{
    QByteArray key;
    QString filePath;
    QString fileName;
    QString mimeType;
    QDateTime modificationTime;
};

InstallManager::InstallManager(QueryAgentDatabase &database, QObject *parent)
    : QObject(parent)
    , QueryActor(database)
    , m_fileQuery(database)
    , m_fileInsert(database)
    , m_fileSyncUpdate(database)
    , m_fileSyncDelete(database)
    , m_directoryIdQuery(database)
    , m_directoryInsert(database)
    , m_directoryUpdate(database)
    , m_directoryDelete(database)
    , m_zefIdQuery(database)
    , m_zefIdInsert(database)
    , m_zefIdUpdate(database)
    , m_updateQueued(false)
{
    m_timer.start();

    prepareStatements({
            { &m_fileQuery, "SELECT id, fileName, modificationTime FROM file WHERE directoryId = ? ORDER BY fileName ASC;",
              "Failed to prepare m_fileQuery." },
            { &m_fileInsert,
              "INSERT INTO file ( directoryId, mimeType, fileName, modificationTime, permissions, metadataCurrent) VALUES(?, ?, ?, ?, 1, 0)",
              "Failed to prepare m_fileInsert." },
            { &m_fileSyncUpdate, "UPDATE file SET modificationTime = ?, permissions = 1, metadataCurrent = 0 WHERE id = ?;",
              "Failed to prepare m_fileSyncUpdate." },
            // Never executed: install leaves gone files to the FileManager scan.
            { &m_fileSyncDelete, "DELETE FROM file WHERE id = ?;", "Failed to prepare m_fileSyncDelete." },
            { &m_directoryIdQuery, "SELECT id FROM directory WHERE path = ?;", "Failed to prepare m_directoryIdQuery." },
            { &m_directoryInsert, "INSERT INTO directory ( parentId, path, scope) VALUES (?, ?, ?);",
              "Failed to prepare m_directoryInsert." },
            { &m_directoryUpdate, "UPDATE directory SET parentId = ?, scope = ? WHERE id = ?;",
              "Failed to prepare m_directoryUpdate." },
            { &m_directoryDelete, "DELETE FROM directory WHERE id = ?;", "Failed to prepare m_directoryDelete." },
            { &m_zefIdQuery,
              "SELECT file.id, zefid.zefId FROM file LEFT JOIN zefid ON file.id = zefid.fileId WHERE directoryId = ? AND fileName = ?;",
              "Failed to prepare m_zefIdQuery." },
            { &m_zefIdInsert, "INSERT INTO zefid ( fileId, zefId) VALUES(?, ?)", "Failed to prepare m_zefIdInsert." },
            { &m_zefIdUpdate, "UPDATE zefid SET zefId = ? WHERE fileId = ?;", "Failed to prepare m_zefIdUpdate." },
    }, ConstructorSignature);

    refreshInstalls();
}

InstallManager::~InstallManager() = default;

QStringList InstallManager::installPaths()
{
    return { Sysroot::path(QStringLiteral("/usr/share/themelet")),
             Sysroot::path(QStringLiteral("/usr/share/sounds")) };
}

void InstallManager::appendDirectory(const QString &path)
{
    FileManager *files = FileManager::instance();
    if (!files || files->appendDirectory(path, FileManager::InstallScope, FileManager::ScanNew) == 0)
        return;
    m_pendingDirectories.append(path);
    queueUpdate();
}

void InstallManager::refreshInstalls()
{
    m_managers = { managerFromType(ThemeletContent::Themelet), managerFromType(7) };
    queueUpdate();
}

bool InstallManager::updateMetaData()
{
    return updateFirst(m_managers);
}

bool InstallManager::event(QEvent *event)
{
    if (event->type() != UpdateEvent)
        return QObject::event(event);

    // Install directories before packages, packages before reading.
    if (scanInstallDirectory()) {
        postUpdate();
    } else if (!m_pendingInstalls.isEmpty()) {
        install(m_pendingInstalls.takeFirst(), QString(), false);
        postUpdate();
    } else if (updateMetaData()) {
        postUpdate();
    } else {
        m_updateQueued = false;
    }
    return true;
}

void InstallManager::queueUpdate()
{
    if (!m_updateQueued)
        postUpdate();
}

void InstallManager::postUpdate()
{
    m_updateQueued = true;
    QCoreApplication::postEvent(this, new QEvent(UpdateEvent), 0);
}

bool InstallManager::scanInstallDirectory()
{
    if (m_pendingDirectories.isEmpty())
        return false;
    const QString path = m_pendingDirectories.takeFirst();

    qint64 id = 0;
    FileManager::DirectoryScope scope = FileManager::InstallScope;
    if (FileManager *files = FileManager::instance())
        files->watchDirectory(path, &id, &scope);
    if (id == 0)
        return !m_pendingDirectories.isEmpty();

    QVector<QPair<QByteArray, QString>> packages;
    QDirIterator iterator(path, QDir::Dirs | QDir::NoDotAndDotDot);
    while (iterator.hasNext()) {
        const QString packagePath = iterator.next();
        packages.append(qMakePair(keyBelow(path, packagePath), packagePath));
    }
    std::sort(packages.begin(), packages.end(), [](const auto &a, const auto &b) {
        return qstrcmp(a.first, b.first) < 0;
    });

    QSqlQuery children = prepareQuery(QString::fromLatin1(SelectChildDirectories));
    children.bindValue(0, id);
    if (!children.exec()) {
        warn(children, ScanSignature, "Failed to prepare execute query");
        return false;
    }

    QStringList newPaths;
    QVariantList knownIds;
    QVariantList deleteIds;
    int i = 0;
    bool gap = false;
    while (!gap && i < packages.size() && children.next()) {
        const QByteArray rowKey = keyBelow(path, children.value(1).toString());
        // New packages sort before the row; if they use up the list, the row
        // in hand is left alone until the next scan.
        while (i < packages.size() && qstrcmp(packages.at(i).first, rowKey) < 0) {
            newPaths.append(packages.at(i).second);
            m_pendingInstalls.append(packages.at(i).second);
            ++i;
        }
        if (i == packages.size()) {
            gap = true;
        } else if (qstrcmp(packages.at(i).first, rowKey) == 0) {
            m_pendingInstalls.append(children.value(1).toString());
            ++i;
        } else {
            deleteIds.append(children.value(0));
        }
    }
    while (children.next())
        deleteIds.append(children.value(0));
    children.finish();
    for (; i < packages.size(); ++i) {
        newPaths.append(packages.at(i).second);
        m_pendingInstalls.append(packages.at(i).second);
    }

    transaction();
    // The directory trigger takes the package's files and their rows along.
    if (!execBatch(m_directoryDelete, { deleteIds }, ScanSignature, "Failed to execute m_directoryDelete."))
        return false;

    // A package known as a root or under another parent is adopted, not duplicated.
    for (int n = 0; n < newPaths.size();) {
        m_directoryIdQuery.bindValue(0, newPaths.at(n));
        if (!m_directoryIdQuery.exec()) {
            // Deliberately no rollback: the transaction stays open.
            warn(m_directoryIdQuery, ScanSignature, "Failed to execute m_directoryIdQuery");
            return false;
        }
        if (m_directoryIdQuery.next()) {
            knownIds.append(m_directoryIdQuery.value(0));
            newPaths.removeAt(n);
        } else {
            ++n;
        }
        m_directoryIdQuery.finish();
    }

    for (const QString &newPath : qAsConst(newPaths)) {
        m_directoryInsert.bindValue(0, id);
        m_directoryInsert.bindValue(1, newPath);
        m_directoryInsert.bindValue(2, int(FileManager::PackageScope));
        if (!m_directoryInsert.exec()) {
            rollback(m_directoryInsert, ScanSignature, "Failed to execute m_directoryInsert.");
            return false;
        }
        m_directoryInsert.finish();
    }

    for (const QVariant &knownId : qAsConst(knownIds)) {
        m_directoryUpdate.bindValue(0, id);
        m_directoryUpdate.bindValue(1, int(FileManager::PackageScope));
        m_directoryUpdate.bindValue(2, knownId);
        if (!m_directoryUpdate.exec()) {
            rollback(m_directoryUpdate, ScanSignature, "Failed to execute m_directoryUpdate.");
            return false;
        }
        m_directoryUpdate.finish();
    }
    commit();

    if (!m_pendingInstalls.isEmpty())
        queueUpdate();
    return true;
}

bool InstallManager::install(const QString &path, const QString &zefId, bool force)
{
    // The scan queued here removes the rows of files that are gone; install
    // itself never deletes a file row.
    FileManager *files = FileManager::instance();
    const qint64 directoryId = files
            ? files->appendDirectory(path, FileManager::PackageScope, FileManager::ScanAlways)
            : 0;
    if (directoryId == 0)
        return false;

    QVector<FileEntry> entries;
    QStringList themeletNames;
    QDirIterator iterator(path, QDir::Files);
    while (iterator.hasNext()) {
        const QString filePath = iterator.next();
        const QFileInfo info = iterator.fileInfo();
        if (info.isDir())
            continue;
        const QString fileName = info.fileName();
        QString mimeType;
        if (fileName.endsWith(QLatin1String(".themelet"))) {
            mimeType = QStringLiteral("application/x-vorka-themelet");
            if (!zefId.isEmpty())
                themeletNames.append(fileName);
        } else if (fileName.endsWith(QLatin1String(".index"))) {
            mimeType = QStringLiteral("application/x-vorka-index");
        } else {
            continue;
        }
        entries.append({ fileName.toUtf8(), filePath, fileName, mimeType, modificationTime(info) });
    }
    std::sort(entries.begin(), entries.end(), [](const FileEntry &a, const FileEntry &b) {
        return qstrcmp(a.key, b.key) < 0;
    });

    m_fileQuery.bindValue(0, directoryId);
    if (!m_fileQuery.exec()) {
        warn(m_fileQuery, InstallSignature, "Failed to execute m_fileQuery");
        return false;
    }

    QVariantList updateTimes;
    QVariantList updateIds;
    QVariantList insertDirectoryIds;
    QVariantList insertMimeTypes;
    QVariantList insertFileNames;
    QVariantList insertTimes;
    const auto insert = [&](const FileEntry &entry) {
        insertDirectoryIds.append(directoryId);
        insertMimeTypes.append(entry.mimeType);
        insertFileNames.append(entry.fileName);
        insertTimes.append(entry.modificationTime);
    };

    int i = 0;
    while (i < entries.size() && m_fileQuery.next()) {
        const QByteArray rowKey = m_fileQuery.value(1).toString().toUtf8();
        while (i < entries.size() && qstrcmp(entries.at(i).key, rowKey) < 0)
            insert(entries.at(i++));
        // A row without a file is left to the scan queued above.
        if (i < entries.size() && qstrcmp(entries.at(i).key, rowKey) == 0) {
            if (force || entries.at(i).modificationTime != m_fileQuery.value(2).toDateTime()) {
                updateTimes.append(entries.at(i).modificationTime);
                updateIds.append(m_fileQuery.value(0));
            }
            ++i;
        }
    }
    m_fileQuery.finish();
    for (; i < entries.size(); ++i)
        insert(entries.at(i));

    transaction();
    if (!execBatch(m_fileSyncUpdate, { updateTimes, updateIds }, InstallSignature,
                   "Failed to execute m_fileSyncUpdate.")
            || !execBatch(m_fileInsert, { insertDirectoryIds, insertMimeTypes, insertFileNames, insertTimes },
                          InstallSignature, "Failed to execute m_fileInsert.")
            || !bindZefIds(directoryId, themeletNames, zefId)) {
        return false;
    }
    commit();

    if (!insertFileNames.isEmpty() || !updateIds.isEmpty())
        refreshInstalls();
    return true;
}

bool InstallManager::bindZefIds(qint64 directoryId, const QStringList &themeletNames, const QString &zefId)
{
    for (const QString &name : themeletNames) {
        m_zefIdQuery.bindValue(0, directoryId);
        m_zefIdQuery.bindValue(1, name);
        if (!m_zefIdQuery.exec()) {
            // Deliberately no rollback here.
            warn(m_zefIdQuery, InstallSignature, "Failed to prepare execute m_zefIdQuery");
            return false;
        }
        if (!m_zefIdQuery.next()) {
            qWarning("%s", InstallSignature);
            qWarning("Failed to query latest themelet file data!");
            continue;
        }
        // zefid keeps the 32-bit form of the file id.
        const int fileId = m_zefIdQuery.value(0).toInt();
        const QString present = m_zefIdQuery.value(1).toString();
        m_zefIdQuery.finish();

        if (present.isEmpty()) {
            m_zefIdInsert.bindValue(0, fileId);
            m_zefIdInsert.bindValue(1, zefId);
            if (!m_zefIdInsert.exec()) {
                rollback(m_zefIdInsert, InstallSignature, "Failed to execute m_zefIdInsert.");
                return false;
            }
            m_zefIdInsert.finish();
        } else if (present != zefId) {
            m_zefIdUpdate.bindValue(0, zefId);
            m_zefIdUpdate.bindValue(1, fileId);
            if (!m_zefIdUpdate.exec()) {
                rollback(m_zefIdUpdate, InstallSignature, "Failed to execute m_zefIdUpdate.");
                return false;
            }
            m_zefIdUpdate.finish();
        }
    }
    return true;
}

bool InstallManager::setFavorite(const QString &url, bool favorite)
{
    QSqlQuery query = prepareQuery(QString::fromLatin1(UpdateFavorite));
    query.bindValue(0, int(favorite));
    query.bindValue(1, url);
    if (!query.exec()) {
        qWarning("%s", FavoriteSignature);
        qWarning().noquote() << QStringLiteral("Failed to set favorite to value '")
                                        + (favorite ? QStringLiteral("true") : QStringLiteral("false"))
                                        + QStringLiteral("' for url '") + url + QStringLiteral("'");
        return false;
    }
    if (query.numRowsAffected() == 0) {
        qWarning("%s", FavoriteSignature);
        qWarning().noquote() << QStringLiteral("No themelet found with url '") + url + QStringLiteral("'");
        return false;
    }
    return true;
}
