// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "profile.h"

#include "profilestore.h"
#include "profiletracker.h"

#include <QDebug>

#include <climits>
#include <cstdlib>
#include <cstring>

namespace {

QString fromUtf8(const char *text)
{
    return QString::fromUtf8(text);
}

// malloc'd, so that the caller frees it with free().
char *duplicate(const QString &text)
{
    return text.isNull() ? nullptr : strdup(text.toUtf8().constData());
}

int leadingInt(const QString &text)
{
    const long number = std::strtol(text.toUtf8().constData(), nullptr, 10);
    return int(qBound<long>(INT_MIN, number, INT_MAX));
}

int result(bool ok)
{
    return ok ? 0 : -1;
}

}

char *profile_get_value(const char *profile, const char *key)
{
    return duplicate(ProfileStore::text(ProfileStore::value(fromUtf8(profile), fromUtf8(key))));
}

int profile_set_value(const char *profile, const char *key, const char *value)
{
    const QVariant stored = value && *value ? QVariant(fromUtf8(value)) : QVariant();
    return result(ProfileStore::setValue(fromUtf8(profile), fromUtf8(key), stored));
}

int profile_get_value_as_int(const char *profile, const char *key)
{
    const QVariant value = ProfileStore::value(fromUtf8(profile), fromUtf8(key));
    if (value.userType() == QMetaType::Bool)
        return value.toBool() ? 1 : 0;
    return leadingInt(ProfileStore::text(value));
}

int profile_set_value_as_int(const char *profile, const char *key, int value)
{
    return result(ProfileStore::setValue(fromUtf8(profile), fromUtf8(key), value));
}

int profile_get_value_as_bool(const char *profile, const char *key)
{
    const QVariant value = ProfileStore::value(fromUtf8(profile), fromUtf8(key));
    if (value.userType() == QMetaType::Bool)
        return value.toBool() ? 1 : 0;
    return profile_parse_bool(ProfileStore::text(value).toUtf8().constData());
}

int profile_set_value_as_bool(const char *profile, const char *key, int value)
{
    return result(ProfileStore::setValue(fromUtf8(profile), fromUtf8(key), value != 0));
}

int profile_parse_bool(const char *text)
{
    const QString value = fromUtf8(text).trimmed();
    if (value.compare(QLatin1String("true"), Qt::CaseInsensitive) == 0
            || value.compare(QLatin1String("on"), Qt::CaseInsensitive) == 0
            || value.compare(QLatin1String("yes"), Qt::CaseInsensitive) == 0)
        return 1;
    bool isNumber = false;
    const qlonglong number = value.toLongLong(&isNumber);
    return isNumber && number != 0 ? 1 : 0;
}

char *profile_get_profile(void)
{
    return duplicate(ProfileStore::activeProfile());
}

int profile_set_profile(const char *profile)
{
    return result(ProfileStore::setActiveProfile(fromUtf8(profile)));
}

int profile_tracker_init(void)
{
    ProfileTracker *tracker = ProfileTracker::instance();
    if (!tracker)
        return -1;
    tracker->start();
    return 0;
}

void profile_tracker_quit(void)
{
    if (ProfileTracker *tracker = ProfileTracker::instance())
        tracker->stop();
}

void profile_connection_enable_autoconnect(void)
{
}

void profile_track_add_profile_cb(profile_track_profile_fn callback, void *user_data,
                                  profile_user_data_free_fn free_user_data)
{
    if (ProfileTracker *tracker = ProfileTracker::instance())
        tracker->addProfileCallback(callback, user_data, free_user_data);
}

void profile_track_remove_profile_cb(profile_track_profile_fn callback, void *user_data)
{
    if (ProfileTracker *tracker = ProfileTracker::instance())
        tracker->removeProfileCallback(callback, user_data);
}

void profile_track_add_active_cb(profile_track_value_fn callback, void *user_data,
                                 profile_user_data_free_fn free_user_data)
{
    if (ProfileTracker *tracker = ProfileTracker::instance())
        tracker->addValueCallback(ProfileTracker::Active, callback, user_data, free_user_data);
}

void profile_track_remove_active_cb(profile_track_value_fn callback, void *user_data)
{
    if (ProfileTracker *tracker = ProfileTracker::instance())
        tracker->removeValueCallback(ProfileTracker::Active, callback, user_data);
}

void profile_track_add_change_cb(profile_track_value_fn callback, void *user_data,
                                 profile_user_data_free_fn free_user_data)
{
    if (ProfileTracker *tracker = ProfileTracker::instance())
        tracker->addValueCallback(ProfileTracker::Change, callback, user_data, free_user_data);
}

void profile_track_remove_change_cb(profile_track_value_fn callback, void *user_data)
{
    if (ProfileTracker *tracker = ProfileTracker::instance())
        tracker->removeValueCallback(ProfileTracker::Change, callback, user_data);
}
