// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletservice.h"

#include "dbmanager.h"
#include "dbusvalue.h"
#include "filemanager.h"
#include "indexcreator.h"
#include "installmanager.h"
#include "profile.h"
#include "queryagent.h"
#include "soundthemes.h"
#include "themeletcolor.h"
#include "themeletmanager.h"
#include "themelettones.h"
#include "waltrimmer.h"
#include "wallpaperpalette.h"

#include <QDBusConnection>
#include <QDebug>
#include <QDir>
#include <QFileInfo>
#include <QSqlError>
#include <QSqlRecord>

#include <algorithm>
#include <iterator>

#include <cstdlib>

namespace {

// For messages: the names clients use for content types.
QString typeName(int type)
{
    static const char *const s_names[] = { "file", "themelet", "photo", "video", "download" };
    return type >= 0 && type < int(std::size(s_names)) ? QLatin1String(s_names[type]) : QString::number(type);
}

// Bigger pictures are refused: the copy would hold the bus longer than a step.
const qint64 MaxPictureSize = 64 * 1024 * 1024;
const int MaxMessageLength = 300;
// Twice the log that automatic checkpoints keep when nobody reads.
const qint64 MaxLogSize = 8 * 1024 * 1024;

const char *const s_fileQuery =
        "SELECT file.permissions, themelet.fileId IS NOT NULL, themelet.homeWallpaper, "
        "themelet.applicationWallpaper FROM file LEFT JOIN themelet ON themelet.fileId = file.id "
        "WHERE file.id = ?;";

const char *const s_directoryQuery = "SELECT scope FROM directory WHERE path = ?;";

// Everything of a themelet that a save can change, to tell whether it changed anything.
const char *const s_snapshotQuery =
        "SELECT file.displayName, themelet.*, (SELECT group_concat(r) FROM (SELECT resourceType || '=' || resourceId AS r "
        "FROM resource WHERE resource.fileId = ? ORDER BY 1)) FROM file JOIN themelet ON themelet.fileId = file.id "
        "WHERE file.id = ?;";

const char *const s_colorKeys[] = { "highlightColor", "secondaryHighlightColor", "primaryColor", "secondaryColor" };

bool isInside(const QString &path, const QString &directory)
{
    return QDir::cleanPath(path).startsWith(QDir::cleanPath(directory) + QLatin1Char('/'));
}

bool isNumber(const QVariant &value)
{
    switch (value.userType()) {
    case QMetaType::Int: case QMetaType::UInt: case QMetaType::LongLong: case QMetaType::ULongLong:
    case QMetaType::Short: case QMetaType::UShort: case QMetaType::UChar: case QMetaType::Double:
        return true;
    default:
        return false;
    }
}

bool isInteger(const QVariant &value)
{
    return isNumber(value) && value.userType() != QMetaType::Double;
}

bool isFlag(const QVariant &value)
{
    return value.userType() == QMetaType::Bool || isInteger(value);
}

// A value of the profile "themelet", or a null array when neither it nor the defaults have one.
QByteArray profileValue(const QString &key)
{
    char *value = profile_get_value(ThemeletApplier::ProfileName, key.toUtf8().constData());
    const QByteArray result = value ? QByteArray(value) : QByteArray();
    std::free(value);
    return result;
}

}

const char *const ThemeletService::ServiceName = "com.vorka.themeletd";
const char *const ThemeletService::ObjectPath = "/com/vorka/themeletd";

ThemeletService::ThemeletService(QObject *parent)
    : QObject(parent)
{
    connect(&m_notifier, &ChangeNotifier::contentChanged, this, &ThemeletService::contentChanged);
    m_pictureReader.setMaxThreadCount(1); // one big picture in memory at a time
}

ThemeletService::~ThemeletService() = default;

ThemeletManager *ThemeletService::themeletManager()
{
    return static_cast<ThemeletManager *>(ContentManager::managerFromType(ThemeletContent::Themelet));
}

InstallManager *ThemeletService::installManager()
{
    return static_cast<InstallManager *>(ContentManager::managerFromType(6));
}

