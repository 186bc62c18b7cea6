// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "profilemanager.h"

#include "profile.h"

#include <QDebug>

#include <algorithm>
#include <cstdlib>
#include <iterator>

int ProfileManager::s_instanceCounter = 0;

namespace {

struct ToneKeys
{
    const char *tone;
    const char *enabled;
    void (ProfileManager::*toneChanged)();
    void (ProfileManager::*enabledChanged)();
};

// Indexed by ToneId - 1, which is also the order in which clear() resets them.
const ToneKeys s_tones[] = {
    { "ringing.alert.tone", "ringing.alert.enabled",
      &ProfileManager::ringerToneFileChanged, &ProfileManager::ringerToneEnabledChanged },
    { "sms.alert.tone", "sms.alert.enabled",
      &ProfileManager::messageToneFileChanged, &ProfileManager::messageToneEnabledChanged },
    { "im.alert.tone", "im.alert.enabled",
      &ProfileManager::chatToneFileChanged, &ProfileManager::chatToneEnabledChanged },
    { "email.alert.tone", "email.alert.enabled",
      &ProfileManager::mailToneFileChanged, &ProfileManager::mailToneEnabledChanged },
    { "voip.alert.tone", "voip.alert.enabled",
      &ProfileManager::internetCallToneFileChanged, &ProfileManager::internetCallToneEnabledChanged },
    { "calendar.alert.tone", "calendar.alert.enabled",
      &ProfileManager::calendarToneFileChanged, &ProfileManager::calendarToneEnabledChanged },
    { "clock.alert.tone", "clock.alert.enabled",
      &ProfileManager::clockAlarmToneFileChanged, &ProfileManager::clockAlarmToneEnabledChanged },
};

const char s_volumeKey[] = "ringing.alert.volume";

QByteArray _profileName(ProfileManager::Profile profile)
{
    switch (profile) {
    case ProfileManager::Themelet:
        return QByteArrayLiteral("themelet");
    case ProfileManager::General:
        return QByteArrayLiteral("general");
    case ProfileManager::Silent:
        return QByteArrayLiteral("silent");
    default:
        qWarning() << "QByteArray _profileName(ProfileManager::Profile)" << "Unknown profile";
        return QByteArray();
    }
}

// Takes a string of the profile library, which the caller has to free.
QString takeText(char *text)
{
    if (!text)
        return QString();
    QString result = QString::fromUtf8(text);
    std::free(text);
    // An empty value is a known one: only null means "ask again".
    return result.isNull() ? QStringLiteral("") : result;
}

// The library's callbacks take a void pointer; these hand it on typed.
void profileCallback(const char *profile, void *self)
{
    ProfileManager::currentProfileChangedCallback(profile, static_cast<ProfileManager *>(self));
}

void valueCallback(const char *profile, const char *key, const char *value, const char *type, void *self)
{
    ProfileManager::updateStateCallBackTrampoline(profile, key, value, type,
                                                  static_cast<ProfileManager *>(self));
}

}

ProfileManager::ProfileManager(QObject *parent)
    : QObject(parent)
    , m_profileName("general")
    , m_ringerVolume(-1)
    , m_activateProfileOnChange(false)
{
    std::fill(std::begin(m_toneEnabled), std::end(m_toneEnabled), -1);

    profile_track_add_profile_cb(profileCallback, this, nullptr);
    profile_track_add_active_cb(valueCallback, this, nullptr);
    profile_track_add_change_cb(valueCallback, this, nullptr);
    profile_connection_enable_autoconnect();
    if (s_instanceCounter == 0)
        profile_tracker_init();
    ++s_instanceCounter;
}

ProfileManager::~ProfileManager()
{
    // The tracker goes first, so that no notice arrives half way through.
    if (--s_instanceCounter == 0)
        profile_tracker_quit();
    profile_track_remove_profile_cb(profileCallback, this);
    profile_track_remove_active_cb(valueCallback, this);
    profile_track_remove_change_cb(valueCallback, this);
}

void ProfileManager::classBegin()
{
}

void ProfileManager::componentComplete()
{
    // Covers a profile set before the flag in QML, or left at its default.
    if (m_activateProfileOnChange)
        profile_set_profile(m_profileName.constData());
}

QByteArray ProfileManager::profileName() const
{
    return m_profileName;
}

ProfileManager::Profile ProfileManager::_profile(const QString &name) const
{
    if (name == QLatin1String("themelet"))
        return Themelet;
    if (name == QLatin1String("general"))
        return General;
    if (name == QLatin1String("silent"))
        return Silent;
    return Unknown;
}

ProfileManager::Profile ProfileManager::profile() const
{
    return _profile(QString::fromUtf8(m_profileName.constData()));
}

void ProfileManager::setProfile(Profile profile)
{
    const QByteArray name = _profileName(profile);
    if (name == m_profileName)
        return;
    // The caches stay: a client sets the profile before it reads anything.
    m_profileName = name;
    emit profileChanged();
    if (m_activateProfileOnChange)
        profile_set_profile(m_profileName.constData());
}

ProfileManager::Profile ProfileManager::activeProfile() const
{
    return _profile(takeText(profile_get_profile()));
}

