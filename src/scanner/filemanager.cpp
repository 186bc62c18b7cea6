// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "filemanager.h"

#include "content.h"
#include "directorylisting.h"
#include "queryagentdatabase.h"
#include "statementreader.h"

#include <QCoreApplication>
#include <QDebug>
#include <QFile>
#include <QFileInfo>
#include <QSqlError>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <memory>

#include <sys/inotify.h>
#include <sys/ioctl.h>
#include <unistd.h>

namespace {

const char *const ConstructorSignature = "FileManager::FileManager(QueryAgentDatabase&, QObject*)";
const char *const AppendSignature =
        "qint64 FileManager::appendDirectory(const QString&, FileManager::DirectoryScope, FileManager::Scan)";
const char *const WatchSignature =
        "bool FileManager::watchDirectory(const QString&, qint64*, FileManager::DirectoryScope*)";
const char *const ReadEventSignature = "bool FileManager::readEvent()";
const char *const ScanSignature = "bool FileManager::scanDirectory()";
const char *const InsertFileSignature = "qint64 FileManager::insertFile(const QString&)";

const uint32_t UserScopeMask = IN_MODIFY | IN_MOVED_FROM | IN_MOVED_TO | IN_CREATE | IN_DELETE
        | IN_DELETE_SELF | IN_MOVE_SELF | IN_DONT_FOLLOW;
const uint32_t InstallScopeMask = IN_MODIFY | IN_MOVED_FROM | IN_DELETE | IN_DELETE_SELF
        | IN_MOVE_SELF | IN_DONT_FOLLOW;
const uint32_t IndexScopeMask = IN_MODIFY | IN_DONT_FOLLOW;
static_assert(UserScopeMask == 0x2000fc2 && InstallScopeMask == 0x2000e42
                      && IndexScopeMask == 0x2000002,
              "inotify masks of the scopes");

const uint32_t SelfGoneMask = IN_DELETE_SELF | IN_MOVE_SELF;          // 0xc00
const uint32_t ArrivedMask = IN_CREATE | IN_MOVED_TO;                  // 0x180
const uint32_t LeftMask = IN_MOVED_FROM | IN_DELETE | IN_DELETE_SELF;  // 0x640

const int StackBufferSize = 4096;

// The watch limit is per user: explained once, as every later directory fails the same way.
bool s_watchLimitReported = false;

// One entry of a directory listing, keyed by its name in UTF-8.
using DiskEntry = DirectoryListing::Entry;

bool byName(const DiskEntry &a, const DiskEntry &b)
{
    return qstrcmp(a.name, b.name) < 0;
}

// Walks a directory listing sorted by UTF-8 bytes against rows in ORDER BY
// order. When the listing runs out on an entry that sorts before the current
// row, that row has been fetched and is left alone: only the rows after it
// count as gone.
template <typename RowName, typename OnNew, typename OnGone, typename OnSame>
void mergeSorted(StatementReader &rows, const QVector<DiskEntry> &entries, RowName rowName,
                 OnNew onNew, OnGone onGone, OnSame onSame)
{
    int i = 0;
    bool exhausted = entries.isEmpty();
    while (!exhausted && rows.next()) {
        const QByteArray name = rowName(rows);
        int order = 0;
        while ((order = qstrcmp(entries.at(i).name, name)) < 0) {
            onNew(entries.at(i));
            if (++i == entries.size()) {
                exhausted = true;
                break;
            }
        }
        if (order < 0)
            break;
        if (order > 0) {
            onGone(rows);
        } else {
            onSame(entries.at(i), rows);
            exhausted = ++i == entries.size();
        }
    }
    if (exhausted) {
        while (rows.next())
            onGone(rows);
    } else {
        for (; i < entries.size(); ++i)
            onNew(entries.at(i));
    }
}

}

