// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletmanager.h"

#include "filemanager.h"
#include "profile.h"
#include "queryagent.h"
#include "queryagentdatabase.h"
#include "sysroot.h"
#include "themeletbatch.h"
#include "themeletcolor.h"
#include "themeletfile.h"
#include "themelettones.h"
#include "themelettranslator.h"

#include <QDateTime>
#include <QDebug>
#include <QFile>
#include <QSqlError>
#include <QStandardPaths>

#include <cstdlib>
#include <initializer_list>

namespace {

const char *const s_constructorFunction = "ThemeletManager::ThemeletManager(QueryAgentDatabase&, QObject*)";
const char *const s_updateFunction = "virtual bool ThemeletManager::updateMetaData()";
const char *const s_saveFunction = "virtual bool ThemeletManager::save(qint64, const QVariantMap&)";
const char *const s_removeFunction = "virtual bool ThemeletManager::remove(qint64)";
const char *const s_createFunction = "qint64 ThemeletManager::create(const Themelet&)";
const char *const s_zefIdFunction = "Themelet ThemeletManager::themeletFromZefId(const QString&)";
const char *const s_parseFunction = "Themelet ThemeletManager::parseThemelet(QSqlQuery*)";

const QString s_mimeType = QStringLiteral("application/x-vorka-themelet");

const QString s_queryThemelet = QStringLiteral(
        "SELECT file.displayName, themelet.favorite, themelet.timestamp, themelet.homeWallpaper, "
        "themelet.applicationWallpaper, themelet.highlightColor, themelet.secondaryHighlightColor, "
        "themelet.primaryColor, themelet.secondaryColor, themelet.ringerVolume, themelet.enabledSounds, "
        "themelet.partnerSpace, themelet.version, file.fileName, file.directoryId, "
        "directory.path || '/' || file.fileName FROM file INNER JOIN directory on file.directoryId = directory.id "
        "INNER JOIN themelet ON file.id = themelet.fileId WHERE file.id = ?;");
const QString s_queryThemeletByZefId = QStringLiteral(
        "SELECT file.id, directory.path || '/' || file.fileName, file.fileName, file.mimeType, "
        "file.displayName, file.permissions, themelet.favorite, themelet.homeWallpaper, "
        "themelet.applicationWallpaper, themelet.highlightColor, themelet.secondaryHighlightColor, "
        "themelet.primaryColor, themelet.secondaryColor, themelet.ringerVolume, themelet.enabledSounds, "
        "themelet.partnerSpace, themelet.version FROM file INNER JOIN directory on file.directoryId = directory.id "
        "INNER JOIN themelet ON file.id = themelet.fileId AND themelet.fileId = "
        "(SELECT fileId FROM zefid WHERE zefId = ?);");
const QString s_insertThemelet = QStringLiteral(
        "INSERT INTO themelet ( fileId, homeWallpaper, applicationWallpaper, highlightColor, "
        "secondaryHighlightColor, primaryColor, secondaryColor, ringerVolume, enabledSounds, favorite, "
        "partnerSpace, version) VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?);");
const QString s_updateFile = QStringLiteral("UPDATE file SET displayName = ? WHERE id = ?;");
const QString s_updateThemelet = QStringLiteral(
        "UPDATE themelet SET favorite = ?, timestamp = ?, homeWallpaper = ?, applicationWallpaper = ?, "
        "highlightColor = ?, secondaryHighlightColor = ?, primaryColor = ?, secondaryColor = ?, "
        "ringerVolume = ?, enabledSounds = ?, partnerSpace = ?, version = ? WHERE fileId = ?;");
const QString s_deleteThemelet = QStringLiteral("DELETE FROM themelet WHERE fileId = ?;");
const QString s_queryResource = QStringLiteral(
        "SELECT resource.resourceType, directory.path || '/' || file.fileName, file.fileName, "
        "file.displayName FROM resource INNER JOIN file on resource.resourceId = file.id "
        "INNER JOIN directory on file.directoryId = directory.id WHERE resource.fileId = ?;");
const QString s_insertResource = QStringLiteral(
        "INSERT OR REPLACE INTO resource ( fileId, resourceType, resourceId) VALUES (?, ?, ?);");
const QString s_deleteResource = QStringLiteral("DELETE FROM resource WHERE fileId = ? and resourceType = ?;");
const QString s_clearResources = QStringLiteral("DELETE FROM resource WHERE fileId = ?;");
// LIMIT 100 is the batch size of updateMetaData. The view is temporary, so every
// connection makes its own.
const QString s_modifiedView = QStringLiteral(
        "CREATE TEMPORARY VIEW modified_themelet AS SELECT file.id AS id, directory.path AS path, "
        "file.fileName AS fileName, file.displayName as displayName FROM file LEFT JOIN directory ON "
        "file.directoryId = directory.id WHERE file.metadataCurrent = 0 AND "
        "file.mimeType = 'application/x-vorka-themelet'ORDER BY file.directoryId LIMIT 100;");
const QString s_modifiedQuery = QStringLiteral("SELECT id, path, fileName FROM modified_themelet;");
const QString s_modifiedThemeletQuery = QStringLiteral(
        "SELECT modified_themelet.id, modified_themelet.displayName, themelet.favorite, themelet.timestamp, "
        "themelet.ringerVolume, themelet.enabledSounds, themelet.partnerSpace, themelet.highlightColor, "
        "themelet.secondaryhighlightColor, themelet.primaryColor, themelet.secondaryColor, themelet.version "
        "FROM modified_themelet INNER JOIN themelet ON modified_themelet.id = themelet.fileId;");
const QString s_modifiedResourceQuery = QStringLiteral(
        "SELECT resource.fileId, resource.resourceId, resource.resourceType FROM modified_themelet "
        "INNER JOIN resource ON modified_themelet.id = resource.fileId;");
const QString s_modifiedReset = QStringLiteral("UPDATE file SET metadataCurrent = 1 WHERE id = ?;");
const QString s_renameFile = QStringLiteral(
        "UPDATE file SET directoryId = ?, fileName = ?, displayName = ? WHERE id = ?;");

constexpr int s_batchSize = 100;

// Columns of m_queryThemelet.
enum ThemeletColumn {
    DisplayNameColumn,
    FavoriteColumn,
    TimestampColumn,
    HomeWallpaperColumn,
    ApplicationWallpaperColumn,
    HighlightColorColumn,
    SecondaryHighlightColorColumn,
    PrimaryColorColumn,
    SecondaryColorColumn,
    RingerVolumeColumn,
    EnabledSoundsColumn,
    PartnerSpaceColumn,
    VersionColumn,
    FileNameColumn,
    DirectoryIdColumn,
    PathColumn
};

void warnWithError(const QSqlQuery &query, const char *function, const char *message)
{
    qWarning().noquote() << function;
    qWarning().noquote() << message;
    qWarning() << query.lastError();
}

QStringList readFallbackTones()
{
    QStringList tones;
    for (const QString &key : ThemeletTones::fallbackProfileKeys()) {
        char *value = profile_get_value("fallback", key.toUtf8().constData());
        tones.append(QString::fromUtf8(value));
        free(value);
    }
    return tones;
}

void bindValues(QSqlQuery &query, std::initializer_list<QVariant> values)
{
    int position = 0;
    for (const QVariant &value : values)
        query.bindValue(position++, value);
}

// A value of save()'s map, or the row's when the map has none.
QVariant valueOr(const QVariantMap &values, const QString &key, const QVariant &fallback)
{
    const QVariant value = values.value(key);
    return value.isValid() ? value : fallback;
}

}

