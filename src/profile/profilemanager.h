// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PROFILEMANAGER_H
#define PROFILEMANAGER_H

#include <QByteArray>
#include <QObject>
#include <QQmlParserStatus>
#include <QString>

// One named sound profile of the profile daemon as properties. Values are
// read on first use and then cached; writes go straight to the daemon, and
// its change notices keep the cache current.
class ProfileManager : public QObject, public QQmlParserStatus
{
    Q_OBJECT
    Q_INTERFACES(QQmlParserStatus)
    Q_PROPERTY(Profile profile READ profile WRITE setProfile NOTIFY profileChanged)
    Q_PROPERTY(Profile activeProfile READ activeProfile WRITE setActiveProfile NOTIFY activeProfileChanged)
    Q_PROPERTY(int ringerVolume READ ringerVolume WRITE setRingerVolume NOTIFY ringerVolumeChanged)
    Q_PROPERTY(QString ringerToneFile READ ringerToneFile WRITE setRingerToneFile NOTIFY ringerToneFileChanged)
    Q_PROPERTY(QString messageToneFile READ messageToneFile WRITE setMessageToneFile NOTIFY messageToneFileChanged)
    Q_PROPERTY(QString chatToneFile READ chatToneFile WRITE setChatToneFile NOTIFY chatToneFileChanged)
    Q_PROPERTY(QString mailToneFile READ mailToneFile WRITE setMailToneFile NOTIFY mailToneFileChanged)
    Q_PROPERTY(QString internetCallToneFile READ internetCallToneFile WRITE setInternetCallToneFile NOTIFY internetCallToneFileChanged)
    Q_PROPERTY(QString calendarToneFile READ calendarToneFile WRITE setCalendarToneFile NOTIFY calendarToneFileChanged)
    Q_PROPERTY(QString clockAlarmToneFile READ clockAlarmToneFile WRITE setClockAlarmToneFile NOTIFY clockAlarmToneFileChanged)
    Q_PROPERTY(bool ringerToneEnabled READ ringerToneEnabled WRITE setRingerToneEnabled NOTIFY ringerToneEnabledChanged)
    Q_PROPERTY(bool messageToneEnabled READ messageToneEnabled WRITE setMessageToneEnabled NOTIFY messageToneEnabledChanged)
    Q_PROPERTY(bool chatToneEnabled READ chatToneEnabled WRITE setChatToneEnabled NOTIFY chatToneEnabledChanged)
    Q_PROPERTY(bool mailToneEnabled READ mailToneEnabled WRITE setMailToneEnabled NOTIFY mailToneEnabledChanged)
    Q_PROPERTY(bool internetCallToneEnabled READ internetCallToneEnabled WRITE setInternetCallToneEnabled NOTIFY internetCallToneEnabledChanged)
    Q_PROPERTY(bool calendarToneEnabled READ calendarToneEnabled WRITE setCalendarToneEnabled NOTIFY calendarToneEnabledChanged)
    Q_PROPERTY(bool clockAlarmToneEnabled READ clockAlarmToneEnabled WRITE setClockAlarmToneEnabled NOTIFY clockAlarmToneEnabledChanged)
    Q_PROPERTY(bool activateProfileOnChange READ activateProfileOnChange WRITE setActivateProfileOnChange NOTIFY activateProfileOnChangeChanged)

public:
    enum Profile { Themelet, General, Silent, Unknown };
    Q_ENUM(Profile)

    enum ToneId {
        RingerVolume,
        RingerTone,
        MessageTone,
        ChatTone,
        MailTone,
        InternetCallTone,
        CalendarTone,
        ClockAlarmTone
    };
    Q_ENUM(ToneId)

    explicit ProfileManager(QObject *parent = nullptr);
    ~ProfileManager() override;

    void classBegin() override;
    void componentComplete() override;

    QByteArray profileName() const;

    Profile profile() const;
    void setProfile(Profile profile);

    Profile activeProfile() const;
    void setActiveProfile(Profile profile);

    bool activateProfileOnChange() const;
    void setActivateProfileOnChange(bool activate);

    int ringerVolume();
    void setRingerVolume(int volume);