void ProfileManager::setActiveProfile(Profile profile)
{
    // activeProfileChanged comes from the library's notice.
    profile_set_profile(_profileName(profile).constData());
}

bool ProfileManager::activateProfileOnChange() const
{
    return m_activateProfileOnChange;
}

void ProfileManager::setActivateProfileOnChange(bool activate)
{
    if (activate == m_activateProfileOnChange)
        return;
    m_activateProfileOnChange = activate;
    emit activateProfileOnChangeChanged();
}

int ProfileManager::ringerVolume()
{
    if (m_ringerVolume >= 0)
        return m_ringerVolume;
    m_ringerVolume = profile_get_value_as_int(m_profileName.constData(), s_volumeKey);
    emit ringerVolumeChanged();
    return m_ringerVolume;
}

void ProfileManager::setRingerVolume(int volume)
{
    if (volume == m_ringerVolume)
        return;
    m_ringerVolume = volume;
    profile_set_value_as_int(m_profileName.constData(), s_volumeKey, volume);
    emit ringerVolumeChanged();
}

QString ProfileManager::toneFile(ToneId id)
{
    QString &cached = m_toneFiles[id - 1];
    if (cached.isNull())
        cached = takeText(profile_get_value(m_profileName.constData(), s_tones[id - 1].tone));
    return cached;
}

void ProfileManager::setToneFile(ToneId id, const QString &file)
{
    QString &cached = m_toneFiles[id - 1];
    // An empty file is always written: that is how a tone is cleared.
    if (!file.isEmpty() && file == cached)
        return;
    cached = file;
    profile_set_value(m_profileName.constData(), s_tones[id - 1].tone, file.toUtf8().constData());
    emit (this->*s_tones[id - 1].toneChanged)();
}

bool ProfileManager::toneEnabled(ToneId id)
{
    int &cached = m_toneEnabled[id - 1];
    if (cached == -1)
        cached = profile_get_value_as_bool(m_profileName.constData(), s_tones[id - 1].enabled);
    return cached != 0;
}

void ProfileManager::setToneEnabled(ToneId id, bool enabled)
{
    int &cached = m_toneEnabled[id - 1];
    if (int(enabled) == cached)
        return;
    cached = enabled;
    profile_set_value_as_bool(m_profileName.constData(), s_tones[id - 1].enabled, enabled);
    emit (this->*s_tones[id - 1].enabledChanged)();
}

void ProfileManager::currentProfileChangedCallback(const char *, ProfileManager *self)
{
    emit self->activeProfileChanged();
}

void ProfileManager::updateStateCallBackTrampoline(const char *profile, const char *key, const char *value,
                                                   const char *type, ProfileManager *self)
{
    self->updateStateCallBack(profile, key, value, type);
}

void ProfileManager::updateStateCallBack(const char *profile, const char *key, const char *value, const char *)
{
    // Active and inactive profiles come through the same callback.
    if (m_profileName != profile)
        return;

    if (qstrcmp(key, s_volumeKey) == 0) {
        const int volume = QByteArray(value).toInt();
        if (volume != m_ringerVolume) {
            m_ringerVolume = volume;
            emit ringerVolumeChanged();
        }
        emit profileUpdated();
        return;
    }

    for (int i = 0; i < ToneCount; ++i) {
        // A changed chat tone deliberately reaches only profileUpdated.
        if (i == ChatTone - 1 || qstrcmp(key, s_tones[i].tone) != 0)
            continue;
        const QString file = value ? QString::fromUtf8(value) : QStringLiteral("");
        if (file != m_toneFiles[i]) {
            m_toneFiles[i] = file;
            emit (this->*s_tones[i].toneChanged)();
        }
        emit profileUpdated();
        return;
    }

    for (int i = 0; i < ToneCount; ++i) {
        if (qstrcmp(key, s_tones[i].enabled) != 0)
            continue;
        const int enabled = profile_parse_bool(value);
        if (enabled != m_toneEnabled[i]) {
            m_toneEnabled[i] = enabled;
            emit (this->*s_tones[i].enabledChanged)();
        }
        break;
    }
    emit profileUpdated();
}

void ProfileManager::clearKey(const char *key)
{
    profile_set_value(m_profileName.constData(), key, "");
}

void ProfileManager::clear()
{
    clearKey(s_volumeKey);
    for (const ToneKeys &keys : s_tones)
        clearKey(keys.tone);
    for (const ToneKeys &keys : s_tones)
        clearKey(keys.enabled);
}

void ProfileManager::clearToneSettings(ToneId id)
{
    if (id < RingerVolume || id > ClockAlarmTone) {
        qWarning() << "void ProfileManager::clearToneSettings(ProfileManager::ToneId)" << "Unknown tone id!";
        return;
    }
    if (id == RingerVolume) {
        clearKey(s_volumeKey);
        return;
    }
    clearKey(s_tones[id - 1].tone);
    clearKey(s_tones[id - 1].enabled);
}

void ProfileManager::clearTone(ToneId id)
{
    if (id < RingerVolume || id > ClockAlarmTone) {
        qWarning() << "void ProfileManager::clearTone(ProfileManager::ToneId)" << "Unknown tone id!";
        return;
    }
    clearKey(id == RingerVolume ? s_volumeKey : s_tones[id - 1].tone);
}