void ThemeletService::start(const QStringList &watchedDirectories)
{
    IndexCreator::ensure(QueryAgent::databaseUrl(0).toLocalFile());
    // The file manager's constructor opens the index and queues every known root.
    FileManager *files = FileManager::instance();
    InstallManager *installer = installManager();
    ThemeletManager *themelets = themeletManager();
    if (!files || !installer || !themelets) {
        qCritical("themeletd: the content managers could not be made");
        return;
    }
    // The writer mostly walks rows once; a 512 KiB page cache instead of 2 MiB
    // keeps the resident size of a big index down at no measurable cost in speed.
    QSqlQuery(DbManager::instance()).exec(QStringLiteral("PRAGMA cache_size = -512;"));
    // In WAL mode a commit then waits for no disk flush, only checkpoints do. A
    // crash of the process loses nothing; a power cut may lose the last steps,
    // which the scan of the next start makes again. The index stays whole.
    QSqlQuery(DbManager::instance()).exec(QStringLiteral("PRAGMA synchronous = NORMAL;"));
    m_fileQuery = QSqlQuery(DbManager::instance());
    if (!m_fileQuery.prepare(QLatin1String(s_fileQuery)))
        qWarning() << "Failed to prepare m_fileQuery." << m_fileQuery.lastError();
    m_directoryQuery = QSqlQuery(DbManager::instance());
    if (!m_directoryQuery.prepare(QLatin1String(s_directoryQuery)))
        qWarning() << "Failed to prepare m_directoryQuery." << m_directoryQuery.lastError();
    m_snapshotQuery = QSqlQuery(DbManager::instance());
    if (!m_snapshotQuery.prepare(QLatin1String(s_snapshotQuery)))
        qWarning() << "Failed to prepare m_snapshotQuery." << m_snapshotQuery.lastError();
    connect(themelets, &ThemeletManager::activeThemeletUpdated, this, &ThemeletService::applyThemelet);
    convergeActiveThemelet();
    new WalTrimmer(DbManager::instance(), MaxLogSize, 1000, this);

    // The watched trees first: an install path inside one is nested in it
    // before anything is scanned (the scans run from the event loop).
    QStringList roots;
    for (const QString &path : watchedDirectories) {
        const QString root = QDir::cleanPath(QDir::current().absoluteFilePath(path));
        if (files->appendDirectory(root, FileManager::UserScope, FileManager::ScanNew) == 0) {
            qWarning().noquote() << "themeletd: cannot watch" << path;
        } else {
            qDebug().noquote() << "themeletd: watching" << path;
            roots << root;
        }
    }
    nestInstallPaths(roots);
    for (const QString &path : InstallManager::installPaths())
        installer->appendDirectory(path);
    if (SoundThemes::update(DbManager::instance()) > 0)
        Content::signalChanged(ThemeletContent::File);
    m_started = true;
}

// A scan never adopts a directory that is already a root of its own: finding
// one below it, it fails for good. So an install path inside a watched tree,
// and the directories between them, are given their rows as children of the
// tree before either is scanned; each keeps its own scope.
void ThemeletService::nestInstallPaths(const QStringList &roots)
{
    FileManager *files = FileManager::instance();
    QSqlQuery adopt(DbManager::instance());
    adopt.prepare(QStringLiteral("UPDATE directory SET parentId = ? WHERE id = ? AND parentId IS NULL;"));
    for (const QString &root : roots) {
        for (const QString &installPath : InstallManager::installPaths()) {
            const QString install = QDir::cleanPath(installPath);
            if (!install.startsWith(root + QLatin1Char('/')) || !QFileInfo(install).isDir()
                || FileManager::isLinkedDirectory(install))
                continue;
            qint64 parentId = files->appendDirectory(root, FileManager::UserScope, FileManager::NoScan);
            QString path = root;
            const QStringList steps = install.mid(root.size() + 1).split(QLatin1Char('/'));
            for (const QString &step : steps) {
                path += QLatin1Char('/') + step;
                const qint64 id = files->appendDirectory(
                        path, path == install ? FileManager::InstallScope : FileManager::UserScope, FileManager::NoScan);
                if (parentId == 0 || id == 0)
                    break;
                adopt.bindValue(0, parentId);
                adopt.bindValue(1, id);
                if (!adopt.exec())
                    qWarning() << "themeletd: cannot nest" << path << "in" << root << adopt.lastError();
                parentId = id;
            }
        }
    }
}

