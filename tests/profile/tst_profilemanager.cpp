// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "dconftest.h"
#include "profile.h"
#include "profilemanager.h"

#include <QtTest>

static const QString s_profiles = QStringLiteral("/org/orbaline/themelet/profiles/");
static const QStringList s_tones { "ringing", "sms", "im", "email", "voip", "calendar", "clock" };
static int s_heard = 0;
static QStringList s_keys;

// Every signal of an object by name, in the order they come.
class SignalLog : public QObject
{
    Q_OBJECT
public:
    explicit SignalLog(QObject *object)
    {
        for (int i = QObject::staticMetaObject.methodCount(); i < object->metaObject()->methodCount(); ++i) {
            if (object->metaObject()->method(i).methodType() == QMetaMethod::Signal)
                QMetaObject::connect(object, i, this, staticMetaObject.indexOfSlot("record()"));
        }
    }
    QStringList names;

private slots:
    void record() { names << QString::fromLatin1(sender()->metaObject()->method(senderSignalIndex()).name()); }
};

// Whether a value callback of the test's own hears a change written by another process,
// which it does only while the profile tracker runs.
static bool trackerRuns()
{
    static int round = 0;
    s_heard = 0;
    DConfTest::write(s_profiles + "silent/custom.key", QString::number(++round));
    return DConfTest::barrier() && s_heard > 0;
}

class tst_ProfileManager : public QObject
{
    Q_OBJECT
private slots:
    void initTestCase()
    {
        profile_track_add_change_cb([](const char *, const char *, const char *, const char *, void *) { ++s_heard; }, nullptr, nullptr);
    }

    void init()
    {
        DConfTest::reset(QStringLiteral("/org/orbaline/themelet/"));
        QVERIFY(DConfTest::barrier());
    }

    // The first object starts the tracker and the last one stops it, counting objects only: a
    // tracker stopped by someone else while objects live stays stopped for a second object.
    void instanceCounting()
    {
        QVERIFY(!trackerRuns());
        auto *first = new ProfileManager;
        QVERIFY(trackerRuns());
        auto *second = new ProfileManager;
        delete first;
        QVERIFY(trackerRuns());
        delete second;
        QVERIFY(!trackerRuns());

        first = new ProfileManager;
        profile_tracker_quit();
        second = new ProfileManager;
        QVERIFY(!trackerRuns());
        delete second;
        delete first;
        ProfileManager third;
        QVERIFY(trackerRuns());
    }

    // A value written by another process: the signals in order, then "volume messageTone chatTone mailEnabled".
    void notices_data()
    {
        QTest::addColumn<ProfileManager::Profile>("profile");
        QTest::addColumn<QString>("path");
        QTest::addColumn<QString>("value");
        QTest::addColumn<QString>("signalNames");
        QTest::addColumn<QString>("read");
        QTest::newRow("tone of an inactive profile") << ProfileManager::Silent << "silent/sms.alert.tone" << "'/new.ogg'"
                << "messageToneFileChanged profileUpdated" << "0 /new.ogg /chat.ogg 0";
        QTest::newRow("switch") << ProfileManager::General << "general/email.alert.enabled" << "'on'"
                << "mailToneEnabledChanged profileUpdated" << "0 /cached.ogg /chat.ogg 1";
        QTest::newRow("chat tone reaches only profileUpdated") << ProfileManager::General << "general/im.alert.tone" << "'/other.ogg'"
                << "profileUpdated" << "0 /cached.ogg /chat.ogg 0";
        QTest::newRow("unknown profile") << ProfileManager::Unknown << "general/ringing.alert.volume" << "30" << "" << "";
    }

    void notices()
    {
        QFETCH(ProfileManager::Profile, profile);
        QFETCH(QString, path);
        QFETCH(QString, value);
        QFETCH(QString, signalNames);
        QFETCH(QString, read);
        const QByteArray name = path.section('/', 0, 0).toUtf8();
        QVERIFY(profile_set_value_as_int(name, "ringing.alert.volume", 0) == 0 && profile_set_value(name, "sms.alert.tone", "/cached.ogg") == 0
                && profile_set_value(name, "im.alert.tone", "/chat.ogg") == 0);
        QVERIFY(DConfTest::barrier());
        if (profile == ProfileManager::Unknown)
            QTest::ignoreMessage(QtWarningMsg, "QByteArray _profileName(ProfileManager::Profile) Unknown profile");
        ProfileManager manager;
        manager.setProfile(profile);
        const auto readAll = [&] { // not for an unknown profile, each read of which warns
            return read.isEmpty() ? read : QStringList { QString::number(manager.ringerVolume()), manager.messageToneFile(), manager.chatToneFile(),
                                 QString::number(manager.mailToneEnabled()) }.join(' ');
        };
        QCOMPARE(readAll(), read.isEmpty() ? read : "0 /cached.ogg /chat.ogg 0");
        SignalLog log(&manager);
        DConfTest::write(s_profiles + path, value);
        QVERIFY(DConfTest::barrier());
        QCOMPARE(log.names.join(' '), signalNames);
        QCOMPARE(readAll(), read);
    }

