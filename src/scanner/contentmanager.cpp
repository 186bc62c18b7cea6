// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "contentmanager.h"

#include "dbmanager.h"
#include "downloadmanager.h"
#include "filemanager.h"
#include "imagemanager.h"
#include "indexmanager.h"
#include "installmanager.h"
#include "themeletmanager.h"

#include <QFile>
#include <QFileInfo>

#include <sys/stat.h>

ContentManager::ContentManager() = default;

ContentManager::~ContentManager() = default;

QString ContentManager::mimeType() const
{
    return QString();
}

bool ContentManager::updateMetaData()
{
    return false;
}

bool ContentManager::save(qint64, const QMap<QString, QVariant> &)
{
    return false;
}

bool ContentManager::remove(qint64)
{
    return false;
}

namespace {

bool statTime(const QString &path, qint64 *msecs)
{
    struct stat status;
    if (::stat(QFile::encodeName(path).constData(), &status) != 0)
        return false;
    *msecs = qint64(status.st_mtim.tv_sec) * 1000 + status.st_mtim.tv_nsec / 1000000;
    return true;
}

}

QDateTime ContentManager::modificationTime(const QFileInfo &info)
{
    qint64 msecs = 0;
    if (statTime(info.filePath(), &msecs))
        return QDateTime::fromMSecsSinceEpoch(msecs, Qt::UTC);
    return info.lastModified().toUTC(); // what QFileInfo makes of a missing file or a broken link
}

QVariant ContentManager::storedModificationTime(const QString &path)
{
    qint64 msecs = 0;
    if (statTime(path, &msecs))
        return timeText(msecs);
    return QFileInfo(path).lastModified().toUTC();
}

QString ContentManager::timeText(qint64 msecs)
{
    // Days to a civil date (proleptic Gregorian), as QDateTime's ISO text with milliseconds.
    qint64 days = msecs / 86400000;
    qint64 rest = msecs % 86400000;
    if (rest < 0) {
        rest += 86400000;
        --days;
    }
    const qint64 z = days + 719468;
    const qint64 era = (z >= 0 ? z : z - 146096) / 146097;
    const qint64 dayOfEra = z - era * 146097;
    const qint64 yearOfEra = (dayOfEra - dayOfEra / 1460 + dayOfEra / 36524 - dayOfEra / 146096) / 365;
    const qint64 dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
    const qint64 mp = (5 * dayOfYear + 2) / 153;
    const int day = int(dayOfYear - (153 * mp + 2) / 5 + 1);
    const int month = int(mp < 10 ? mp + 3 : mp - 9);
    const qint64 year = yearOfEra + era * 400 + (month <= 2 ? 1 : 0);
    if (year < 1 || year > 9999) // QDateTime's own text for the odd ones
        return QDateTime::fromMSecsSinceEpoch(msecs, Qt::UTC).toString(Qt::ISODateWithMs);

    QString text(QStringLiteral("0000-00-00T00:00:00.000Z"));
    QChar *out = text.data();
    const auto put = [out](int at, int value, int digits) {
        for (int i = at + digits - 1; i >= at; --i, value /= 10)
            out[i] = QLatin1Char(char('0' + value % 10));
    };
    const int seconds = int(rest / 1000);
    put(0, int(year), 4);
    put(5, month, 2);
    put(8, day, 2);
    put(11, seconds / 3600, 2);
    put(14, seconds / 60 % 60, 2);
    put(17, seconds % 60, 2);
    put(20, int(rest % 1000), 3);
    return text;
}

ContentManager *ContentManager::managerFromType(int type)
{
    DbManager &database = DbManager::instance();
    const ThemeletContent::Type key = ThemeletContent::Type(type);
    // The null entry stays, also for types that never get a manager.
    if (ContentManager *existing = database.m_contentManagers[key])
        return existing;
    if (uint(type) > 7 || type == 3 || type == 5)
        return nullptr;

    ContentManager *manager = nullptr;
    switch (type) {
    case ThemeletContent::File:
        manager = new FileManager(DbManager::instance(), nullptr);
        break;
    case ThemeletContent::Themelet:
        manager = new ThemeletManager(DbManager::instance(), nullptr);
        break;
    case ThemeletContent::Photo:
        manager = new ImageManager(DbManager::instance());
        break;
    case ThemeletContent::Download:
        manager = new DownloadManager(DbManager::instance());
        break;
    case 6:
        // Its constructor creates the themelet and index managers first.
        manager = new InstallManager(DbManager::instance(), nullptr);
        break;
    case 7:
        manager = new IndexManager(DbManager::instance());
        break;
    default:
        break;
    }
    // Stored only now: a constructor may create other managers, which can
    // rehash the table under a reference taken before.
    database.m_contentManagers[key] = manager;
    return manager;
}

bool ContentManager::updateFirst(QList<ContentManager *> &managers)
{
    if (managers.isEmpty())
        return false;
    if (managers.first()->updateMetaData())
        return true;
    managers.removeFirst();
    return !managers.isEmpty();
}

QList<ContentManager *> ContentManager::scannerManagers()
{
    return { managerFromType(ThemeletContent::Photo) };
}
