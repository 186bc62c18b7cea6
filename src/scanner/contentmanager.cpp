#include "contentmanager.h"

#include "dbmanager.h"
#include "downloadmanager.h"
#include "filemanager.h"
#include "imagemanager.h"
#include "indexmanager.h"
#include "installmanager.h"
#include "themeletmanager.h"

#include <QFileInfo>

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

QDateTime ContentManager::modificationTime(const QFileInfo &info)
{
    return info.lastModified().toUTC();
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
