// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "downloadmanager.h"

#include "queryagentdatabase.h"

namespace {

const char *const InsertDownloadStatement = "INSERT OR REPLACE INTO download ( fileId, source) VALUES (?, ?);";
const char *const DeleteDownloadStatement = "DELETE FROM download WHERE fileId = ?;";

const char *const ConstructorSignature = "DownloadManager::DownloadManager(QueryAgentDatabase&)";

}

DownloadManager::DownloadManager(QueryAgentDatabase &database)
    : QueryActor(database)
    , m_insertDownload(database)
    , m_deleteDownload(database)
{
    if (constructorTransaction(ConstructorSignature)) {
        prepareStatements({
                { &m_insertDownload, InsertDownloadStatement, "Failed to prepare m_insertDownload." },
                { &m_deleteDownload, DeleteDownloadStatement, "Failed to prepare m_deleteDownload." },
        }, ConstructorSignature);
    }
    // Also after a failure, where it has nothing left to do.
    commit();
}

DownloadManager::~DownloadManager() = default;

bool DownloadManager::save(qint64 id, const QMap<QString, QVariant> &properties)
{
    const auto source = properties.constFind(QStringLiteral("source"));
    if (source == properties.constEnd())
        return true;
    return create(id, source->toUrl());
}

bool DownloadManager::create(qint64 id, QUrl source)
{
    m_insertDownload.bindValue(0, id);
    m_insertDownload.bindValue(1, QVariant(source));
    if (!m_insertDownload.exec()) {
        warn(m_insertDownload, "bool DownloadManager::create(qint64, QUrl)", "Failed to execute m_insertDownload.");
        return false;
    }
    m_insertDownload.finish();
    return true;
}

bool DownloadManager::remove(int id)
{
    m_deleteDownload.bindValue(0, id);
    if (!m_deleteDownload.exec()) {
        warn(m_deleteDownload, "bool DownloadManager::remove(int)", "Failed to execute m_deleteDownload.");
        return false;
    }
    m_deleteDownload.finish();
    return true;
}