    QString ringerToneFile() { return toneFile(RingerTone); }
    void setRingerToneFile(const QString &file) { setToneFile(RingerTone, file); }
    QString messageToneFile() { return toneFile(MessageTone); }
    void setMessageToneFile(const QString &file) { setToneFile(MessageTone, file); }
    QString chatToneFile() { return toneFile(ChatTone); }
    void setChatToneFile(const QString &file) { setToneFile(ChatTone, file); }
    QString mailToneFile() { return toneFile(MailTone); }
    void setMailToneFile(const QString &file) { setToneFile(MailTone, file); }
    QString internetCallToneFile() { return toneFile(InternetCallTone); }
    void setInternetCallToneFile(const QString &file) { setToneFile(InternetCallTone, file); }
    QString calendarToneFile() { return toneFile(CalendarTone); }
    void setCalendarToneFile(const QString &file) { setToneFile(CalendarTone, file); }
    QString clockAlarmToneFile() { return toneFile(ClockAlarmTone); }
    void setClockAlarmToneFile(const QString &file) { setToneFile(ClockAlarmTone, file); }

    bool ringerToneEnabled() { return toneEnabled(RingerTone); }
    void setRingerToneEnabled(bool enabled) { setToneEnabled(RingerTone, enabled); }
    bool messageToneEnabled() { return toneEnabled(MessageTone); }
    void setMessageToneEnabled(bool enabled) { setToneEnabled(MessageTone, enabled); }
    bool chatToneEnabled() { return toneEnabled(ChatTone); }
    void setChatToneEnabled(bool enabled) { setToneEnabled(ChatTone, enabled); }
    bool mailToneEnabled() { return toneEnabled(MailTone); }
    void setMailToneEnabled(bool enabled) { setToneEnabled(MailTone, enabled); }
    bool internetCallToneEnabled() { return toneEnabled(InternetCallTone); }
    void setInternetCallToneEnabled(bool enabled) { setToneEnabled(InternetCallTone, enabled); }
    bool calendarToneEnabled() { return toneEnabled(CalendarTone); }
    void setCalendarToneEnabled(bool enabled) { setToneEnabled(CalendarTone, enabled); }
    bool clockAlarmToneEnabled() { return toneEnabled(ClockAlarmTone); }
    void setClockAlarmToneEnabled(bool enabled) { setToneEnabled(ClockAlarmTone, enabled); }

    Q_INVOKABLE void clear();
    Q_INVOKABLE void clearToneSettings(ToneId id);
    Q_INVOKABLE void clearTone(ToneId id);

    // Callbacks of the profile library; the user data is the object.
    static void currentProfileChangedCallback(const char *profile, ProfileManager *self);
    static void updateStateCallBackTrampoline(const char *profile, const char *key, const char *value,
                                              const char *type, ProfileManager *self);
    void updateStateCallBack(const char *profile, const char *key, const char *value, const char *type);

signals:
    void profileChanged();
    void ringerVolumeChanged();
    void ringerToneFileChanged();
    void messageToneFileChanged();
    void messageToneVolumeChanged(); // never emitted
    void internetCallToneFileChanged();
    void chatToneFileChanged();
    void mailToneFileChanged();
    void calendarToneFileChanged();
    void clockAlarmToneFileChanged();
    void ringerToneEnabledChanged();
    void messageToneEnabledChanged();
    void chatToneEnabledChanged();
    void mailToneEnabledChanged();
    void internetCallToneEnabledChanged();
    void calendarToneEnabledChanged();
    void clockAlarmToneEnabledChanged();
    void activeProfileChanged();
    void activateProfileOnChangeChanged();
    void profileUpdated();

private:
    static constexpr int ToneCount = ClockAlarmTone;

    Profile _profile(const QString &name) const;

    QString toneFile(ToneId id);
    void setToneFile(ToneId id, const QString &file);
    bool toneEnabled(ToneId id);
    void setToneEnabled(ToneId id, bool enabled);
    void clearKey(const char *key);

    QByteArray m_profileName;
    int m_ringerVolume;
    bool m_activateProfileOnChange;
    // Indexed by ToneId - 1. A null file and a switch of -1 are not read yet.
    QString m_toneFiles[ToneCount];
    int m_toneEnabled[ToneCount];

    static int s_instanceCounter;
};

#endif
