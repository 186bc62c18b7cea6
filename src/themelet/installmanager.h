// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef INSTALLMANAGER_H
#define INSTALLMANAGER_H

#include "contentmanager.h"
#include "queryactor.h"

#include <QElapsedTimer>
#include <QList>
#include <QObject>
#include <QSqlQuery>
#include <QStringList>

class QueryAgentDatabase;

// Keeps the rows of read-only system packages in line with the disk: walks the
// install directories (one level, one package per subdirectory), installs each
// package's `.themelet` and `.index` files, and then drives ThemeletManager and
// IndexManager to read what became stale. A loop of its own, one step per event.
class InstallManager : public QObject, public ContentManager, public QueryActor
{
    Q_OBJECT
public:
    InstallManager(QueryAgentDatabase &database, QObject *parent);
    ~InstallManager() override;

    static QStringList installPaths();

    void appendDirectory(const QString &path);
    void refreshInstalls();
    bool scanInstallDirectory();

    bool install(const QString &path, const QString &zefId, bool force);
    bool setFavorite(const QString &url, bool favorite);

    bool updateMetaData() override;
    bool event(QEvent *event) override;

    // Install directories and packages queued for reading.
    int pendingCount() const { return m_pendingDirectories.size() + m_pendingInstalls.size(); }

private:
    struct FileEntry;

    void queueUpdate();
    void postUpdate();
    bool bindZefIds(qint64 directoryId, const QStringList &themeletNames, const QString &zefId);

    QSqlQuery m_fileQuery;
    QSqlQuery m_fileInsert;
    QSqlQuery m_fileSyncUpdate;
    QSqlQuery m_fileSyncDelete;
    QSqlQuery m_directoryIdQuery;
    QSqlQuery m_directoryInsert;
    QSqlQuery m_directoryUpdate;
    QSqlQuery m_directoryDelete;
    QSqlQuery m_zefIdQuery;
    QSqlQuery m_zefIdInsert;
    QSqlQuery m_zefIdUpdate;
    QElapsedTimer m_timer;
    QStringList m_pendingDirectories;
    QStringList m_pendingInstalls;
    QList<ContentManager *> m_managers;
    bool m_updateQueued;
};

#endif