FileManager::FileManager(QueryAgentDatabase &database, QObject *parent)
    : QSocketNotifier(inotify_init1(IN_NONBLOCK | IN_CLOEXEC), QSocketNotifier::Read, parent)
    , QueryActor(database)
    , m_fileQuery(database)
    , m_fileInsert(database)
    , m_fileSyncUpdate(database)
    , m_fileSyncDelete(database)
    , m_fileMonitorUpdate(database)
    , m_fileMonitorDelete(database)
    , m_directoryQuery(database)
    , m_directoryInsert(database)
    , m_directoryDelete(database)
    , m_directoryIdQuery(database)
    , m_fileIdQuery(database)
    , m_directoryAppend(database)
    , m_directoryScopeUpdate(database)
    , m_directoryParentUpdate(database)
    , m_inotifyFd(int(socket()))
{
    m_timer.start();

    if (m_inotifyFd < 0) {
        qWarning("%s", ConstructorSignature);
        qWarning("Failed to initialize inotify");
        return;
    }

    if (!constructorTransaction(ConstructorSignature))
        return;

    const bool prepared = prepareStatements({
            { &m_fileQuery, "SELECT id, fileName, modificationTime FROM file WHERE directoryId = ? ORDER BY fileName ASC;", "Failed to prepare m_fileQuery." },
            { &m_fileInsert, "INSERT INTO file ( directoryId, mimeType, fileName, modificationTime, permissions, metadataCurrent) VALUES (?, ?, ?, ?, 3, 0);", "Failed to prepare m_fileInsert." },
            { &m_fileSyncUpdate, "UPDATE file SET modificationTime = ?, metadataCurrent = 0 WHERE id = ?;", "Failed to prepare m_fileSyncUpdate." },
            { &m_fileSyncDelete, "DELETE FROM file WHERE id = ?;", "Failed to prepare m_fileSyncDelete." },
            { &m_fileMonitorUpdate, "UPDATE file SET modificationTime = ?, metadataCurrent = 0 WHERE directoryId = ? AND fileName = ?;", "Failed to prepare m_fileMonitorUpdate." },
            { &m_fileMonitorDelete, "DELETE FROM file WHERE directoryId = ? AND fileName = ?;", "Failed to prepare m_fileMonitorDelete." },
            { &m_directoryQuery, "SELECT id, path FROM directory WHERE parentId = ? ORDER BY path ASC;", "Failed to prepare m_directoryQuery." },
            { &m_directoryInsert, QStringLiteral("INSERT INTO directory ( parentId, path, scope) VALUES (?, ?, %1);").arg(int(UserScope)), "Failed to prepare m_directoryInsert." },
            { &m_directoryDelete, "DELETE FROM directory WHERE id = ?;", "Failed to prepare m_directoryDelete." },
            { &m_directoryIdQuery, "SELECT id, scope FROM directory WHERE path = ?;", "Failed to prepare m_directoryIdQuery." },
            { &m_fileIdQuery, "SELECT id FROM file WHERE directoryId = ? AND fileName = ?;", "Failed to prepare m_fileIdQuery." },
            { &m_directoryAppend, "INSERT INTO directory ( path, scope) VALUES(?, ?);", "Failed to prepare m_directoryAppend." },
            // Its failure has always been silent and leaves the transaction open.
            { &m_directoryScopeUpdate, "UPDATE directory SET scope = ? WHERE id = ?;", nullptr },
            { &m_directoryParentUpdate, "UPDATE directory SET parentId = ? WHERE id = ?;", "Failed to prepare m_directoryParentUpdate." },
        }, ConstructorSignature);
    if (!prepared)
        return;
    // The merges read each listing once, in order.
    m_fileQuery.setForwardOnly(true);
    m_directoryQuery.setForwardOnly(true);

    commit();
    m_initialized = true;

    // Watches are not stored: every start scans all roots again.
    QSqlQuery roots(database);
    if (roots.exec(QStringLiteral("SELECT path FROM directory WHERE parentId IS NULL;"))) {
        while (roots.next())
            m_pendingDirectories.append(roots.value(0).toString());
    } else {
        qWarning("%s", ConstructorSignature);
        qWarning("Failed to execute root path query");
        qWarning() << roots.lastError();
    }

    postUpdate();
}

FileManager::~FileManager()
{
    // Closing the descriptor ends all watches.
    if (m_inotifyFd >= 0)
        ::close(m_inotifyFd);
}

bool FileManager::event(QEvent *event)
{
    switch (event->type()) {
    case QEvent::SockAct:
        readEvent();
        return true;
    case QEvent::UpdateRequest:
        // Directories always go before metadata.
        if (scanDirectory() || updateMetaData()) {
            m_updateQueued = true;
            QCoreApplication::postEvent(this, new QEvent(QEvent::UpdateRequest), Qt::NormalEventPriority);
        } else {
            m_updateQueued = false;
        }
        return true;
    default:
        return QSocketNotifier::event(event);
    }
}

bool FileManager::updateMetaData()
{
    return updateFirst(m_managers);
}