void ThemeletService::stop()
{
    if (!m_started)
        return;
    m_started = false;
    m_fileQuery = QSqlQuery();
    m_directoryQuery = QSqlQuery();
    m_snapshotQuery = QSqlQuery();
    QSqlDatabase &database = DbManager::instance();
    {
        QSqlQuery checkpoint(database);
        if (!checkpoint.exec(QStringLiteral("PRAGMA wal_checkpoint(TRUNCATE);")))
            qWarning() << "themeletd: checkpoint failed:" << checkpoint.lastError();
    }
    database.close();
}

bool ThemeletService::fail(Error error, const QString &message, const DelayedReply *call)
{
    static const char *const names[] = { "InvalidArgs", "NotFound", "ReadOnly", "Failed" };
    QString line = message.left(MaxMessageLength);
    for (QChar &c : line) {
        if (c.category() == QChar::Other_Control)
            c = QLatin1Char(' ');
    }
    const QString name = QLatin1String("com.vorka.themeletd.Error.") + QLatin1String(names[error]);
    qWarning().noquote() << name << line;
    if (call)
        call->connection.send(call->message.createErrorReply(name, line));
    else if (calledFromDBus())
        sendErrorReply(name, line);
    return false;
}

QString ThemeletService::localPath(const QString &url, const char *what)
{
    QString path;
    if (url.startsWith(QLatin1Char('/'))) {
        path = url;
    } else {
        // Clients send QUrl::toString(), which leaves spaces as they are.
        const QUrl parsed(url);
        if (parsed.isValid() && parsed.isLocalFile()
            && (parsed.host().isEmpty() || parsed.host() == QLatin1String("localhost")))
            path = parsed.toLocalFile();
    }
    if (!path.startsWith(QLatin1Char('/')) || path.contains(QChar(0))) {
        fail(InvalidArgs, QStringLiteral("The %1 is not a local file: '%2'").arg(QLatin1String(what), url));
        return QString();
    }
    return QDir::cleanPath(path);
}

ContentManager *ThemeletService::writableManager(int contentType)
{
    switch (contentType) {
    case ThemeletContent::File:
    case ThemeletContent::Themelet:
    case ThemeletContent::Photo:
    case ThemeletContent::Download:
        if (ContentManager *manager = ContentManager::managerFromType(contentType))
            return manager;
        break;
    default:
        break;
    }
    fail(InvalidArgs, QStringLiteral("Unknown content type %1").arg(contentType));
    return nullptr;
}

bool ThemeletService::findContent(int contentType, qint64 id, FileRow *row)
{
    m_fileQuery.bindValue(0, id);
    if (!m_fileQuery.exec()) {
        qWarning() << "Failed to execute m_fileQuery" << m_fileQuery.lastError();
        return fail(Failed, QStringLiteral("The index could not be read"));
    }
    if (m_fileQuery.next()) {
        row->found = true;
        row->permissions = m_fileQuery.value(0).toInt();
        row->themelet = m_fileQuery.value(1).toBool();
        for (int column : { 2, 3 }) {
            const QString picture = m_fileQuery.value(column).toString();
            if (!picture.isEmpty())
                row->pictures.append(picture);
        }
    }
    m_fileQuery.finish();
    if (!row->found || (contentType == ThemeletContent::Themelet && !row->themelet))
        return fail(NotFound, QStringLiteral("No %1 with id %2").arg(typeName(contentType)).arg(id));
    return true;
}