ThemeletManager::ThemeletManager(QueryAgentDatabase &database, QObject *parent)
    : QObject(parent)
    , QueryActor(database)
    , m_agent(database)
    , m_queryThemelet(database)
    , m_queryThemeletByZefId(database)
    , m_insertThemelet(database)
    , m_updateFile(database)
    , m_updateThemelet(database)
    , m_deleteThemelet(database)
    , m_queryResource(database)
    , m_insertResource(database)
    , m_deleteResource(database)
    , m_clearResources(database)
    , m_modifiedQuery(database)
    , m_modifiedThemeletQuery(database)
    , m_modifiedResourceQuery(database)
    , m_modifiedReset(database)
    , m_toneKeys(ThemeletTones::keys())
    , m_fallbackTones(readFallbackTones())
    , m_settings(nullptr)
{
    prepareStatements();
    connect(&m_settings, &ThemeletSettings::sourceChanged, this, &ThemeletManager::updateActiveThemelet);
    updateActiveThemelet();
}

ThemeletManager::~ThemeletManager() = default;

bool ThemeletManager::prepareStatements()
{
    const bool prepared = QueryActor::prepareStatements({
            { &m_queryThemelet, s_queryThemelet, "Failed to prepare m_queryThemelet." },
            { &m_queryThemeletByZefId, s_queryThemeletByZefId, "Failed to prepare m_queryThemeletByZefId." },
            { &m_insertThemelet, s_insertThemelet, "Failed to prepare m_insertThemelet." },
            { &m_updateFile, s_updateFile, "Failed to prepare m_updateFile." },
            { &m_updateThemelet, s_updateThemelet, "Failed to prepare m_updateThemelet." },
            { &m_deleteThemelet, s_deleteThemelet, "Failed to prepare m_deleteThemelet." },
            { &m_queryResource, s_queryResource, "Failed to prepare m_queryResource." },
            { &m_insertResource, s_insertResource, "Failed to prepare m_insertResource." },
            { &m_deleteResource, s_deleteResource, "Failed to prepare m_deleteResource." },
            { &m_clearResources, s_clearResources, "Failed to prepare m_clearResources." },
        }, s_constructorFunction);
    if (!prepared)
        return false;

    // The statements after it read the view.
    QSqlQuery view(m_database);
    if (!view.exec(s_modifiedView)) {
        rollback(view, s_constructorFunction, "Failed to execute query.");
        return false;
    }

    return QueryActor::prepareStatements({
            { &m_modifiedQuery, s_modifiedQuery, "Failed to prepare m_modifiedQuery." },
            { &m_modifiedThemeletQuery, s_modifiedThemeletQuery, "Failed to prepare m_modifiedThemeletQuery." },
            { &m_modifiedResourceQuery, s_modifiedResourceQuery, "Failed to prepare m_modifiedResourceQuery." },
            { &m_modifiedReset, s_modifiedReset, "Failed to prepare m_modifiedReset." },
        }, s_constructorFunction);
}