void FileManager::scheduleUpdate()
{
    m_managers = scannerManagers();
    postUpdate();
}

void FileManager::postUpdate()
{
    if (m_updateQueued)
        return;
    m_updateQueued = true;
    QCoreApplication::postEvent(this, new QEvent(QEvent::UpdateRequest), Qt::NormalEventPriority);
}

qint64 FileManager::appendDirectory(const QString &path, DirectoryScope scope, Scan scan)
{
    if (!m_initialized || !QFile::exists(path))
        return 0;

    m_directoryIdQuery.bindValue(0, path);
    if (!m_directoryIdQuery.exec()) {
        warn(m_directoryIdQuery, AppendSignature, "Failed to execute m_directoryIdQuery");
        return 0;
    }

    qint64 id = 0;
    if (m_directoryIdQuery.next()) {
        id = m_directoryIdQuery.value(0).toLongLong();
        const int oldScope = m_directoryIdQuery.value(1).toInt();
        m_directoryIdQuery.finish();
        if (oldScope == scope) {
            if (scan != ScanAlways)
                return id;
        } else {
            m_directoryScopeUpdate.bindValue(0, int(scope));
            m_directoryScopeUpdate.bindValue(1, id);
            if (!m_directoryScopeUpdate.exec()) {
                warn(m_directoryScopeUpdate, AppendSignature, "Failed to execute m_directoryScopeUpdate.");
                return id;
            }
            m_directoryScopeUpdate.finish();

            // The next scan watches again, with the mask of the new scope.
            const int wd = watchOf(path + QLatin1Char('/'));
            if (wd != -1) {
                m_watches.remove(wd);
                m_watchIds.remove(path + QLatin1Char('/'));
                inotify_rm_watch(m_inotifyFd, wd);
            }
        }
    } else {
        m_directoryAppend.bindValue(0, path);
        m_directoryAppend.bindValue(1, int(scope));
        if (!m_directoryAppend.exec()) {
            warn(m_directoryAppend, AppendSignature, "Failed to execute m_directoryAppend");
            return 0;
        }
        id = m_directoryAppend.lastInsertId().toLongLong();
        m_directoryAppend.finish();
    }

    if (scan == NoScan)
        return id;

    m_pendingDirectories.append(path);
    postUpdate();
    return id;
}

bool FileManager::watchDirectory(const QString &path, qint64 *id, DirectoryScope *scope)
{
    m_directoryIdQuery.bindValue(0, path);
    if (!m_directoryIdQuery.exec()) {
        qWarning("%s", WatchSignature);
        qWarning("Failed to execute m_directoryIdQuery.");
        qWarning() << m_directoryIdQuery.lastError();
        return false;
    }
    if (!m_directoryIdQuery.next())
        return false;

    *id = m_directoryIdQuery.value(0).toLongLong();
    *scope = DirectoryScope(m_directoryIdQuery.value(1).toInt());
    m_directoryIdQuery.finish();

    if (*scope == PackageScope)
        return true;

    const QString watchedPath = path + QLatin1Char('/');
    // A live watch means the directory is in step already.
    if (watchOf(watchedPath) != -1)
        return false;

    uint32_t mask = IndexScopeMask;
    if (*scope == UserScope)
        mask = UserScopeMask;
    else if (*scope == InstallScope)
        mask = InstallScopeMask;

    const int wd = inotify_add_watch(m_inotifyFd, path.toUtf8().constData(), mask);
    if (wd >= 0) {
        m_watches[wd] = WatchedDirectory { watchedPath, *id };
        m_watchIds.insert(watchedPath, wd);
        return true;
    }
    const int error = errno;
    qWarning() << "Failed to add listener" << wd << path; // indexed, but not watched
    if (error == ENOSPC && !s_watchLimitReported) {
        s_watchLimitReported = true;
        qWarning("The inotify watch limit is reached: directories beyond it are indexed, but changes "
                 "in them are only seen at the next start. Raise fs.inotify.max_user_watches.");
    }
    return true;
}

void FileManager::clearWatches()
{
    for (auto it = m_watches.constBegin(); it != m_watches.constEnd(); ++it)
        inotify_rm_watch(m_inotifyFd, it.key());
    m_watches = QHash<int, WatchedDirectory>();
    m_watchIds = QHash<QString, int>();
}