bool ThemeletService::checkThemeletValues(const QVariantMap &values)
{
    auto refuse = [this](const QString &key, const char *expected) {
        return fail(InvalidArgs, QStringLiteral("'%1' must be %2").arg(key, QLatin1String(expected)));
    };
    const QStringList tones = ThemeletTones::keys();
    for (auto it = values.constBegin(); it != values.constEnd(); ++it) {
        const QString &key = it.key();
        const QVariant &value = it.value();
        if (std::find(std::begin(s_colorKeys), std::end(s_colorKeys), key) != std::end(s_colorKeys)) {
            if (value.userType() != QMetaType::QString || !QColor::isValidColor(value.toString()))
                return refuse(key, "a colour such as \"#ff336699\"");
        } else if (key == QLatin1String("displayName")) {
            if (value.userType() != QMetaType::QString)
                return refuse(key, "a string");
        } else if (key == QLatin1String("ringerVolume")) {
            if (!isInteger(value) || value.toLongLong() < 0 || value.toLongLong() > 100)
                return refuse(key, "a whole number from 0 to 100");
        } else if (key == QLatin1String("favorite")
                   || (key.endsWith(QLatin1String("Enabled")) && tones.contains(key.chopped(7)))) {
            if (!isFlag(value))
                return refuse(key, "a boolean");
        } else if (key == QLatin1String("resources")) {
            if (value.userType() != QMetaType::QVariantMap)
                return refuse(key, "a map of tones");
            const QVariantMap resources = value.toMap();
            for (auto tone = resources.constBegin(); tone != resources.constEnd(); ++tone) {
                const QString name = QStringLiteral("resources/") + tone.key();
                if (!tone.key().endsWith(QLatin1String("File")) || !tones.contains(tone.key().chopped(4)))
                    return refuse(name, "a tone such as \"ringerToneFile\"");
                // The engine can't tell an entry without a url from one that clears the tone.
                const QVariant url = tone.value().toMap().value(QStringLiteral("url"));
                if (tone.value().userType() != QMetaType::QVariantMap || url.userType() != QMetaType::QString)
                    return refuse(name, "a map with a string \"url\"");
                // The engine ignores any other url without a word.
                const QString text = url.toString();
                const QUrl parsed(text);
                if (!text.isEmpty() && !text.startsWith(QLatin1Char('/'))
                    && !(parsed.isLocalFile() && parsed.toLocalFile().startsWith(QLatin1Char('/'))))
                    return refuse(name + QLatin1String("/url"), "empty, an absolute path or a file: url");
            }
        } else {
            return fail(InvalidArgs, QStringLiteral("'%1' is not an attribute of a themelet that can be saved").arg(key));
        }
    }
    return true;
}

void ThemeletService::applyThemelet(const Themelet &themelet)
{
    m_applier.apply(themelet);
}

// No themelet is active: no key names a picture, the colours and the profile
// "themelet" fall back to their defaults, and the profile from before returns.
void ThemeletService::leaveThemelet()
{
    m_settings.setSource(QUrl());
    m_settings.setHomeImagePath(QString());
    m_settings.setApplicationImagePath(QString());
    themeletManager()->updateActiveThemelet();
    m_applier.clear();
    m_applier.leaveProfile();
}

// The device may have changed while the service was down: it gets the active
// themelet's values again (only those that differ are written), or loses a
// themelet whose file is gone.
void ThemeletService::convergeActiveThemelet()
{
    const QUrl source = m_settings.source();
    if (source.isEmpty())
        return;
    const Themelet active = activeThemelet();
    if (!active.isNull())
        m_applier.apply(active);
    else if (!QFileInfo::exists(source.toLocalFile()))
        leaveThemelet();
}

QVariantList ThemeletService::themeletSnapshot(qint64 id)
{
    QVariantList values;
    m_snapshotQuery.bindValue(0, id);
    m_snapshotQuery.bindValue(1, id);
    if (!m_snapshotQuery.exec())
        qWarning() << "Failed to execute m_snapshotQuery" << m_snapshotQuery.lastError();
    else if (m_snapshotQuery.next()) {
        for (int i = 0; i < m_snapshotQuery.record().count(); ++i)
            values << m_snapshotQuery.value(i);
    }
    m_snapshotQuery.finish();
    return values;
}

Themelet ThemeletService::activeThemelet()
{
    const QUrl source = m_settings.source();
    return source.isEmpty() ? Themelet() : themeletManager()->themeletFromUrl(source);
}

QString ThemeletService::copyToWallpapers(const QString &path)
{
    const QString directory = ThemeletManager::wallpapersPath();
    if (!QDir().mkpath(directory)) {
        qWarning().noquote() << "themeletd: cannot create" << directory;
        return QString();
    }
    const QFileInfo info(path);
    const QString base = info.completeBaseName().isEmpty() ? QStringLiteral("wallpaper") : info.completeBaseName();
    const QString suffix = info.suffix().isEmpty() ? QString() : QLatin1Char('.') + info.suffix();
    for (int n = 1; n < 1000; ++n) {
        const QString target = directory + QLatin1Char('/') + base
                + (n == 1 ? QString() : QLatin1Char('-') + QString::number(n)) + suffix;
        if (QFileInfo(target).exists() || QFileInfo(target).isSymLink())
            continue;
        if (QFile::copy(path, target))
            return target;
        qWarning().noquote() << "themeletd: cannot copy" << path << "to" << target;
        return QString();
    }
    return QString();
}

