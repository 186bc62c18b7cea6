// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PROFILETRACKER_H
#define PROFILETRACKER_H

#include "profile.h"

#include <QList>
#include <QObject>
#include <QString>

// Turns dconf's change notices under the profile tree into the callbacks of
// the profile interface, while it runs.
class ProfileTracker : public QObject
{
    Q_OBJECT
public:
    enum ValueCallbacks { Active, Change };

    // Null once the process is tearing its statics down.
    static ProfileTracker *instance();

    ProfileTracker();
    ~ProfileTracker() override;

    void start();
    void stop();

    void addProfileCallback(profile_track_profile_fn callback, void *userData,
                            profile_user_data_free_fn freeUserData);
    void removeProfileCallback(profile_track_profile_fn callback, void *userData);
    void addValueCallback(ValueCallbacks kind, profile_track_value_fn callback, void *userData,
                          profile_user_data_free_fn freeUserData);
    void removeValueCallback(ValueCallbacks kind, profile_track_value_fn callback, void *userData);

private:
    template <typename Function>
    struct Callback {
        Function function;
        void *userData;
        profile_user_data_free_fn freeUserData;
        bool operator==(const Callback &other) const
        {
            return function == other.function && userData == other.userData;
        }
    };
    using ProfileCallback = Callback<profile_track_profile_fn>;
    using ValueCallback = Callback<profile_track_value_fn>;

    template <typename Function>
    static void remove(QList<Callback<Function>> &callbacks, Function function, void *userData);

    void storeChanged(const QString &path);
    void profileChanged();
    void valuesChanged(const QString &relativePath);
    void valueChanged(const QString &profile, const QString &key);

    bool m_running = false;
    QList<ProfileCallback> m_profileCallbacks;
    QList<ValueCallback> m_valueCallbacks[2];
};

#endif
