#ifndef CONTENTMANAGER_H
#define CONTENTMANAGER_H

#include <QList>
#include <QMap>
#include <QString>
#include <QVariant>

// Base of the writing side: one manager per content type, owned by DbManager.
class ContentManager
{
public:
    ContentManager();
    virtual ~ContentManager();

    virtual QString mimeType() const;
    // One bounded step; true when another call may find more.
    virtual bool updateMetaData();
    virtual bool save(qint64 id, const QMap<QString, QVariant> &properties);
    virtual bool remove(qint64 id);

    static ContentManager *managerFromType(int type);
    static QList<ContentManager *> scannerManagers();
};

#endif