qlonglong ThemeletService::createThemelet(const QString &url)
{
    qDebug().noquote() << "createThemelet" << url;
    const QString path = localPath(url, "picture");
    if (path.isEmpty())
        return 0;
    const QFileInfo info(path);
    if (!info.exists())
        return fail(NotFound, QStringLiteral("No picture at '%1'").arg(path));
    if (!info.isFile() || !info.isReadable() || info.size() > MaxPictureSize)
        return fail(InvalidArgs, QStringLiteral("'%1' is no readable picture file of at most 64 MiB").arg(path));
    if (!calledFromDBus()) {
        bool tooLarge = false;
        const QImage thumbnail = WallpaperPalette::readThumbnail(path, &tooLarge);
        return makeThemelet(path, thumbnail, tooLarge, nullptr);
    }
    // Decoding a big picture takes seconds: it is done off the loop, so that
    // every other client is served meanwhile, and the reply follows.
    setDelayedReply(true);
    const DelayedReply call { connection(), message() };
    m_pictureReader.start([this, path, call]() {
        bool tooLarge = false;
        const QImage thumbnail = WallpaperPalette::readThumbnail(path, &tooLarge);
        QMetaObject::invokeMethod(this, [this, path, call, thumbnail, tooLarge]() {
            const qlonglong id = makeThemelet(path, thumbnail, tooLarge, &call);
            if (id != 0)
                call.connection.send(call.message.createReply(QVariant::fromValue(id)));
        }, Qt::QueuedConnection);
    });
    return 0;
}

qlonglong ThemeletService::makeThemelet(const QString &path, const QImage &thumbnail, bool tooLarge,
                                        const DelayedReply *call)
{
    const QFileInfo info(path);
    if (tooLarge)
        return fail(InvalidArgs, QStringLiteral("'%1' has more pixels than %2 can be read at once")
                                         .arg(path).arg(WallpaperPalette::MaxDecodedPixels), call);
    const WallpaperPalette palette(thumbnail);
    if (!palette.isValid())
        return fail(InvalidArgs, QStringLiteral("'%1' is not a picture").arg(path), call);

    const QString copy = copyToWallpapers(path);
    if (copy.isEmpty())
        return fail(Failed, QStringLiteral("The picture could not be copied into %1").arg(ThemeletManager::wallpapersPath()), call);

    ThemeletData *data = new ThemeletData(0, QUrl::fromLocalFile(copy));
    const Themelet themelet(data);
    data->displayName = info.completeBaseName();
    data->homeWallpaper = copy;
    data->applicationWallpaper = copy;
    data->highlightColor = palette.highlightColor();
    data->secondaryHighlightColor = palette.secondaryHighlightColor();
    data->primaryColor = palette.primaryColor();
    data->secondaryColor = palette.secondaryColor();

    // Sounds stay as they are: those of the active themelet, else those of the profile.
    const QStringList tones = ThemeletTones::keys();
    QVariantMap resources;
    const Themelet active = activeThemelet();
    if (!active.isNull()) {
        data->ringerVolume = active->ringerVolume;
        data->enabledSounds = active->enabledSounds;
        for (const QString &tone : tones) {
            const QString key = tone + QLatin1String("File");
            const QUrl toneUrl = active->resources.value(key).toMap().value(QStringLiteral("url")).toUrl();
            if (toneUrl.isLocalFile())
                resources.insert(key, QVariantMap { { QStringLiteral("url"), toneUrl } });
        }
    } else {
        bool ok = false;
        const int volume = profileValue(QLatin1String(ThemeletApplier::volumeKey())).toInt(&ok);
        if (ok)
            data->ringerVolume = volume;
        const QStringList profileTones = ThemeletApplier::toneKeys(), switches = ThemeletApplier::switchKeys();
        for (int i = 0; i < ThemeletTones::Count; ++i) {
            const QByteArray enabled = profileValue(switches.at(i));
            if (!enabled.isNull() && !profile_parse_bool(enabled.constData()))
                data->enabledSounds &= ~(1 << i);
            const QString tonePath = QString::fromUtf8(profileValue(profileTones.at(i)));
            // A url, not the path: a '#' or '%' in a file name would be read as URL syntax.
            if (tonePath.startsWith(QLatin1Char('/')))
                resources.insert(tones.at(i) + QLatin1String("File"),
                                 QVariantMap { { QStringLiteral("url"), QUrl::fromLocalFile(tonePath) } });
        }
    }

    ThemeletManager *manager = themeletManager();
    const qint64 id = manager->create(themelet);
    if (id == 0) {
        QFile::remove(copy);
        return fail(Failed, QStringLiteral("The themelet of '%1' could not be stored").arg(path), call);
    }
    // The copy is the themelet's picture, not one of the user's photos: marked
    // read before the picture loop runs, it never gets an image row.
    QSqlQuery read(DbManager::instance());
    read.prepare(QStringLiteral("UPDATE file SET metadataCurrent = 1 WHERE id = ?;"));
    read.bindValue(0, id);
    if (!read.exec())
        qWarning() << "themeletd: the copy of" << path << "stays in the photos:" << read.lastError();
    if (!resources.isEmpty() && !manager->save(id, { { QStringLiteral("resources"), resources } }))
        qWarning() << "themeletd: the tones of themelet" << id << "could not be stored";
    Content::signalChanged(ThemeletContent::Themelet);
    return id;
}

