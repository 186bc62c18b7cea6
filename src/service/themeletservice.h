// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETSERVICE_H
#define THEMELETSERVICE_H

#include "changenotifier.h"
#include "content.h"
#include "themeletapplier.h"
#include "themeletsettings.h"

#include <QDBusConnection>
#include <QDBusContext>
#include <QDBusMessage>
#include <QImage>
#include <QThreadPool>
#include <QObject>
#include <QSqlQuery>
#include <QStringList>
#include <QVariantMap>

class ContentManager;
class InstallManager;
class ThemeletManager;

// The object behind com.vorka.themeletd: every client write reaches the engine
// here. Input from the bus is checked before it reaches a manager, and each
// refusal is a named error reply, "com.vorka.themeletd.Error.<Name>".
class ThemeletService : public QObject, protected QDBusContext
{
    Q_OBJECT
public:
    static const char *const ServiceName;
    static const char *const ObjectPath;

    explicit ThemeletService(QObject *parent = nullptr);
    ~ThemeletService() override;

    // Builds the managers and queues the install directories, then the watched ones.
    void start(const QStringList &watchedDirectories);
    // Checkpoints the write-ahead log and closes the index.
    void stop();

public slots:
    qlonglong createThemelet(const QString &url);
    void indexFile(const QString &url);
    void installPackage(const QString &path);
    void refreshThemelets();
    void remove(int contentType, qlonglong contentId);
    void saveAttributes(int contentType, qlonglong contentId, const QVariantMap &args);
    qlonglong setThemelet(const QString &url);
    bool setFavorite(const QString &url, bool value);

signals:
    void contentChanged(int type);

private:
    enum Error { InvalidArgs, NotFound, ReadOnly, Failed };

    // A call answered later, on the connection it came from.
    struct DelayedReply
    {
        QDBusConnection connection;
        QDBusMessage message;
    };

    struct FileRow
    {
        bool found = false;
        bool themelet = false;
        int permissions = 0;
        QStringList pictures;
    };

    // Logs and replies with the error: to `call` if given (a delayed reply), else
    // to the D-Bus call being handled, if any.
    bool fail(Error error, const QString &message, const DelayedReply *call = nullptr);
    qlonglong makeThemelet(const QString &path, const QImage &thumbnail, bool tooLarge, const DelayedReply *call);
    QString localPath(const QString &url, const char *what);
    ContentManager *writableManager(int contentType);
    bool findContent(int contentType, qint64 id, FileRow *row);
    bool checkThemeletValues(const QVariantMap &values);
    bool writeAttributes(ContentManager *manager, int contentType, qint64 id, const QVariantMap &args, bool *changed);
    bool removeContent(ContentManager *manager, int contentType, qint64 id);
    QVariantList themeletSnapshot(qint64 id);
    void applyThemelet(const Themelet &themelet);
    void leaveThemelet();
    void convergeActiveThemelet();
    void nestInstallPaths(const QStringList &roots);
    Themelet activeThemelet();
    QString copyToWallpapers(const QString &path);

    static ThemeletManager *themeletManager();
    static InstallManager *installManager();

    ChangeNotifier m_notifier;
    ThemeletApplier m_applier;
    ThemeletSettings m_settings;
    QSqlQuery m_fileQuery;
    QSqlQuery m_directoryQuery;
    QSqlQuery m_snapshotQuery;
    bool m_started = false;
    // Pictures are read off the loop, one at a time; declared last, so that
    // its destructor waits for a running read while the rest is still there.
    QThreadPool m_pictureReader;
};

#endif