QString ThemeletManager::mimeType() const
{
    return s_mimeType;
}

Themelet ThemeletManager::parseThemelet(QSqlQuery *query)
{
    ThemeletData *data = new ThemeletData(QueryAgent::idFromColumn(*query, 0),
                                          QUrl::fromLocalFile(query->value(1).toString()));
    Themelet themelet(data);
    data->fileName = query->value(2).toString();
    data->mimeType = query->value(3).toString();
    data->displayName = query->value(4).toString();
    data->permissions = query->value(5).toInt();
    data->favorite = query->value(6).toBool();
    data->homeWallpaper = query->value(7).toString();
    data->applicationWallpaper = query->value(8).toString();
    data->highlightColor = colorFromString(query->value(9).toString());
    data->secondaryHighlightColor = colorFromString(query->value(10).toString());
    data->primaryColor = colorFromString(query->value(11).toString());
    data->secondaryColor = colorFromString(query->value(12).toString());
    data->ringerVolume = query->value(13).toInt();
    data->enabledSounds = query->value(14).toInt();
    data->partnerSpace = query->value(15).toString();
    data->version = query->value(16).toInt();
    query->finish();

    m_queryResource.bindValue(0, data->id);
    if (!m_queryResource.exec()) {
        warn(m_queryResource, s_parseFunction, "Failed to execute m_queryResource");
        return themelet;
    }
    QVariantMap resources;
    while (m_queryResource.next()) {
        QVariantMap resource;
        resource.insert(QStringLiteral("url"), QUrl::fromLocalFile(m_queryResource.value(1).toString()));
        resource.insert(QStringLiteral("fileName"), m_queryResource.value(2));
        resource.insert(QStringLiteral("displayName"), m_queryResource.value(3));
        resources.insert(m_queryResource.value(0).toString(), resource);
    }
    m_queryResource.finish();
    data->resources = resources;
    return themelet;
}