void ThemeletService::indexFile(const QString &url)
{
    qDebug().noquote() << "indexFile" << url;
    const QString path = localPath(url, "file");
    if (path.isEmpty())
        return;
    const QFileInfo info(path);
    if (!info.exists()) {
        fail(NotFound, QStringLiteral("No file at '%1'").arg(path));
        return;
    }
    if (!info.isFile()) {
        fail(InvalidArgs, QStringLiteral("'%1' is not a regular file").arg(path));
        return;
    }
    if (FileManager::instance()->insertFile(path) == 0) {
        fail(Failed, QStringLiteral("'%1' could not be indexed").arg(path));
        return;
    }
    Content::signalChanged(ThemeletContent::File);
}

void ThemeletService::installPackage(const QString &path)
{
    qDebug().noquote() << "installPackage" << path;
    if (!path.startsWith(QLatin1Char('/')) || path.contains(QChar(0))) {
        fail(InvalidArgs, QStringLiteral("The package path must be absolute: '%1'").arg(path));
        return;
    }
    const QString directory = QDir::cleanPath(path);
    const QFileInfo info(directory);
    if (!info.exists()) {
        fail(NotFound, QStringLiteral("No package at '%1'").arg(directory));
        return;
    }
    if (!info.isDir()) {
        fail(InvalidArgs, QStringLiteral("'%1' is not a directory").arg(directory));
        return;
    }
    // What an install reads: .themelet and .index files directly in the package.
    if (QDir(directory).entryList({ QStringLiteral("*.themelet"), QStringLiteral("*.index") },
                                  QDir::Files | QDir::Hidden).isEmpty()) {
        fail(InvalidArgs, QStringLiteral("Nothing to install in '%1': no .themelet or .index file in it").arg(directory));
        return;
    }
    // Installing turns the directory into a package: a user's or an install directory stays what it is.
    m_directoryQuery.bindValue(0, directory);
    if (!m_directoryQuery.exec()) {
        qWarning() << "Failed to execute m_directoryQuery" << m_directoryQuery.lastError();
        fail(Failed, QStringLiteral("The index could not be read"));
        return;
    }
    const bool otherScope = m_directoryQuery.next() && m_directoryQuery.value(0).toInt() != FileManager::PackageScope;
    m_directoryQuery.finish();
    if (otherScope) {
        fail(InvalidArgs, QStringLiteral("'%1' is indexed as another kind of directory, not as a package").arg(directory));
        return;
    }
    if (!installManager()->install(directory, QString(), false)) {
        fail(Failed, QStringLiteral("The package '%1' could not be installed").arg(directory));
        return;
    }
    Content::signalChanged(ThemeletContent::File);
}

void ThemeletService::refreshThemelets()
{
    qDebug() << "refreshThemelets";
    // A package that changed on disk is found by scanning the install directories again.
    InstallManager *installer = installManager();
    for (const QString &path : InstallManager::installPaths())
        installer->appendDirectory(path);
    installer->refreshInstalls();
    if (SoundThemes::update(DbManager::instance()) > 0)
        Content::signalChanged(ThemeletContent::File);
}

