// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "dconftest.h"
#include "profile.h"
#include "profiledefaults.h"

#include <QtTest>

static const QString s_tree = QStringLiteral("/org/orbaline/themelet/");
static QStringList s_calls;
static int s_freed = 0;
static char s_active[] = "active", s_change[] = "change", s_current[] = "current", s_extra[] = "extra";

static QString text(const char *text) { return text ? QString::fromUtf8(text) : QStringLiteral("<null>"); }
static QString take(char *value) { return text(QScopedPointer<char, QScopedPointerPodDeleter>(value).data()); }

static void recordValue(const char *profile, const char *key, const char *value, const char *type, void *tag)
{
    s_calls << QStringList { static_cast<const char *>(tag), text(profile), text(key), text(value), text(type) }.join(' ');
}

class tst_Profile : public QObject
{
    Q_OBJECT
private slots:
    void initTestCase()
    {
        profile_track_add_profile_cb([](const char *profile, void *) { s_calls << "current profile " + text(profile); }, s_current, nullptr);
        profile_track_add_active_cb(&recordValue, s_active, nullptr);
        profile_track_add_change_cb(&recordValue, s_change, nullptr);
        QCOMPARE(profile_tracker_init(), 0);
        // The shipped defaults.
        QVERIFY(QDir().mkpath(QFileInfo(ProfileDefaults::path()).path()));
        QVERIFY(QFile::copy(THEMELET_SOURCE_DIR "/data/profiles.ini", ProfileDefaults::path()));
    }

    void init()
    {
        DConfTest::reset(s_tree);
        QVERIFY(DConfTest::barrier());
        s_calls.clear();
    }

    // Rows "active;before;change;path;read;call": a profile set active, a value set beforehand, one
    // change ("how value") of the value at path, then the value read back as "text|int|bool" and the callback.
    void values_data()
    {
        QTest::addColumn<QString>("row");
        // Unset values come from the profile's group of the defaults file, then from [fallback], the system's sounds.
        const QString sms = "/usr/share/sounds/freedesktop/stereo/message-new-instant.oga|0|0;";
        QTest::newRow("fallback profile") << "general;;;fallback/sms.alert.tone;" + sms;
        QTest::newRow("group before fallback") << "general;;;silent/ringing.alert.volume;0|0|0;";
        QTest::newRow("fallback group") << "general;;;themelet/ringing.alert.volume;80|80|1;";
        // Active callbacks hear of the active profile, change callbacks of the others.
        QTest::newRow("text") << "general;;text /x/é.ogg;general/email.alert.tone;/x/é.ogg|0|0;active general email.alert.tone /x/é.ogg string";
        QTest::newRow("number") << "general;;int 55;silent/ringing.alert.volume;55|55|1;change silent ringing.alert.volume 55 integer";
        QTest::newRow("switch") << "silent;;bool 1;silent/sms.alert.enabled;true|1|1;active silent sms.alert.enabled true boolean";
        QTest::newRow("other process")
                << "general;;write 12.75;general/ringing.alert.volume;12.75|12|0;active general ringing.alert.volume 12.75 double";
        const QString ring = "/usr/share/sounds/freedesktop/stereo/phone-incoming-call.oga";
        QTest::newRow("cleared shows default")
                << "general;/a.ogg;text;general/ringing.alert.tone;" + ring + "|0|0;active general ringing.alert.tone " + ring + " string";
        QTest::newRow("cleared without default") << "general;x;text;general/custom.key;<null>|0|0;active general custom.key <null> <null>";
        QTest::newRow("profile switch") << "general;;profile silent;general/sms.alert.tone;" + sms + "current profile silent";
        QTest::newRow("profile reset by other process") << "silent;;reset;general/sms.alert.tone;" + sms + "current profile general";
    }

    void values()
    {
        QFETCH(QString, row);
        const QStringList c = row.split(';');
        const QByteArray profile = c[3].section('/', 0, 0).toUtf8(), key = c[3].section('/', 1).toUtf8();
        const QString how = c[2].section(' ', 0, 0), value = c[2].section(' ', 1);
        QCOMPARE(profile_set_profile(c[0].toUtf8()), 0);
        QVERIFY(c[1].isEmpty() || profile_set_value(profile, key, c[1].toUtf8()) == 0);
        QVERIFY(DConfTest::barrier());
        s_calls.clear();

        const QByteArray text = value.toUtf8();
        QCOMPARE(how == "text"      ? profile_set_value(profile, key, text)
                 : how == "int"     ? profile_set_value_as_int(profile, key, text.toInt())
                 : how == "bool"    ? profile_set_value_as_bool(profile, key, text.toInt())
                 : how == "profile" ? profile_set_profile(text) : 0, 0);
        if (how == "write" || how == "reset") // by another process
            how == "write" ? DConfTest::write(s_tree + "profiles/" + c[3], value) : DConfTest::reset(s_tree + "profile");
        QCOMPARE(s_calls, QStringList()); // never from inside a setter
        QVERIFY(DConfTest::barrier());
        QCOMPARE(s_calls.join(';'), c[5]);
        QCOMPARE(QString("%1|%2|%3").arg(take(profile_get_value(profile, key))).arg(profile_get_value_as_int(profile, key))
                         .arg(profile_get_value_as_bool(profile, key)), c[4]);
    }

    // Callbacks count by function and user data; one may remove itself; removal frees the user
    // data once. A stopped tracker drops even the notices queued before; starting twice counts once.
    void callbacks()
    {
        static const profile_track_value_fn removeSelf = [](const char *, const char *, const char *, const char *, void *) {
            s_calls << "removing";
            profile_track_remove_active_cb(removeSelf, nullptr);
        };
        profile_track_add_change_cb(&recordValue, s_extra, [](void *) { ++s_freed; });
        profile_track_add_active_cb(removeSelf, nullptr, nullptr);
        QVERIFY(profile_set_value("silent", "sms.alert.tone", "/1.ogg") == 0 && profile_set_value("general", "sms.alert.tone", "/2.ogg") == 0
                && profile_set_value("general", "email.alert.tone", "/3.ogg") == 0);
        QVERIFY(DConfTest::barrier());
        QCOMPARE(s_calls, (QStringList { "change silent sms.alert.tone /1.ogg string", "extra silent sms.alert.tone /1.ogg string",
                                         "active general sms.alert.tone /2.ogg string", "removing",
                                         "active general email.alert.tone /3.ogg string" }));
        profile_track_remove_change_cb(&recordValue, s_extra);
        profile_track_remove_change_cb(&recordValue, s_extra);
        QCOMPARE(s_freed, 1);

        s_calls.clear();
        QCOMPARE(profile_set_value("general", "sms.alert.tone", "/4.ogg"), 0);
        profile_tracker_quit();
        DConfTest::write(s_tree + "profiles/silent/sms.alert.tone", "'/5.ogg'");
        QVERIFY(DConfTest::barrier());
        QCOMPARE(s_calls, QStringList());
        QVERIFY(profile_tracker_init() == 0 && profile_tracker_init() == 0);
        QCOMPARE(profile_set_value("silent", "sms.alert.tone", "/6.ogg"), 0);
        QVERIFY(DConfTest::barrier());
        QCOMPARE(s_calls, QStringList { "change silent sms.alert.tone /6.ogg string" });
    }
};

QTEST_GUILESS_MAIN(tst_Profile)
#include "tst_profile.moc"