bool FileManager::readEvent()
{
    int size = 0;
    ioctl(m_inotifyFd, FIONREAD, &size);

    alignas(struct inotify_event) char stackBuffer[StackBufferSize];
    std::unique_ptr<char, decltype(&std::free)> heapBuffer(nullptr, &std::free);
    char *buffer = stackBuffer;
    if (size > StackBufferSize) {
        heapBuffer.reset(static_cast<char *>(std::malloc(size_t(size))));
        if (!heapBuffer)
            qBadAlloc();
        buffer = heapBuffer.get();
    }

    const ssize_t length = ::read(m_inotifyFd, buffer, size_t(qMax(size, 0)));

    QVariantList updateTimes, updateDirectories, updateNames;
    QVariantList insertDirectories, insertTypes, insertNames, insertTimes;
    QVariantList directoryParents, directoryPaths;
    QVariantList deleteDirectories, deleteNames;
    QVariantList directoryDeletes;

    const size_t headerSize = sizeof(struct inotify_event);
    for (ssize_t offset = 0; length > 0 && size_t(length - offset) >= headerSize;) {
        struct inotify_event header;
        std::memcpy(&header, buffer + offset, headerSize);
        const char *nameBytes = buffer + offset + headerSize;
        const size_t nameSize = qMin<size_t>(header.len, size_t(length - offset) - headerSize);
        offset += ssize_t(headerSize + header.len);

        if (header.mask & IN_Q_OVERFLOW)
            qWarning("The inotify event queue overflowed: changes made meanwhile are only seen at the "
                     "next start. Raise fs.inotify.max_queued_events if this recurs.");

        const WatchedDirectory directory =
                m_watches.isEmpty() ? WatchedDirectory() : m_watches.value(header.wd);
        // Unknown watches, the overflow event (wd -1) and IN_IGNORED after a removal.
        if (directory.path.isEmpty())
            continue;

        QString name;
        if (header.len > 0) {
            const QByteArray bytes(nameBytes, int(strnlen(nameBytes, nameSize)));
            // Decoded as part of the whole path, as a scan's listing does: a name
            // alone would lose a leading U+FEFF as a byte order mark.
            const QByteArray pathBytes = QFile::encodeName(directory.path) + bytes;
            const QString decoded = QFile::decodeName(pathBytes);
            // A scan never lists such names, and the decoded path wouldn't lead back to the file.
            if (QFile::encodeName(decoded) != pathBytes || !decoded.startsWith(directory.path)) {
                qWarning() << "Skipping a file name that is not valid UTF-8" << directory.path << bytes;
                continue;
            }
            name = decoded.mid(directory.path.size());
        }
        const QString path = directory.path + name;

        if (header.mask & SelfGoneMask) {
            directoryDeletes << directory.id;
            if (!m_watches.isEmpty())
                m_watches.remove(header.wd);
            if (m_watchIds.value(directory.path, -1) == header.wd)
                m_watchIds.remove(directory.path);
            inotify_rm_watch(m_inotifyFd, header.wd);
        } else if (header.mask & IN_ISDIR) {
            // Directories moved in or out are ignored; a deleted one reports on its own watch.
            if (header.mask & IN_CREATE) {
                m_pendingDirectories.append(path);
                directoryParents << directory.id;
                directoryPaths << path;
            }
        } else if (header.mask & ArrivedMask) {
            m_fileIdQuery.bindValue(0, directory.id);
            m_fileIdQuery.bindValue(1, text(name));
            if (m_fileIdQuery.exec() && m_fileIdQuery.next()) {
                m_fileIdQuery.finish();
                updateTimes << storedModificationTime(path);
                updateDirectories << directory.id;
                updateNames << name;
            } else {
                m_fileIdQuery.finish();
                insertDirectories << directory.id;
                insertTypes << m_mimeTyper.typeOfFile(path);
                insertNames << name;
                insertTimes << storedModificationTime(path);
            }
        } else if (header.mask & LeftMask) {
            deleteDirectories << directory.id;
            deleteNames << name;
        } else if (header.mask & IN_MODIFY) {
            updateTimes << storedModificationTime(path);
            updateDirectories << directory.id;
            updateNames << name;
        }
    }

    if (!transaction()) {
        qWarning("%s", ReadEventSignature);
        qWarning("Failed to start transation");
    }

    // By kind, not in the order of the events: updates first, deletes last.
    if (!execBatch(m_fileMonitorUpdate, { updateTimes, updateDirectories, updateNames },
                   ReadEventSignature, "Failed to execute m_fileMonitorUpdate.")
        || !execBatch(m_fileInsert, { insertDirectories, insertTypes, insertNames, insertTimes },
                      ReadEventSignature, "Failed to execute m_fileInsert.")
        || !execBatch(m_directoryInsert, { directoryParents, directoryPaths }, ReadEventSignature,
                      "Failed to execute m_directoryInsert.")
        || !execBatch(m_fileMonitorDelete, { deleteDirectories, deleteNames }, ReadEventSignature,
                      "Failed to execute m_fileMonitorDelete.")
        || !execBatch(m_directoryDelete, { directoryDeletes }, ReadEventSignature,
                      "Failed to execute m_directoryDelete.")) {
        return false;
    }

    commit();
    postUpdate();
    Content::signalChanged(0);
    m_managers = scannerManagers();
    return true;
}