Themelet ThemeletManager::themeletFromZefId(const QString &zefId)
{
    if (zefId.isEmpty()) {
        qWarning().noquote() << s_zefIdFunction;
        qWarning().noquote() << "Empty ZEF ID!";
        return Themelet();
    }
    m_queryThemeletByZefId.bindValue(0, zefId);
    if (!m_queryThemeletByZefId.exec()) {
        warnWithError(m_queryThemeletByZefId, s_zefIdFunction, "Failed to execute m_queryThemeletByZefId");
        return Themelet();
    }
    if (!m_queryThemeletByZefId.next())
        return Themelet();
    return parseThemelet(&m_queryThemeletByZefId);
}

Themelet ThemeletManager::themeletFromUrl(const QUrl &url)
{
    const Content content = m_agent.queryByUrl(url);
    if (!content.isValid() || content.type() != ThemeletContent::Themelet)
        return Themelet();
    return Themelet(content);
}

bool ThemeletManager::updateMetaData()
{
    if (!m_modifiedQuery.exec()) {
        warn(m_modifiedQuery, s_updateFunction, "Failed to execute m_modifiedQuery");
        return false;
    }
    const QString batchTime = QDateTime::currentDateTime().toUTC().toString(Qt::ISODate);
    FileManager *files = FileManager::instance();

    // Read phase: files and tones, outside any transaction. The tone rows that
    // insertFile makes outlast a rollback of this batch.
    ThemeletBatch batch;
    ThemeletTranslator translator;
    while (m_modifiedQuery.next()) {
        const qint64 id = QueryAgent::idFromColumn(m_modifiedQuery, 0);
        batch.addRead(id);

        ThemeletFile file;
        switch (file.read(m_modifiedQuery.value(1).toString(), m_modifiedQuery.value(2).toString(), batchTime)) {
        case ThemeletFile::Unreadable:
            continue;
        case ThemeletFile::Malformed:
        case ThemeletFile::Invalid:
            batch.addDeleted(id);
            continue;
        case ThemeletFile::Valid:
            break;
        }

        translator.selectCatalog(file.translationCatalog);
        batch.addThemelet(id, file, translator.translate(file.displayName));

        for (int i = 0; i < ThemeletTones::Count; ++i) {
            const QString path = file.tonePath(i, m_fallbackTones.value(i));
            const qint64 resourceId = path.isEmpty() || !files ? 0 : files->insertFile(path);
            if (resourceId != 0)
                batch.addResource(id, m_toneKeys.at(i) + QLatin1String("File"), resourceId);
        }
    }
    m_modifiedQuery.finish();

    // Merge phase: rows that exist keep what the user may have edited.
    if (batch.hasUpdates()) {
        if (!m_modifiedThemeletQuery.exec()) {
            warn(m_modifiedThemeletQuery, s_updateFunction, "Failed to execute m_modifiedThemeletQuery");
            return false;
        }
        batch.merge(m_modifiedThemeletQuery);
        m_modifiedThemeletQuery.finish();
    }

    // Write phase, one transaction.
    if (batch.readCount() == 0)
        return false;
    transaction();

    batch.bindRead(m_modifiedReset);
    if (!execBatch(m_modifiedReset, s_updateFunction, "Failed to execute m_modifiedReset."))
        return false;
    if (batch.hasDeleted()) {
        batch.bindDeleted(m_deleteThemelet);
        if (!execBatch(m_deleteThemelet, s_updateFunction, "Failed to execute m_deleteThemelet."))
            return false;
    }
    if (batch.hasInserts()) {
        batch.bindInserts(m_insertThemelet);
        if (!execBatch(m_insertThemelet, s_updateFunction, "Failed to execute m_insertThemelet."))
            return false;
    }
    if (batch.hasUpdates()) {
        batch.bindUpdates(m_updateFile, m_updateThemelet, m_clearResources);
        if (!execBatch(m_updateFile, s_updateFunction, "Failed to execute m_updateFile.")
            || !execBatch(m_updateThemelet, s_updateFunction, "Failed to execute m_updateThemelet.")
            || !execBatch(m_clearResources, s_updateFunction, "Failed to execute m_clearResources."))
            return false;
    }
    if (batch.hasResources()) {
        batch.bindResources(m_insertResource);
        if (!execBatch(m_insertResource, s_updateFunction, "Failed to execute m_insertResource."))
            return false;
    }

    commit();
    Content::signalChanged(ThemeletContent::Themelet);

    if (!m_activeThemelet.isNull() && batch.updates(m_activeThemelet->id)) {
        updateActiveThemelet();
        emit activeThemeletUpdated(m_activeThemelet);
    }
    return batch.readCount() == s_batchSize;
}

