// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CONTENTMANAGER_H
#define CONTENTMANAGER_H

#include <QDateTime>
#include <QList>
#include <QMap>
#include <QString>
#include <QVariant>

class QFileInfo;

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

    // The value the index stores for a file's time: the text the SQL driver
    // makes of modificationTime(). Public for the service's own rows.
    static QVariant storedModificationTime(const QString &path);

protected:
    // A file's time as an instant: stored so, it reads back equal under any
    // time zone, also in the repeated hour of a clock change. Read from stat
    // as UTC, with no local-time conversion on the way.
    static QDateTime modificationTime(const QFileInfo &info);
    static QString timeText(qint64 msecs);

    // One step of a driver's list: the head runs until it reports no more,
    // then it is dropped. False once the list is empty.
    static bool updateFirst(QList<ContentManager *> &managers);
};

#endif