bool FileManager::scanDirectory()
{
    if (m_pendingDirectories.isEmpty())
        return false;

    const QString path = m_pendingDirectories.takeFirst();
    qint64 id = 0;
    DirectoryScope scope = UserScope;
    if (isLinkedDirectory(path) || !watchDirectory(path, &id, &scope))
        return !m_pendingDirectories.isEmpty();

    QVector<DiskEntry> files;
    QVector<DiskEntry> directories;
    // Also a link to a file: its own name, its target's time.
    DirectoryListing::list(path, &files, &directories);
    if (!files.isEmpty())
        std::sort(files.begin(), files.end(), byName);
    if (!directories.isEmpty())
        std::sort(directories.begin(), directories.end(), byName);

    QVariantList deleteIds;
    QVariantList updateTimes, updateIds;
    QVariantList insertDirectories, insertTypes, insertNames, insertTimes;

    m_fileQuery.bindValue(0, id);
    if (!m_fileQuery.exec()) {
        warn(m_fileQuery, ScanSignature, "Failed to execute m_fileQuery");
        return false;
    }
    // Read straight from the statement: over a restart's unchanged tree, Qt's
    // conversion of every column of every row was a quarter of the scan.
    StatementReader fileRows(m_fileQuery, true);
    mergeSorted(
            fileRows, files, [](const StatementReader &row) { return row.text(1).toUtf8(); },
            [&](const DiskEntry &file) {
                if (scope != UserScope)
                    return;
                insertDirectories << id;
                insertTypes << m_mimeTyper.typeOfFile(file.path, true);
                insertNames << file.fileName;
                insertTimes << timeText(file.modified);
            },
            [&](const StatementReader &row) { deleteIds << row.value(0); },
            [&](const DiskEntry &file, const StatementReader &row) {
                if (scope != UserScope && scope != InstallScope)
                    return;
                // The stored text is compared first: the instants only when it differs.
                const QString modified = timeText(file.modified);
                const QVariant stored = row.value(2);
                if (stored.toString() != modified
                    && QDateTime::fromMSecsSinceEpoch(file.modified, Qt::UTC) != stored.toDateTime()) {
                    updateTimes << modified;
                    updateIds << row.value(0);
                }
            });

    QVariantList directoryDeletes;
    QVariantList directoryParents, directoryPaths;
    QVariantList reparentParents, reparentIds;

    m_directoryQuery.bindValue(0, id);
    if (!m_directoryQuery.exec()) {
        warn(m_directoryQuery, ScanSignature, "Failed to execute m_directoryQuery");
        return false;
    }
    const int prefixSize = path.size() + 1;
    // Paths are queued before the transaction and stay queued after a rollback.
    StatementReader directoryRows(m_directoryQuery, true);
    mergeSorted(
            directoryRows, directories,
            [prefixSize](const StatementReader &row) { return row.text(1).mid(prefixSize).toUtf8(); },
            [&](const DiskEntry &directory) {
                if (scope != UserScope)
                    return;
                directoryParents << id;
                directoryPaths << directory.path;
                m_pendingDirectories.append(directory.path);
            },
            [&](const StatementReader &row) { directoryDeletes << row.value(0); },
            [&](const DiskEntry &, const StatementReader &row) {
                m_pendingDirectories.append(row.text(1));
            });

    transaction();

    if (!execBatch(m_directoryDelete, { directoryDeletes }, ScanSignature,
                   "Failed to execute m_directoryDelete."))
        return false;

    for (int i = 0; i < directoryPaths.size();) {
        m_directoryIdQuery.bindValue(0, directoryPaths.at(i));
        if (!m_directoryIdQuery.exec()) {
            rollback(m_directoryIdQuery, ScanSignature, "Failed to execute m_directoryIdQuery.");
            return false;
        }
        m_directoryIdQuery.finish();
        // next() after finish() never has a row, so a directory already known
        // under another parent is not adopted: its insert below fails on the
        // unique path and the scan of this directory rolls back.
        if (m_directoryIdQuery.next()) {
            reparentParents << id;
            reparentIds << m_directoryIdQuery.value(0);
            directoryParents.removeAt(i);
            directoryPaths.removeAt(i);
            continue;
        }
        ++i;
    }

    if (!execBatch(m_directoryInsert, { directoryParents, directoryPaths }, ScanSignature,
                   "Failed to execute m_directoryInsert.")
        || !execBatch(m_directoryParentUpdate, { reparentParents, reparentIds }, ScanSignature,
                      "Failed to execute m_directoryParentUpdate.")
        || !execBatch(m_fileSyncDelete, { deleteIds }, ScanSignature,
                      "Failed to execute m_fileSyncDelete.")
        || !execBatch(m_fileSyncUpdate, { updateTimes, updateIds }, ScanSignature,
                      "Failed to execute m_fileSyncUpdate.")
        || !execBatch(m_fileInsert, { insertDirectories, insertTypes, insertNames, insertTimes },
                      ScanSignature, "Failed to execute m_fileInsert.")) {
        return false;
    }

    commit();
    postUpdate();
    Content::signalChanged(0);
    m_managers = scannerManagers();
    return true;
}

