// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexmanager.h"

#include "content.h"
#include "filemanager.h"
#include "indexfile.h"
#include "queryagentdatabase.h"
#include "themelettranslator.h"

#include <QDateTime>
#include <QDebug>
#include <QFileInfo>
#include <QVector>

#include <algorithm>

namespace {

const char *const ConstructorSignature = "IndexManager::IndexManager(QueryAgentDatabase&)";
const char *const UpdateSignature = "virtual bool IndexManager::updateMetaData()";

const char *const SelectModifiedIndex =
        "SELECT file.id, directory.id, directory.path, file.fileName FROM file LEFT JOIN directory ON file.directoryId = directory.id WHERE file.metadataCurrent = 0 AND file.mimeType = 'application/x-vorka-index' LIMIT 1;";
const char *const UpdateDirectoryParent = "UPDATE directory SET parentId = ? WHERE id = ?";

// Far beyond any pack; a larger file is cut off here and fails to parse, instead
// of being read whole into memory.
constexpr qint64 s_maximumSize = 16 * 1024 * 1024;

}

struct IndexManager::Entry
{
    QByteArray name;
    QString path;
    QString fileName;
    QString displayName;
    QString category;
    QDateTime modificationTime;
};

struct IndexManager::Changes
{
    QVariantList deleteIds;

    QVariantList updateMimeTypes;
    QVariantList updateDisplayNames;
    QVariantList updateCategories;
    QVariantList updateTimes;
    QVariantList updateIds;

    QVariantList insertDirectoryIds;
    QVariantList insertMimeTypes;
    QVariantList insertFileNames;
    QVariantList insertDisplayNames;
    QVariantList insertCategories;
    QVariantList insertTimes;

    bool isEmpty() const
    {
        return deleteIds.isEmpty() && updateIds.isEmpty() && insertFileNames.isEmpty();
    }
};

IndexManager::IndexManager(QueryAgentDatabase &database)
    : QueryActor(database)
    , m_fileQuery(database)
    , m_fileInsert(database)
    , m_fileUpdate(database)
    , m_fileDelete(database)
    , m_modifiedReset(database)
    , m_renameQuery(database)
{
    // No transaction is open here: the rollback after a failure has nothing to undo.
    prepareStatements({
            { &m_fileQuery,
              "SELECT id, fileName, displayName, category, modificationTime FROM file WHERE directoryId = ? ORDER BY fileName ASC;",
              "Failed to prepare m_fileQuery." },
            { &m_fileInsert,
              "INSERT INTO file ( directoryId, mimeType, fileName, displayName, category, modificationTime, permissions, metadataCurrent) VALUES(?, ?, ?, ?, ?, ?, 1, 0)",
              "Failed to prepare m_fileInsert." },
            { &m_fileUpdate,
              "UPDATE file SET mimeType = ?, displayName = ?, category = ?, modificationTime = ?, metadataCurrent = 0 WHERE id = ?;",
              "Failed to prepare m_fileUpdate." },
            { &m_fileDelete, "DELETE FROM file WHERE id = ?;", "Failed to prepare m_fileDelete." },
            { &m_modifiedReset, "UPDATE file SET metadataCurrent = 1 WHERE id = ?;",
              "Failed to prepare m_modifiedReset." },
            { &m_renameQuery, "UPDATE file SET fileName = ? WHERE directoryId = ? AND fileName = ?;",
              "Failed to prepare m_renameQuery." },
    }, ConstructorSignature);
}

IndexManager::~IndexManager() = default;

