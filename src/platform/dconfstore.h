// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef DCONFSTORE_H
#define DCONFSTORE_H

#include <QHash>
#include <QObject>
#include <QStringList>
#include <QVariant>

#include <functional>

typedef struct _DConfClient DConfClient;

// The process's one dconf client. Reads and writes typed values, and hands
// dconf's change notices on to the watchers of a key or directory. Notices
// arrive through the event loop of the thread that first used the store,
// for changes of other processes and of this one alike.
class DConfStore : public QObject
{
    Q_OBJECT
public:
    using Handler = std::function<void(const QString &changedPath)>;

    // Null once the process is tearing its statics down.
    static DConfStore *instance();

    DConfStore();
    ~DConfStore() override;

    // An invalid QVariant when the key is unset, invalid or of a type that
    // has no QVariant form.
    QVariant read(const QString &key) const;
    // An invalid value resets the key. The write has reached the store when
    // this returns true.
    bool write(const QString &key, const QVariant &value);
    // Names directly below a directory ("name" for keys, "name/" for directories).
    QStringList list(const QString &dir) const;

    // The handler runs, queued on the receiver, for every change at the path,
    // below it (a directory path ends with "/") or above it (a reset directory).
    void watch(const QString &path, QObject *receiver, const Handler &handler);
    void unwatch(const QString &path, QObject *receiver);

    static bool isKey(const QString &path);

private slots:
    void notified(const QString &prefix, const QStringList &changes, const QString &tag);

private:
    struct Watch {
        QObject *receiver;
        Handler handler;
    };

    void listen();
    void dispatch(const QString &changedPath);
    void post(const QString &watchedPath, const QString &changedPath);

    DConfClient *m_client = nullptr;
    QHash<QString, QList<Watch>> m_watches;
    bool m_listening = false;
};

#endif
