// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef FILEMANAGER_H
#define FILEMANAGER_H

#include "contentmanager.h"
#include "mimetyper.h"
#include "queryactor.h"

#include <QElapsedTimer>
#include <QHash>
#include <QSocketNotifier>
#include <QSqlQuery>
#include <QStringList>

#include <functional>

// The manager of plain files. It is the socket notifier on its own inotify
// descriptor and drives the service's update loop: one directory scan or one
// metadata step per posted QEvent::UpdateRequest, no timers, no threads.
class FileManager : public QSocketNotifier, public ContentManager, public QueryActor
{
    Q_OBJECT
public:
    // Value of directory.scope: who decides what a directory holds.
    enum DirectoryScope {
        UserScope = 0,
        InstallScope = 1,
        PackageScope = 2,
        IndexScope = 3
    };

    // What appendDirectory does about scanning.
    enum Scan {
        NoScan = 0,
        ScanNew = 1,
        ScanAlways = 2
    };

    struct WatchedDirectory
    {
        QString path; // with one "/" appended
        qint64 id = 0;

        bool operator==(const WatchedDirectory &other) const { return path == other.path; }
    };

    FileManager(QueryAgentDatabase &database, QObject *parent);
    ~FileManager() override;

    bool updateMetaData() override;

    qint64 appendDirectory(const QString &path, DirectoryScope scope, Scan scan);
    bool watchDirectory(const QString &path, qint64 *id, DirectoryScope *scope);
    void clearWatches();
    qint64 insertFile(const QString &path);
    void scheduleUpdate();

    // The process's file manager, made on first use; ContentManager is not its
    // first base, so the pointer has to be converted.
    static FileManager *instance();

    // True, with a warning, for a directory that is now a symbolic link: links
    // to directories are never followed, also when swapped in after queueing.
    static bool isLinkedDirectory(const QString &path);

    // True while an update event is on its way or a pass is running.
    bool isUpdateQueued() const { return m_updateQueued; }
    // Directories queued for a scan.
    int pendingDirectoryCount() const { return m_pendingDirectories.size(); }

protected:
    bool event(QEvent *event) override;

private:
    qint64 findOrInsert(QSqlQuery &lookup, const char *lookupFailure, QSqlQuery &insert,
                        const char *insertFailure, const std::function<void()> &bindInsert);
    bool readEvent();
    int watchOf(const QString &watchedPath) const;
    bool scanDirectory();
    void postUpdate();

    QSqlQuery m_fileQuery;
    QSqlQuery m_fileInsert;
    QSqlQuery m_fileSyncUpdate;
    QSqlQuery m_fileSyncDelete;
    QSqlQuery m_fileMonitorUpdate;
    QSqlQuery m_fileMonitorDelete;
    QSqlQuery m_directoryQuery;
    QSqlQuery m_directoryInsert;
    QSqlQuery m_directoryDelete;
    QSqlQuery m_directoryIdQuery;
    QSqlQuery m_fileIdQuery;
    QSqlQuery m_directoryAppend;
    QSqlQuery m_directoryScopeUpdate;
    QSqlQuery m_directoryParentUpdate;
    QStringList m_pendingDirectories;
    QHash<int, WatchedDirectory> m_watches;
    QHash<QString, int> m_watchIds; // by path: a lookup per scan, not a walk of all watches
    QList<ContentManager *> m_managers;
    MimeTyper m_mimeTyper;
    QElapsedTimer m_timer;
    int m_inotifyFd;
    bool m_initialized = false;
    bool m_updateQueued = false;
};

#endif