bool IndexManager::updateMetaData()
{
    QSqlQuery selection = prepareQuery(QString::fromLatin1(SelectModifiedIndex));
    if (!selection.exec()) {
        warn(selection, UpdateSignature, "Failed to query modified indexes.");
        return false;
    }
    if (!selection.next())
        return false;

    const QVariant fileId = selection.value(0);
    const qint64 parentId = selection.value(1).toLongLong();
    const QString indexPath = selection.value(2).toString() + QLatin1Char('/') + selection.value(3).toString();
    selection.finish();

    // Marked read before reading: a file that can't be read or parsed waits
    // until it changes again instead of blocking every pass.
    m_modifiedReset.bindValue(0, fileId);
    if (!m_modifiedReset.exec()) {
        warn(m_modifiedReset, UpdateSignature, "Failed to execute m_modifiedReset.");
        return false;
    }
    m_modifiedReset.finish();

    IndexFile index;
    if (!index.read(indexPath))
        return true;

    FileManager *files = FileManager::instance();
    const QString &directory = index.directory;
    const qint64 directoryId = files && !FileManager::isLinkedDirectory(directory)
            ? files->appendDirectory(directory, FileManager::IndexScope, FileManager::NoScan)
            : 0;
    if (directoryId == 0)
        return true;

    // As a child of the index's own directory it is scanned and watched at the next start.
    QSqlQuery parentLink = prepareQuery(QString::fromLatin1(UpdateDirectoryParent));
    parentLink.bindValue(0, parentId);
    parentLink.bindValue(1, directoryId);
    if (!parentLink.exec())
        warn(parentLink, UpdateSignature, "Failed to set directory parent ID.");
    parentLink.finish();

    // A null suffix: Qt's default, so the locale's catalogues end in ".qm".
    ThemeletTranslator translator{QString()};
    translator.selectCatalog(index.translationCatalog);

    QVector<Entry> entries;
    QVector<QPair<QString, QString>> aliases;
    for (const IndexFile::Entry &read : qAsConst(index.entries)) {
        const QFileInfo info(read.path);

        Entry entry;
        entry.name = read.fileName.toUtf8();
        entry.path = read.path;
        entry.fileName = read.fileName;
        entry.displayName = translator.translate(read.displayName);
        entry.category = read.category;
        entry.modificationTime = modificationTime(info);

        for (const QString &oldName : read.aliases)
            aliases.append(qMakePair(oldName, read.fileName));
        entries.append(entry);
    }

    std::sort(entries.begin(), entries.end(), [](const Entry &a, const Entry &b) {
        return qstrcmp(a.name, b.name) < 0;
    });

    // Renames first, in a transaction of their own, so that a renamed file is
    // matched by the merge and keeps its id.
    if (!aliases.isEmpty()) {
        transaction();
        for (const auto &alias : qAsConst(aliases)) {
            m_renameQuery.bindValue(0, alias.second);
            m_renameQuery.bindValue(1, directoryId);
            m_renameQuery.bindValue(2, alias.first);
            if (!m_renameQuery.exec()) {
                rollback(m_renameQuery, UpdateSignature, "Failed to execute m_renameQuery.");
                return false;
            }
            m_renameQuery.finish();
        }
        commit();
    }

    m_fileQuery.bindValue(0, directoryId);
    if (!m_fileQuery.exec()) {
        warn(m_fileQuery, UpdateSignature, "Failed to execute m_fileQuery");
        return false;
    }

    Changes changes;
    merge(entries, directoryId, &changes);
    m_fileQuery.finish();

    if (!writeChanges(changes))
        return false;

    if (!changes.isEmpty())
        Content::signalChanged(ThemeletContent::File);
    // Pictures listed by an index wait for ImageManager, which runs in the other loop.
    if (files)
        files->scheduleUpdate();
    return true;
}

void IndexManager::merge(const QVector<Entry> &entries, qint64 directoryId, Changes *changes)
{
    if (entries.isEmpty()) {
        while (m_fileQuery.next())
            changes->deleteIds.append(m_fileQuery.value(0));
        return;
    }

    int i = 0;
    QString previous;
    // Steps over duplicates and inserts entries that sort before `name`, or all
    // remaining ones when `name` is null; false when the entries ran out.
    const auto insertBefore = [&](const QByteArray *name) {
        while (i < entries.size()) {
            const Entry &entry = entries.at(i);
            if (entry.fileName == previous) {
                qWarning("%s", UpdateSignature);
                qWarning() << "Duplicate fileName in .index file" << entry.fileName;
                ++i;
                continue;
            }
            if (name && qstrcmp(entry.name, *name) >= 0)
                return true;
            previous = entry.fileName;
            changes->insertDirectoryIds.append(directoryId);
            changes->insertMimeTypes.append(
                    m_mimeTyper.typeOfFile(entry.path));
            changes->insertFileNames.append(entry.fileName);
            changes->insertDisplayNames.append(entry.displayName);
            changes->insertCategories.append(entry.category);
            changes->insertTimes.append(entry.modificationTime);
            ++i;
        }
        return false;
    };

    while (i < entries.size() && m_fileQuery.next()) {
        const QByteArray rowName = m_fileQuery.value(1).toString().toUtf8();
        // A row in hand when the entries run out is neither compared nor
        // deleted in this pass; the next pass deletes it.
        if (!insertBefore(&rowName))
            break;

        const Entry &entry = entries.at(i);
        if (qstrcmp(entry.name, rowName) > 0) {
            changes->deleteIds.append(m_fileQuery.value(0));
            continue;
        }

        previous = entry.fileName;
        if (entry.modificationTime != m_fileQuery.value(4).toDateTime()
                || entry.displayName != m_fileQuery.value(2).toString()
                || entry.category != m_fileQuery.value(3).toString()) {
            changes->updateIds.append(m_fileQuery.value(0));
            changes->updateMimeTypes.append(
                    m_mimeTyper.typeOfFile(entry.path));
            changes->updateDisplayNames.append(entry.displayName);
            changes->updateTimes.append(entry.modificationTime);
            changes->updateCategories.append(entry.category);
        }
        ++i;
    }

    if (i >= entries.size()) {
        while (m_fileQuery.next())
            changes->deleteIds.append(m_fileQuery.value(0));
    } else {
        insertBefore(nullptr);
    }
}

bool IndexManager::writeChanges(const Changes &changes)
{
    transaction();
    if (!execBatch(m_fileDelete, { changes.deleteIds }, UpdateSignature, "Failed to execute m_fileDelete.")
            || !execBatch(m_fileUpdate,
                          { changes.updateMimeTypes, changes.updateDisplayNames, changes.updateCategories,
                            changes.updateTimes, changes.updateIds },
                          UpdateSignature, "Failed to execute m_fileUpdate.")
            || !execBatch(m_fileInsert,
                          { changes.insertDirectoryIds, changes.insertMimeTypes, changes.insertFileNames,
                            changes.insertDisplayNames, changes.insertCategories, changes.insertTimes },
                          UpdateSignature, "Failed to execute m_fileInsert.")) {
        return false;
    }
    commit();
    return true;
}
