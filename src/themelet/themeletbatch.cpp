// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletbatch.h"

#include "queryagent.h"
#include "themeletfile.h"

#include <QSqlQuery>

namespace {

// Columns of an update entry.
enum Column {
    Id,
    DisplayName,
    Favorite,
    Timestamp,
    HomeWallpaper,
    ApplicationWallpaper,
    HighlightColor,
    SecondaryHighlightColor,
    PrimaryColor,
    SecondaryColor,
    RingerVolume,
    EnabledSounds,
    PartnerSpace,
    Version,
    ColumnCount
};

// The insert statement's positions.
const Column s_insertColumns[] = {
    Id, HomeWallpaper, ApplicationWallpaper, HighlightColor, SecondaryHighlightColor, PrimaryColor,
    SecondaryColor, RingerVolume, EnabledSounds, Favorite, PartnerSpace, Version
};
constexpr int s_insertColumnCount = sizeof(s_insertColumns) / sizeof(s_insertColumns[0]);

// The update statement's positions; the id comes last.
const Column s_updateColumns[] = {
    Favorite, Timestamp, HomeWallpaper, ApplicationWallpaper, HighlightColor, SecondaryHighlightColor,
    PrimaryColor, SecondaryColor, RingerVolume, EnabledSounds, PartnerSpace, Version, Id
};

// What an existing row keeps against the file, by column of the row.
const struct { Column column; int row; } s_keptColumns[] = {
    { Favorite, 2 }, { Timestamp, 3 }, { RingerVolume, 4 }, { EnabledSounds, 5 }, { PartnerSpace, 6 },
    { HighlightColor, 7 }, { SecondaryHighlightColor, 8 }, { PrimaryColor, 9 }, { SecondaryColor, 10 }
};

}

ThemeletBatch::ThemeletBatch()
    : m_update(ColumnCount)
    , m_insert(s_insertColumnCount)
{
}

void ThemeletBatch::addThemelet(qint64 id, const ThemeletFile &file, const QString &displayName)
{
    m_update[Id].append(id);
    m_update[DisplayName].append(displayName);
    m_update[Favorite].append(file.favorite);
    m_update[Timestamp].append(file.timestamp);
    m_update[HomeWallpaper].append(file.wallpaperPath);
    // A file never gives an application wallpaper, and a re-read clears it.
    m_update[ApplicationWallpaper].append(QVariant());
    m_update[HighlightColor].append(file.highlightColor);
    m_update[SecondaryHighlightColor].append(file.secondaryHighlightColor);
    m_update[PrimaryColor].append(file.primaryColor);
    m_update[SecondaryColor].append(file.secondaryColor);
    m_update[RingerVolume].append(file.ringerVolume);
    m_update[EnabledSounds].append(file.enabledSounds());
    m_update[PartnerSpace].append(file.partnerSpace);
    m_update[Version].append(file.version);
}

void ThemeletBatch::addResource(qint64 id, const QString &type, qint64 resourceId)
{
    m_resourceIds.append(id);
    m_resourceTypes.append(type);
    m_resourceFileIds.append(resourceId);
}

void ThemeletBatch::copyToInserts(int entry)
{
    for (int i = 0; i < s_insertColumnCount; ++i)
        m_insert[i].append(m_update.at(s_insertColumns[i]).at(entry));
}

void ThemeletBatch::merge(QSqlQuery &rows)
{
    const QVariantList &ids = m_update.at(Id);
    const int count = ids.size();
    int i = 0;
    bool haveRow = rows.next();
    // A row that matches no entry and isn't being deleted (a file that couldn't be
    // opened) sends every later entry to the inserts, where the primary key fails
    // and rolls the batch back. That is intended: the batch is retried as a whole.
    while (haveRow && i < count) {
        const qint64 rowId = QueryAgent::idFromColumn(rows, 0);
        if (rowId == ids.at(i).toLongLong()) {
            if (m_update.at(DisplayName).at(i).toString().isEmpty())
                m_update[DisplayName][i] = rows.value(1);
            for (const auto &kept : s_keptColumns)
                m_update[kept.column][i] = rows.value(kept.row);
            ++i;
            haveRow = rows.next();
        } else if (m_deleteIds.contains(rowId)) {
            haveRow = rows.next();
        } else {
            copyToInserts(i++);
        }
    }
    while (i < count)
        copyToInserts(i++);
}

bool ThemeletBatch::updates(qint64 id) const
{
    return m_update.at(Id).contains(id);
}

void ThemeletBatch::bindRead(QSqlQuery &reset) const
{
    reset.bindValue(0, m_readIds);
}

void ThemeletBatch::bindDeleted(QSqlQuery &deleteThemelet) const
{
    deleteThemelet.bindValue(0, m_deleteIds);
}

void ThemeletBatch::bindInserts(QSqlQuery &insertThemelet) const
{
    for (int i = 0; i < s_insertColumnCount; ++i)
        insertThemelet.bindValue(i, m_insert.at(i));
}

void ThemeletBatch::bindUpdates(QSqlQuery &updateFile, QSqlQuery &updateThemelet,
                                QSqlQuery &clearResources) const
{
    updateFile.bindValue(0, m_update.at(DisplayName));
    updateFile.bindValue(1, m_update.at(Id));
    int position = 0;
    for (Column column : s_updateColumns)
        updateThemelet.bindValue(position++, m_update.at(column));
    clearResources.bindValue(0, m_update.at(Id));
}

void ThemeletBatch::bindResources(QSqlQuery &insertResource) const
{
    insertResource.bindValue(0, m_resourceIds);
    insertResource.bindValue(1, m_resourceTypes);
    insertResource.bindValue(2, m_resourceFileIds);
}
