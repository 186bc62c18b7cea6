// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "imagemanager.h"

#include "content.h"
#include "quillmetadata.h"
#include "queryagentdatabase.h"

#include "statementreader.h"

#include <QFile>
#include <qplatformdefs.h>
#include <QImageReader>

namespace {

const int BatchSize = 100;

const char *const ImageUpdateStatement =
        "INSERT OR REPLACE INTO image ( fileId, dateTaken, width, height, orientation) VALUES (?, ?, ?, ?, ?);";
const char *const ModifiedQueryStatement =
        "SELECT file.id, directory.path, file.fileName FROM file LEFT JOIN directory ON file.directoryId = directory.id WHERE file.metadataCurrent = 0 AND file.mimeType GLOB 'image/*' LIMIT 100;";
const char *const ModifiedResetStatement = "UPDATE file SET metadataCurrent = 1 WHERE id = ?;";

const char *const ConstructorSignature = "ImageManager::ImageManager(QueryAgentDatabase&)";
const char *const UpdateSignature = "virtual bool ImageManager::updateMetaData()";

}

ImageManager::ImageManager(QueryAgentDatabase &database)
    : QueryActor(database)
    , m_imageUpdate(database)
    , m_modifiedQuery(database)
    , m_modifiedReset(database)
{
    if (!constructorTransaction(ConstructorSignature)) {
        commit();
        return;
    }

    m_modifiedQuery.setForwardOnly(true);
    if (!m_imageUpdate.prepare(QLatin1String(ImageUpdateStatement))) {
        rollback(m_imageUpdate, ConstructorSignature, "Failed to prepare m_imageUpdate.");
    } else if (!m_modifiedQuery.prepare(QLatin1String(ModifiedQueryStatement))
               || !m_modifiedReset.prepare(QLatin1String(ModifiedResetStatement))) {
        // The reset statement has no text of its own.
        rollback(m_modifiedQuery, ConstructorSignature, "Failed to prepare m_modifiedQuery.");
    }
    commit();
}

ImageManager::~ImageManager() = default;

QString ImageManager::mimeType() const
{
    return QStringLiteral("image/*");
}

bool ImageManager::updateMetaData()
{
    if (!m_modifiedQuery.exec()) {
        warn(m_modifiedQuery, UpdateSignature, "Failed to execute m_modifiedQuery");
        return false;
    }

    // Files are read while no transaction is open.
    QVariantList ids;
    QVariantList dates;
    QVariantList widths;
    QVariantList heights;
    QVariantList orientations;
    for (QVariantList *list : { &ids, &dates, &widths, &heights, &orientations })
        list->reserve(BatchSize);
    StatementReader rows(m_modifiedQuery, true);
    while (rows.next()) {
        // A batch mostly shares one directory.
        const QString path = rows.repeatedText(1) + QLatin1Char('/') + rows.text(2);
        ids.append(rows.id(0));

        // Header only: -1 x -1 for anything unreadable, which still counts as read.
        // Only regular files: opening a FIFO would block the whole loop.
        QT_STATBUF status;
        const bool regular = QT_STAT(QFile::encodeName(path).constData(), &status) == 0 && S_ISREG(status.st_mode);
        const QSize size = regular ? QImageReader(path, QByteArray()).size() : QSize(-1, -1);
        widths.append(size.width());
        heights.append(size.height());

        const QuillMetadata metadata(path, QuillMetadata::AllFormats);
        dates.append(metadata.entry(QuillMetadata::DateTaken));
        orientations.append(metadata.entry(QuillMetadata::Orientation));
    }
    m_modifiedQuery.finish();

    if (ids.isEmpty())
        return false;

    transaction();

    if (!execBatch(m_modifiedReset, { ids }, UpdateSignature, "Failed to execute m_modifiedReset.")
        || !execBatch(m_imageUpdate, { ids, dates, widths, heights, orientations }, UpdateSignature,
                      "Failed to execute m_imageUpdate.")) {
        return false;
    }

    commit();
    Content::signalChanged(ThemeletContent::Photo);
    return ids.count() == BatchSize;
}
