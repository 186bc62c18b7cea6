// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "profiletracker.h"

#include "dconfstore.h"
#include "profilestore.h"

#include <QGlobalStatic>

Q_GLOBAL_STATIC(ProfileTracker, s_tracker)

ProfileTracker *ProfileTracker::instance()
{
    return s_tracker.isDestroyed() ? nullptr : s_tracker();
}

ProfileTracker::ProfileTracker() = default;

ProfileTracker::~ProfileTracker()
{
    stop();
}

void ProfileTracker::start()
{
    if (m_running)
        return;
    if (DConfStore *store = DConfStore::instance()) {
        store->watch(ProfileStore::trackedDir(), this,
                     [this](const QString &path) { storeChanged(path); });
        m_running = true;
    }
}

void ProfileTracker::stop()
{
    if (!m_running)
        return;
    m_running = false;
    if (DConfStore *store = DConfStore::instance())
        store->unwatch(ProfileStore::trackedDir(), this);
}

void ProfileTracker::addProfileCallback(profile_track_profile_fn callback, void *userData,
                                        profile_user_data_free_fn freeUserData)
{
    if (callback)
        m_profileCallbacks.append({ callback, userData, freeUserData });
}

void ProfileTracker::removeProfileCallback(profile_track_profile_fn callback, void *userData)
{
    remove(m_profileCallbacks, callback, userData);
}

void ProfileTracker::addValueCallback(ValueCallbacks kind, profile_track_value_fn callback,
                                      void *userData, profile_user_data_free_fn freeUserData)
{
    if (callback)
        m_valueCallbacks[kind].append({ callback, userData, freeUserData });
}

void ProfileTracker::removeValueCallback(ValueCallbacks kind, profile_track_value_fn callback,
                                         void *userData)
{
    remove(m_valueCallbacks[kind], callback, userData);
}

template <typename Function>
void ProfileTracker::remove(QList<Callback<Function>> &callbacks, Function function, void *userData)
{
    const int index = callbacks.indexOf({ function, userData, nullptr });
    if (index < 0)
        return;
    const Callback<Function> removed = callbacks.takeAt(index);
    if (removed.freeUserData)
        removed.freeUserData(removed.userData);
}

void ProfileTracker::storeChanged(const QString &path)
{
    // A notice queued before stop() still arrives.
    if (!m_running)
        return;

    const bool isDir = path.endsWith(QLatin1Char('/'));
    const QString activeKey = ProfileStore::activeProfileKey();
    if (path == activeKey || (isDir && activeKey.startsWith(path)))
        profileChanged();

    const QString profilesDir = ProfileStore::profilesDir();
    if (path.startsWith(profilesDir))
        valuesChanged(path.mid(profilesDir.length()));
    else if (isDir && profilesDir.startsWith(path))
        valuesChanged(QString());
}

void ProfileTracker::profileChanged()
{
    const QByteArray name = ProfileStore::activeProfile().toUtf8();
    // A callback may remove callbacks, its own included.
    const QList<ProfileCallback> callbacks = m_profileCallbacks;
    for (const ProfileCallback &callback : callbacks) {
        if (m_running && m_profileCallbacks.contains(callback))
            callback.function(name.constData(), callback.userData);
    }
}

// A reset directory names no keys: every key its profiles may have is reported.
void ProfileTracker::valuesChanged(const QString &relativePath)
{
    const QStringList parts = relativePath.split(QLatin1Char('/'));
    if (parts.size() == 2 && !parts.at(1).isEmpty()) {
        valueChanged(parts.at(0), parts.at(1));
    } else if (parts.size() == 2) {
        for (const QString &key : ProfileStore::keys(parts.at(0)))
            valueChanged(parts.at(0), key);
    } else if (relativePath.isEmpty()) {
        for (const QString &profile : ProfileStore::profiles()) {
            for (const QString &key : ProfileStore::keys(profile))
                valueChanged(profile, key);
        }
    }
}

void ProfileTracker::valueChanged(const QString &profile, const QString &key)
{
    const QVariant value = ProfileStore::value(profile, key);
    const QByteArray profileName = profile.toUtf8();
    const QByteArray keyName = key.toUtf8();
    const QString text = ProfileStore::text(value);
    const QByteArray textData = text.toUtf8();
    const char *valueText = text.isNull() ? nullptr : textData.constData();
    const char *type = ProfileStore::typeName(value);

    const ValueCallbacks kind = profile == ProfileStore::activeProfile() ? Active : Change;
    const QList<ValueCallback> callbacks = m_valueCallbacks[kind];
    for (const ValueCallback &callback : callbacks) {
        if (m_running && m_valueCallbacks[kind].contains(callback)) {
            callback.function(profileName.constData(), keyName.constData(), valueText, type,
                              callback.userData);
        }
    }
}
