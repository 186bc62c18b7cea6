// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef INDEXMANAGER_H
#define INDEXMANAGER_H

#include "contentmanager.h"
#include "mimetyper.h"
#include "queryactor.h"

#include <QSqlQuery>
#include <QVector>

class QueryAgentDatabase;

// Reads `.index` files: each describes the directory of the same name beside it
// (display names, categories, former names) and is merged into that
// directory's rows. Driven by InstallManager, one file a step.
class IndexManager : public ContentManager, public QueryActor
{
public:
    explicit IndexManager(QueryAgentDatabase &database);
    ~IndexManager() override;

    bool updateMetaData() override;

private:
    struct Entry;
    struct Changes;

    void merge(const QVector<Entry> &entries, qint64 directoryId, Changes *changes);
    bool writeChanges(const Changes &changes);

    QSqlQuery m_fileQuery;
    QSqlQuery m_fileInsert;
    QSqlQuery m_fileUpdate;
    QSqlQuery m_fileDelete;
    QSqlQuery m_modifiedReset;
    QSqlQuery m_renameQuery;
    MimeTyper m_mimeTyper;
};

#endif
