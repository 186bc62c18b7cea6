// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETBATCH_H
#define THEMELETBATCH_H

#include <QVariantList>
#include <QVector>

class QSqlQuery;
class ThemeletFile;

// The working lists of one ThemeletManager::updateMetaData call, one list per
// bound column, so that every statement of the write phase is one execBatch.
class ThemeletBatch
{
public:
    ThemeletBatch();

    void addRead(qint64 id) { m_readIds.append(id); }
    void addDeleted(qint64 id) { m_deleteIds.append(id); }
    void addThemelet(qint64 id, const ThemeletFile &file, const QString &displayName);
    void addResource(qint64 id, const QString &type, qint64 resourceId);

    // Walks the rows that exist for the batch (id, displayName, favorite, timestamp,
    // ringerVolume, enabledSounds, partnerSpace, the four colours, version) in the
    // order of the batch. A row lends the user's values to its entry; entries that
    // the walk passes without a row are inserted as well.
    void merge(QSqlQuery &rows);

    int readCount() const { return m_readIds.size(); }
    bool hasDeleted() const { return !m_deleteIds.isEmpty(); }
    bool hasInserts() const { return !m_insert.first().isEmpty(); }
    bool hasUpdates() const { return !m_update.first().isEmpty(); }
    bool hasResources() const { return !m_resourceIds.isEmpty(); }
    bool updates(qint64 id) const;

    void bindRead(QSqlQuery &reset) const;
    void bindDeleted(QSqlQuery &deleteThemelet) const;
    void bindInserts(QSqlQuery &insertThemelet) const;
    void bindUpdates(QSqlQuery &updateFile, QSqlQuery &updateThemelet, QSqlQuery &clearResources) const;
    void bindResources(QSqlQuery &insertResource) const;

private:
    void copyToInserts(int entry);

    QVariantList m_readIds;
    QVariantList m_deleteIds;
    QVector<QVariantList> m_update;
    QVector<QVariantList> m_insert;
    QVariantList m_resourceIds;
    QVariantList m_resourceTypes;
    QVariantList m_resourceFileIds;
};

#endif