void ThemeletService::remove(int contentType, qlonglong contentId)
{
    qDebug() << "remove" << contentType << contentId;
    ContentManager *manager = writableManager(contentType);
    if (!manager)
        return;
    // Refused or not, the clients query again: what they show is what is stored.
    removeContent(manager, contentType, contentId);
    Content::signalChanged(contentType);
}

bool ThemeletService::removeContent(ContentManager *manager, int contentType, qint64 contentId)
{
    FileRow row;
    if (!findContent(contentType, contentId, &row))
        return false;
    bool active = false;
    if (contentType == ThemeletContent::Themelet) {
        // Removing a themelet deletes its pictures: only those that the service made may go.
        if (row.permissions == 1)
            return fail(ReadOnly, QStringLiteral("Themelet %1 belongs to a package").arg(contentId));
        for (const QString &picture : qAsConst(row.pictures)) {
            if (!isInside(picture, ThemeletManager::wallpapersPath()))
                return fail(ReadOnly, QStringLiteral("Themelet %1 shows a picture that themeletd did not make; "
                                                     "delete its file instead").arg(contentId));
        }
        const Themelet current = activeThemelet();
        active = !current.isNull() && current->id == contentId;
    }
    if (!manager->remove(contentId))
        return fail(Failed, QStringLiteral("Content %1 of type %2 cannot be removed%3")
                                    .arg(contentId)
                                    .arg(typeName(contentType),
                                         contentType == ThemeletContent::Themelet ? QString()
                                                                                  : QStringLiteral(": delete the file itself")));
    if (active)
        leaveThemelet();
    return true;
}

void ThemeletService::saveAttributes(int contentType, qlonglong contentId, const QVariantMap &args)
{
    qDebug() << "saveAttributes" << contentType << contentId << args.keys();
    ContentManager *manager = writableManager(contentType);
    if (!manager)
        return;
    bool changed = false;
    // A refused write leaves its client showing a value that isn't stored: every client queries again.
    if (!writeAttributes(manager, contentType, contentId, args, &changed) || changed)
        Content::signalChanged(contentType);
}

bool ThemeletService::writeAttributes(ContentManager *manager, int contentType, qint64 contentId, const QVariantMap &args,
                                      bool *changed)
{
    FileRow row;
    if (!findContent(contentType, contentId, &row))
        return false;
    const QVariantMap values = plainDBusMap(args);
    const bool themelet = contentType == ThemeletContent::Themelet;
    if (themelet && !checkThemeletValues(values))
        return false;
    const QVariantList before = themelet ? themeletSnapshot(contentId) : QVariantList();
    if (!manager->save(contentId, values))
        return fail(Failed, QStringLiteral("Content %1 of type %2 could not be saved").arg(contentId).arg(contentType));
    *changed = !themelet || before.isEmpty() || themeletSnapshot(contentId) != before;
    return true;
}

qlonglong ThemeletService::setThemelet(const QString &url)
{
    qDebug().noquote() << "setThemelet" << url;
    if (url.isEmpty()) {
        // An empty url activates no themelet.
        leaveThemelet();
        return 0;
    }
    const QString path = localPath(url, "themelet");
    if (path.isEmpty())
        return 0;
    ThemeletManager *manager = themeletManager();
    const Themelet themelet = manager->themeletFromUrl(QUrl::fromLocalFile(path));
    if (themelet.isNull())
        return fail(NotFound, QStringLiteral("No themelet at '%1'").arg(path));

    m_settings.setSource(QUrl::fromLocalFile(path));
    m_settings.setHomeImagePath(themelet->homeWallpaper);
    m_settings.setApplicationImagePath(themelet->applicationWallpaper.isEmpty() ? themelet->homeWallpaper
                                                                                : themelet->applicationWallpaper);
    // The store's notice comes later; an edit made before it must already find this one active.
    manager->updateActiveThemelet();
    applyThemelet(themelet);
    m_applier.enterProfile();
    return themelet->id;
}

bool ThemeletService::setFavorite(const QString &url, bool value)
{
    qDebug().noquote() << "setFavorite" << url << value;
    const QString path = localPath(url, "wallpaper");
    if (path.isEmpty())
        return false;
    if (!installManager()->setFavorite(path, value))
        return false;
    Content::signalChanged(ThemeletContent::Themelet);
    return true;
}