qint64 ThemeletManager::create(const Themelet &themelet)
{
    if (themelet.isNull())
        return 0;
    const QString path = themelet->url.toLocalFile();
    qint64 id = themelet->id;
    if (id == 0) {
        FileManager *files = FileManager::instance();
        id = files ? files->insertFile(path) : 0;
        if (id == 0)
            return 0;
    }

    m_queryThemelet.bindValue(0, id);
    if (!m_queryThemelet.exec()) {
        warnWithError(m_queryThemelet, s_createFunction, "Failed to execute m_queryThemelet");
        return 0;
    }

    if (!m_queryThemelet.next()) {
        m_queryThemelet.finish();
        m_updateFile.bindValue(0, themelet->displayName);
        m_updateFile.bindValue(1, id);
        bindValues(m_insertThemelet, {
            id, themelet->homeWallpaper, themelet->applicationWallpaper,
            colorToString(themelet->highlightColor), colorToString(themelet->secondaryHighlightColor),
            colorToString(themelet->primaryColor), colorToString(themelet->secondaryColor),
            themelet->ringerVolume, themelet->enabledSounds, themelet->favorite,
            themelet->partnerSpace, themelet->version
        });

        if (!m_updateFile.exec()) {
            warn(m_updateFile, s_createFunction, "Failed to execute m_updateFile.");
            return 0;
        }
        m_updateFile.finish();
        // timestamp stays NULL: only save() marks when a themelet became a favourite.
        if (!m_insertThemelet.exec()) {
            warn(m_insertThemelet, s_createFunction, "Failed to execute m_insertThemelet.");
            return 0;
        }
        m_insertThemelet.finish();
        return id;
    }

    // The row exists: the user's favourite mark and its date survive.
    bindValues(m_updateThemelet, {
        m_queryThemelet.value(FavoriteColumn), m_queryThemelet.value(TimestampColumn),
        themelet->homeWallpaper, themelet->applicationWallpaper,
        colorToString(themelet->highlightColor), colorToString(themelet->secondaryHighlightColor),
        colorToString(themelet->primaryColor), colorToString(themelet->secondaryColor),
        themelet->ringerVolume, themelet->enabledSounds, themelet->partnerSpace, themelet->version, id
    });

    QSqlQuery renameFile = prepareQuery(s_renameFile);
    QString fileName = m_queryThemelet.value(FileNameColumn).toString();
    QVariant directoryId = m_queryThemelet.value(DirectoryIdColumn);
    if (m_queryThemelet.value(PathColumn).toString() != path) {
        // The file was moved: follow it into its new directory.
        const int slash = path.lastIndexOf(QLatin1Char('/'));
        fileName = path.mid(slash + 1);
        FileManager *files = FileManager::instance();
        directoryId = files ? files->appendDirectory(path.left(slash), FileManager::UserScope,
                                                     FileManager::ScanNew)
                            : 0;
        // An empty or non-local url has no directory; the row would vanish from every list.
        if (directoryId.toLongLong() == 0) {
            m_queryThemelet.finish();
            qWarning("%s", s_createFunction);
            qWarning() << "No local directory for themelet" << id << "at" << themelet->url;
            return 0;
        }
    }
    renameFile.bindValue(0, directoryId);
    renameFile.bindValue(1, fileName);
    renameFile.bindValue(2, themelet->displayName);
    renameFile.bindValue(3, id);
    m_queryThemelet.finish();

    if (!m_updateThemelet.exec()) {
        warn(m_updateThemelet, s_createFunction, "Failed to execute m_updateThemelet.");
        return 0;
    }
    m_updateThemelet.finish();
    if (!renameFile.exec()) {
        warn(renameFile, s_createFunction, "Failed to execute renameFile.");
        return 0;
    }
    renameFile.finish();
    return id;
}

