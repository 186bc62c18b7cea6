// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef DOWNLOADMANAGER_H
#define DOWNLOADMANAGER_H

#include "contentmanager.h"
#include "queryactor.h"

#include <QSqlQuery>
#include <QUrl>

// Keeps the source URL of downloaded files. Not part of any update loop.
class DownloadManager : public ContentManager, public QueryActor
{
public:
    explicit DownloadManager(QueryAgentDatabase &database);
    ~DownloadManager() override;

    // Only the key "source" is looked at; without it there is nothing to do.
    bool save(qint64 id, const QMap<QString, QVariant> &properties) override;
    bool create(qint64 id, QUrl source);
    // Takes an int on purpose: it hides, and doesn't override, the virtual
    // remove(qint64), so removal through ContentManager* deletes nothing.
    bool remove(int id);

private:
    QSqlQuery m_insertDownload;
    QSqlQuery m_deleteDownload;
};

#endif
