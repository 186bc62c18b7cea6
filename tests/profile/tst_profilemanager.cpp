// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "dconftest.h"
#include "profile.h"
#include "profiledefaults.h"
#include "profilemanager.h"

#include <QtTest>

static const QString s_tree = QStringLiteral("/org/orbaline/themelet/"), s_profiles = s_tree + "profiles/";
static const QStringList s_tones { "ringing", "sms", "im", "email", "voip", "calendar", "clock" };
static QStringList s_calls;
static char s_active[] = "active", s_change[] = "change", s_current[] = "current";

static QString text(const char *text) { return text ? QString::fromUtf8(text) : QStringLiteral("<null>"); }

static void recordValue(const char *profile, const char *key, const char *value, const char *type, void *tag)
{
    s_calls << QStringList { static_cast<const char *>(tag), text(profile), text(key), text(value), text(type) }.join(' ');
}

// Whether the test's change callback hears a value written by another process: only while the tracker runs.
static bool trackerRuns()
{
    static int round = 0;
    s_calls.clear();
    DConfTest::write(s_profiles + "silent/custom.key", QString::number(++round));
    return DConfTest::barrier() && !s_calls.isEmpty();
}

class tst_ProfileManager : public QObject
{
    Q_OBJECT
    QStringList m_signals;

    // From now on every signal of the object, by name, in the order they come.
    void logSignals(QObject *object)
    {
        m_signals.clear();
        for (int i = QObject::staticMetaObject.methodCount(); i < object->metaObject()->methodCount(); ++i) {
            if (object->metaObject()->method(i).methodType() == QMetaMethod::Signal)
                QMetaObject::connect(object, i, this, staticMetaObject.indexOfSlot("record()"));
        }
    }

public slots: // not a test function
    void record() { m_signals << QString::fromLatin1(sender()->metaObject()->method(senderSignalIndex()).name()); }

private slots:
    void initTestCase()
    {
        profile_track_add_profile_cb([](const char *profile, void *) { s_calls << "current profile " + text(profile); }, s_current, nullptr);
        profile_track_add_active_cb(&recordValue, s_active, nullptr);
        profile_track_add_change_cb(&recordValue, s_change, nullptr);
        // The shipped defaults.
        QVERIFY(QDir().mkpath(QFileInfo(ProfileDefaults::path()).path()));
        QVERIFY(QFile::copy(THEMELET_SOURCE_DIR "/data/profiles.ini", ProfileDefaults::path()));
    }

    void init()
    {
        DConfTest::reset(s_tree);
        QVERIFY(DConfTest::barrier());
        s_calls.clear();
        QCOMPARE(profile_tracker_init(), 0);
    }

    // The first object starts the tracker and the last one stops it.
    void instanceCounting()
    {
        profile_tracker_quit();
        auto *first = new ProfileManager;
        auto *second = new ProfileManager;
        delete first;
        QVERIFY(trackerRuns());
        delete second;
        QVERIFY(!trackerRuns());
    }

    // A value written by another process: the signals in order, then "messageTone chatTone mailEnabled".
    void notices_data()
    {
        QTest::addColumn<ProfileManager::Profile>("profile");
        QTest::addColumn<QString>("path");
        QTest::addColumn<QString>("value");
        QTest::addColumn<QString>("signalNames");
        QTest::addColumn<QString>("read");
        QTest::newRow("tone of an inactive profile") << ProfileManager::Silent << "silent/sms.alert.tone" << "'/new.ogg'"
                << "messageToneFileChanged profileUpdated" << "/new.ogg /chat.ogg 0";
        QTest::newRow("switch") << ProfileManager::General << "general/email.alert.enabled" << "'on'"
                << "mailToneEnabledChanged profileUpdated" << "/cached.ogg /chat.ogg 1";
        QTest::newRow("chat tone reaches only profileUpdated") << ProfileManager::General << "general/im.alert.tone" << "'/other.ogg'"
                << "profileUpdated" << "/cached.ogg /chat.ogg 0";
    }