// The id that the lookup finds, or else that of the row the insert makes, its
// values bound only then; 0 after a failure, which has been rolled back.
qint64 FileManager::findOrInsert(QSqlQuery &lookup, const char *lookupFailure, QSqlQuery &insert,
                                 const char *insertFailure, const std::function<void()> &bindInsert)
{
    if (!lookup.exec()) {
        rollback(lookup, InsertFileSignature, lookupFailure);
        return 0;
    }
    const bool found = lookup.next();
    const qint64 id = found ? lookup.value(0).toLongLong() : 0;
    lookup.finish();
    if (found)
        return id;
    bindInsert();
    if (!insert.exec()) {
        rollback(insert, InsertFileSignature, insertFailure);
        return 0;
    }
    const qint64 inserted = insert.lastInsertId().toLongLong();
    insert.finish();
    return inserted;
}

qint64 FileManager::insertFile(const QString &path)
{
    const QFileInfo info(path);
    if (!info.exists())
        return 0;

    transaction();

    const QString directory = info.absolutePath();
    m_directoryIdQuery.bindValue(0, directory);
    const qint64 directoryId = findOrInsert(m_directoryIdQuery, "Failed to execute m_directoryIdQuery.",
                                            m_directoryAppend, "Failed to execute m_directoryAppend.", [&]() {
        m_directoryAppend.bindValue(0, directory);
        m_directoryAppend.bindValue(1, int(InstallScope));
    });
    if (directoryId == 0)
        return 0;

    // Known or not: a watched directory is passed over, an unwatched one gets its watch.
    m_pendingDirectories.append(directory);
    postUpdate();

    m_fileIdQuery.bindValue(0, directoryId);
    m_fileIdQuery.bindValue(1, text(info.fileName()));
    const qint64 id = findOrInsert(m_fileIdQuery, "Failed to execute m_fileIdQuery.",
                                   m_fileInsert, "Failed to execute m_fileInsert.", [&]() {
        m_fileInsert.bindValue(0, directoryId);
        m_fileInsert.bindValue(1, m_mimeTyper.typeOfFile(info.filePath()));
        m_fileInsert.bindValue(2, text(info.fileName()));
        m_fileInsert.bindValue(3, storedModificationTime(info.filePath()));
    });
    if (id == 0)
        return 0;

    commit();
    return id;
}

int FileManager::watchOf(const QString &watchedPath) const
{
    // An entry whose watch now stands for another path is stale.
    const int wd = m_watchIds.value(watchedPath, -1);
    return wd != -1 && m_watches.value(wd).path == watchedPath ? wd : -1;
}

bool FileManager::isLinkedDirectory(const QString &path)
{
    if (!QFileInfo(path).isSymLink())
        return false;
    qWarning() << "Skipping a directory that is a symbolic link" << path;
    return true;
}

FileManager *FileManager::instance()
{
    return static_cast<FileManager *>(ContentManager::managerFromType(ThemeletContent::File));
}