    // Reads ask the library once; writes compare with the cache, except that an empty tone
    // is always written; a first volume read signals.
    void cacheAndWrites()
    {
        ProfileManager manager;
        SignalLog log(&manager);
        QCOMPARE(manager.ringerVolume(), 0);
        QCOMPARE(manager.ringerVolume(), 0);
        manager.setRingerToneFile("/a.ogg");
        manager.setRingerToneFile("/a.ogg");
        manager.setRingerToneFile("");
        manager.setRingerToneFile("");
        manager.setRingerVolume(0);
        manager.setRingerVolume(40);
        manager.setProfile(ProfileManager::Silent);
        manager.setProfile(ProfileManager::Silent);
        QCOMPARE(log.names.join(' '), "ringerVolumeChanged ringerToneFileChanged ringerToneFileChanged ringerToneFileChanged "
                                      "ringerVolumeChanged profileChanged");
    }

    // The clearing calls touch no cache and signal nothing themselves; what they cleared
    // comes back as notices, in the order written.
    void clearing_data()
    {
        QTest::addColumn<QString>("call");
        QTest::addColumn<int>("id");
        QTest::addColumn<QString>("keys");
        QString all = "ringing.alert.volume";
        for (const char *suffix : { ".alert.tone", ".alert.enabled" }) {
            for (const QString &tone : s_tones)
                all += ' ' + tone + suffix;
        }
        QTest::newRow("clear") << "clear" << 0 << all;
        QTest::newRow("settings of a tone") << "clearToneSettings" << int(ProfileManager::ChatTone) << "im.alert.tone im.alert.enabled";
        QTest::newRow("tone only") << "clearTone" << int(ProfileManager::ClockAlarmTone) << "clock.alert.tone";
        QTest::newRow("tone 0 is the volume") << "clearTone" << 0 << "ringing.alert.volume";
        QTest::newRow("settings of id 8") << "clearToneSettings" << 8 << "";
        QTest::newRow("tone -1") << "clearTone" << -1 << "";
    }

    void clearing()
    {
        QFETCH(QString, call);
        QFETCH(int, id);
        QFETCH(QString, keys);
        ProfileManager manager;
        QVERIFY(profile_set_value_as_int("general", "ringing.alert.volume", 5) == 0);
        for (const QString &tone : s_tones) {
            QVERIFY(profile_set_value("general", (tone + ".alert.tone").toUtf8(), "/t.ogg") == 0
                    && profile_set_value_as_bool("general", (tone + ".alert.enabled").toUtf8(), 1) == 0);
        }
        QVERIFY(DConfTest::barrier());
        QCOMPARE(manager.ringerVolume(), 5);
        QCOMPARE(manager.chatToneFile(), "/t.ogg");

        s_keys.clear();
        const profile_track_value_fn record = [](const char *, const char *key, const char *, const char *, void *) { s_keys << key; };
        profile_track_add_active_cb(record, nullptr, nullptr);
        SignalLog log(&manager);
        if (keys.isEmpty())
            QTest::ignoreMessage(QtWarningMsg, qPrintable("void ProfileManager::" + call + "(ProfileManager::ToneId) Unknown tone id!"));
        if (call == "clear")
            manager.clear();
        else
            (manager.*(call == "clearTone" ? &ProfileManager::clearTone : &ProfileManager::clearToneSettings))(ProfileManager::ToneId(id));
        QCOMPARE(log.names, QStringList());
        QCOMPARE(manager.ringerVolume(), 5);
        QVERIFY(DConfTest::barrier());
        profile_track_remove_active_cb(record, nullptr);
        QCOMPARE(s_keys.join(' '), keys);
        QCOMPARE(manager.chatToneFile(), "/t.ogg"); // the gap: a cleared chat tone isn't noticed
    }
};

QTEST_GUILESS_MAIN(tst_ProfileManager)
#include "tst_profilemanager.moc"