    void notices()
    {
        QFETCH(ProfileManager::Profile, profile);
        QFETCH(QString, path);
        QFETCH(QString, value);
        QFETCH(QString, signalNames);
        QFETCH(QString, read);
        const QByteArray name = path.section('/', 0, 0).toUtf8();
        QVERIFY(profile_set_value(name, "sms.alert.tone", "/cached.ogg") == 0 && profile_set_value(name, "im.alert.tone", "/chat.ogg") == 0
                && profile_set_value_as_bool(name, "email.alert.enabled", 0) == 0 && DConfTest::barrier()); // on by default
        ProfileManager manager;
        manager.setProfile(profile);
        const auto readAll = [&] {
            return QStringList { manager.messageToneFile(), manager.chatToneFile(), QString::number(manager.mailToneEnabled()) }.join(' ');
        };
        QCOMPARE(readAll(), "/cached.ogg /chat.ogg 0");
        logSignals(&manager);
        DConfTest::write(s_profiles + path, value);
        QVERIFY(DConfTest::barrier());
        QCOMPARE(m_signals.join(' '), signalNames);
        QCOMPARE(readAll(), read);
    }

    // Reads ask the library once; writes compare with the cache, except that an empty tone
    // is always written; a first volume read signals.
    void cacheAndWrites()
    {
        ProfileManager manager;
        logSignals(&manager);
        QCOMPARE(manager.ringerVolume(), 80);
        QCOMPARE(manager.ringerVolume(), 80);
        manager.setRingerToneFile("/a.ogg");
        manager.setRingerToneFile("/a.ogg");
        manager.setRingerToneFile("");
        manager.setRingerToneFile("");
        manager.setRingerVolume(80);
        manager.setRingerVolume(40);
        manager.setProfile(ProfileManager::Silent);
        manager.setProfile(ProfileManager::Silent);
        QCOMPARE(m_signals.join(' '), "ringerVolumeChanged ringerToneFileChanged ringerToneFileChanged ringerToneFileChanged "
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
        QTest::newRow("tone 0 is the volume") << "clearTone" << 0 << "ringing.alert.volume";
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

        s_calls.clear();
        logSignals(&manager);
        if (keys.isEmpty())
            QTest::ignoreMessage(QtWarningMsg, qPrintable("void ProfileManager::" + call + "(ProfileManager::ToneId) Unknown tone id!"));
        if (call == "clear")
            manager.clear();
        else
            (manager.*(call == "clearTone" ? &ProfileManager::clearTone : &ProfileManager::clearToneSettings))(ProfileManager::ToneId(id));
        QCOMPARE(m_signals, QStringList());
        QCOMPARE(manager.ringerVolume(), 5);
        QVERIFY(DConfTest::barrier());
        QCOMPARE(s_calls.replaceInStrings(QRegularExpression("^active general (\\S+) .*$"), "\\1").join(' '), keys);
        QCOMPARE(manager.chatToneFile(), "/t.ogg"); // the gap: a cleared chat tone isn't noticed
    }

    // The library itself. Unset values come from the profile's group of the defaults file, then from [fallback]; a cleared
    // value reads as its default. Callbacks come later, never from inside a setter: active ones hear of the active profile,
    // change ones of the others, a profile one of a switch; one may remove itself while called.
    void library()
    {
        static const profile_track_value_fn removeSelf = [](const char *, const char *, const char *, const char *, void *) {
            s_calls << "removing";
            profile_track_remove_active_cb(removeSelf, nullptr);
        };
        const QString ring = "/usr/share/sounds/freedesktop/stereo/phone-incoming-call.oga";
        const char *volume = "ringing.alert.volume";
        QVERIFY(profile_set_value("general", "ringing.alert.tone", "/a.ogg") == 0 && DConfTest::barrier());
        QCOMPARE(profile_get_value_as_int("silent", volume), 0);
        s_calls.clear();
        profile_track_add_active_cb(removeSelf, nullptr, nullptr);
        QVERIFY(profile_set_value_as_int("silent", volume, 55) == 0 && profile_set_value("general", "ringing.alert.tone", "") == 0
                && profile_set_value("general", "email.alert.tone", "/x/é.ogg") == 0);
        QCOMPARE(s_calls, QStringList());
        QVERIFY(DConfTest::barrier());
        QCOMPARE(s_calls, (QStringList { "change silent ringing.alert.volume 55 integer", "active general ringing.alert.tone " + ring + " string",
                                         "removing", "active general email.alert.tone /x/é.ogg string" }));
        QVERIFY(profile_get_value_as_int("silent", volume) == 55 && profile_get_value_as_bool("silent", volume));
        QCOMPARE(text(QScopedPointer<char, QScopedPointerPodDeleter>(profile_get_value("general", "ringing.alert.tone")).data()), ring);
        s_calls.clear();
        QVERIFY(profile_set_profile("silent") == 0 && DConfTest::barrier());
        QCOMPARE(s_calls, QStringList { "current profile silent" });
    }
};

QTEST_GUILESS_MAIN(tst_ProfileManager)
#include "tst_profilemanager.moc"