QString ThemeletManager::wallpapersPath()
{
    static const QString s_path = QStandardPaths::writableLocation(QStandardPaths::AppDataLocation)
            + QLatin1String("/wallpapers");
    return s_path;
}

QString ThemeletManager::themeletInstallDirName(const QString &path)
{
    const QString prefix = Sysroot::path(QStringLiteral("/usr/share/themelet"));
    if (!path.startsWith(prefix))
        return QString();
    const int start = prefix.size() + 1;
    const int slash = path.indexOf(QLatin1Char('/'), start);
    return slash < 0 ? QString() : path.mid(start, slash - start);
}

bool ThemeletManager::save(qint64 id, const QVariantMap &values)
{
    m_queryThemelet.bindValue(0, id);
    if (!m_queryThemelet.exec()) {
        warnWithError(m_queryThemelet, s_saveFunction, "Failed to execute m_queryThemelet");
        return false;
    }
    if (!m_queryThemelet.next()) {
        qWarning() << id << "is not an existing themelet";
        return false;
    }

    m_updateFile.bindValue(0, valueOr(values, QStringLiteral("displayName"),
                                      m_queryThemelet.value(DisplayNameColumn)));
    m_updateFile.bindValue(1, id);

    // The timestamp records when a themelet became a favourite; favourites sort by it.
    const QVariant wasFavorite = m_queryThemelet.value(FavoriteColumn);
    const QVariant favorite = values.value(QStringLiteral("favorite"));
    QVariant timestamp = m_queryThemelet.value(TimestampColumn);
    if (favorite.isValid() && favorite.toBool() != wasFavorite.toBool()) {
        timestamp = favorite.toBool()
                ? QVariant(QDateTime::currentDateTimeUtc().toString(Qt::ISODate)) : QVariant();
    }

    int enabledSounds = m_queryThemelet.value(EnabledSoundsColumn).toInt();
    for (int i = 0; i < m_toneKeys.size(); ++i) {
        const QVariant enabled = values.value(m_toneKeys.at(i) + QLatin1String("Enabled"));
        if (!enabled.isValid())
            continue;
        enabledSounds = enabled.toBool() ? (enabledSounds | (1 << i)) : (enabledSounds & ~(1 << i));
    }

    bindValues(m_updateThemelet, {
        valueOr(values, QStringLiteral("favorite"), wasFavorite),
        timestamp,
        m_queryThemelet.value(HomeWallpaperColumn),
        m_queryThemelet.value(ApplicationWallpaperColumn),
        valueOr(values, QStringLiteral("highlightColor"), m_queryThemelet.value(HighlightColorColumn)),
        valueOr(values, QStringLiteral("secondaryHighlightColor"),
                m_queryThemelet.value(SecondaryHighlightColorColumn)),
        valueOr(values, QStringLiteral("primaryColor"), m_queryThemelet.value(PrimaryColorColumn)),
        valueOr(values, QStringLiteral("secondaryColor"), m_queryThemelet.value(SecondaryColorColumn)),
        valueOr(values, QStringLiteral("ringerVolume"), m_queryThemelet.value(RingerVolumeColumn)),
        enabledSounds,
        m_queryThemelet.value(PartnerSpaceColumn),
        m_queryThemelet.value(VersionColumn),
        id
    });
    m_queryThemelet.finish();

    // Tone files are registered before the transaction; their rows stay if it fails.
    QVariantList deleteIds, deleteTypes, insertIds, insertTypes, insertResourceIds;
    const QVariantMap resources = values.value(QStringLiteral("resources")).toMap();
    for (const QString &tone : qAsConst(m_toneKeys)) {
        const QString type = tone + QLatin1String("File");
        if (!resources.contains(type))
            continue;
        QUrl url = resources.value(type).toMap().value(QStringLiteral("url")).toUrl();
        if (url.isEmpty()) {
            deleteIds.append(id);
            deleteTypes.append(type);
            continue;
        }
        // A plain path is as good as a file url.
        if (url.toString().startsWith(QLatin1Char('/')))
            url.setScheme(QStringLiteral("file"));
        if (!url.isLocalFile())
            continue;
        FileManager *files = FileManager::instance();
        const qint64 resourceId = files ? files->insertFile(url.toLocalFile()) : 0;
        if (resourceId == 0)
            continue;
        insertIds.append(id);
        insertTypes.append(type);
        insertResourceIds.append(resourceId);
    }

    transaction();
    if (!m_updateFile.exec()) {
        rollback(m_updateFile, s_saveFunction, "Failed to execute m_updateFile.");
        return false;
    }
    m_updateFile.finish();
    if (!m_updateThemelet.exec()) {
        rollback(m_updateThemelet, s_saveFunction, "Failed to execute m_updateThemelet.");
        return false;
    }
    m_updateThemelet.finish();
    if (!execBatch(m_deleteResource, { deleteIds, deleteTypes }, s_saveFunction,
                   "Failed to execute m_deleteResource.")
        || !execBatch(m_insertResource, { insertIds, insertTypes, insertResourceIds }, s_saveFunction,
                      "Failed to execute m_insertResource."))
        return false;
    commit();

    if (!m_activeThemelet.isNull() && m_activeThemelet->id == id) {
        updateActiveThemelet();
        emit activeThemeletUpdated(m_activeThemelet);
    }
    return true;
}

bool ThemeletManager::remove(qint64 id)
{
    const Content content = m_agent.queryById(id);
    if (content.isValid() && content.type() == ThemeletContent::Themelet) {
        // The pictures go whoever owns them, an empty path failing harmlessly;
        // the file row and the tones stay.
        const Themelet themelet(content);
        QFile::remove(themelet->homeWallpaper);
        QFile::remove(themelet->applicationWallpaper);
    }

    m_deleteThemelet.bindValue(0, id);
    if (!m_deleteThemelet.exec()) {
        warn(m_deleteThemelet, s_removeFunction, "Failed to execute m_deleteThemelet.");
        return false;
    }
    m_deleteThemelet.finish();
    return true;
}

void ThemeletManager::updateActiveThemelet()
{
    m_activeThemelet = themeletFromUrl(m_settings.source());
}
