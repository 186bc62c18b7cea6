#include "dconftest.h"
#include "profile.h"
#include "sysroot.h"

#include <QDir>
#include <QtTest>

#include <cstdlib>

namespace {

const QString s_tree = QStringLiteral("/org/orbaline/themelet/");
const QString s_defaults = QStringLiteral("/etc/themelet/profiles.ini");
QStringList s_calls;
int s_freed = 0;
char s_active[] = "active", s_change[] = "change", s_current[] = "current", s_extra[] = "extra";

void writeDefaults(const QByteArray &content)
{
    QDir().mkpath(QFileInfo(Sysroot::path(s_defaults)).path());
    QFile file(Sysroot::path(s_defaults));
    QVERIFY(file.open(QIODevice::WriteOnly) && file.write(content) == content.size());
}

QString text(const char *text)
{
    return text ? QString::fromUtf8(text) : QStringLiteral("<null>");
}

QString take(char *value)
{
    const QString result = text(value);
    free(value);
    return result;
}

void recordProfile(const char *profile, void *tag)
{
    s_calls << QString(static_cast<const char *>(tag)) + " profile " + text(profile);
}

void recordValue(const char *profile, const char *key, const char *value, const char *type, void *tag)
{
    s_calls << QStringList { static_cast<const char *>(tag), text(profile), text(key), text(value), text(type) }.join(' ');
}

void removeSelf(const char *, const char *, const char *, const char *, void *tag)
{
    s_calls << "removing";
    profile_track_remove_active_cb(&removeSelf, tag);
}

// A profile set active, a value set beforehand, one change ("how value") of the value at path,
// then the value read back as "text|int|bool", and the callbacks.
struct Case
{
    QString active, before, change, path, read;
    QStringList calls = {};
};

}

Q_DECLARE_METATYPE(Case)

class tst_Profile : public QObject
{
    Q_OBJECT
private slots:
    void initTestCase();
    void init();
    void values_data();
    void values();
    void callbacks();
    void shippedDefaults();
};

void tst_Profile::initTestCase()
{
    profile_track_add_profile_cb(&recordProfile, s_current, nullptr);
    profile_track_add_active_cb(&recordValue, s_active, nullptr);
    profile_track_add_change_cb(&recordValue, s_change, nullptr);
    QCOMPARE(profile_tracker_init(), 0);
}

void tst_Profile::init()
{
    writeDefaults("[fallback]\nringing.alert.tone=/snd/ring.ogg\nsms.alert.tone=/snd/sms.ogg\nringing.alert.volume=70\n"
                  "[silent]\nringing.alert.volume=0\n");
    DConfTest::reset(s_tree);
    QVERIFY(DConfTest::barrier());
    s_calls.clear();
}

void tst_Profile::values_data()
{
    QTest::addColumn<Case>("c");

    // Unset values come from the profile's group of the defaults file, then from [fallback].
    QTest::newRow("fallback profile") << Case { "general", "", "", "fallback/sms.alert.tone", "/snd/sms.ogg|0|0" };
    QTest::newRow("group before fallback") << Case { "general", "", "", "silent/ringing.alert.volume", "0|0|0" };
    QTest::newRow("fallback group") << Case { "general", "", "", "themelet/ringing.alert.volume", "70|70|1" };
    // Active callbacks hear of the active profile, change callbacks of the others.
    QTest::newRow("text") << Case { "general", "", "text /x/é.ogg", "general/email.alert.tone", "/x/é.ogg|0|0",
                                    { "active general email.alert.tone /x/é.ogg string" } };
    QTest::newRow("number") << Case { "general", "", "int 55", "silent/ringing.alert.volume", "55|55|1",
                                      { "change silent ringing.alert.volume 55 integer" } };
    QTest::newRow("switch") << Case { "silent", "", "bool 1", "silent/sms.alert.enabled", "true|1|1",
                                      { "active silent sms.alert.enabled true boolean" } };
    QTest::newRow("other process") << Case { "general", "", "write 12.75", "general/ringing.alert.volume", "12.75|12|0",
                                             { "active general ringing.alert.volume 12.75 double" } };
    QTest::newRow("cleared shows default") << Case { "general", "/a.ogg", "text", "general/ringing.alert.tone",
            "/snd/ring.ogg|0|0", { "active general ringing.alert.tone /snd/ring.ogg string" } };
    QTest::newRow("cleared without default") << Case { "general", "x", "text", "general/custom.key", "<null>|0|0",
                                                       { "active general custom.key <null> <null>" } };
    QTest::newRow("profile switch") << Case { "general", "", "profile silent", "general/sms.alert.tone", "/snd/sms.ogg|0|0",
                                              { "current profile silent" } };
    QTest::newRow("profile reset by other process") << Case { "silent", "", "reset", "general/sms.alert.tone",
            "/snd/sms.ogg|0|0", { "current profile general" } };
}

void tst_Profile::values()
{
    QFETCH(Case, c);

    const QByteArray profile = c.path.section('/', 0, 0).toUtf8(), key = c.path.section('/', 1).toUtf8();
    const QString how = c.change.section(' ', 0, 0), value = c.change.section(' ', 1);
    QCOMPARE(profile_set_profile(c.active.toUtf8()), 0);
    if (!c.before.isEmpty())
        QCOMPARE(profile_set_value(profile, key, c.before.toUtf8()), 0);
    QVERIFY(DConfTest::barrier());
    s_calls.clear();

    const QByteArray text = value.toUtf8();
    QCOMPARE(how == "text"      ? profile_set_value(profile, key, text)
             : how == "int"     ? profile_set_value_as_int(profile, key, text.toInt())
             : how == "bool"    ? profile_set_value_as_bool(profile, key, text.toInt())
             : how == "profile" ? profile_set_profile(text) : 0, 0);
    if (how == "write")
        DConfTest::write(s_tree + "profiles/" + c.path, value);
    if (how == "reset")
        DConfTest::reset(s_tree + "profile");
    QCOMPARE(s_calls, QStringList()); // never from inside a setter
    QVERIFY(DConfTest::barrier());
    QCOMPARE(s_calls, c.calls);
    QCOMPARE(QString("%1|%2|%3").arg(take(profile_get_value(profile, key))).arg(profile_get_value_as_int(profile, key))
                     .arg(profile_get_value_as_bool(profile, key)), c.read);
}

// Callbacks count by function and user data; one may remove itself; removal frees the user
// data once. A stopped tracker drops even the notices queued before; starting twice counts once.
void tst_Profile::callbacks()
{
    profile_track_add_change_cb(&recordValue, s_extra, [](void *) { ++s_freed; });
    profile_track_add_active_cb(&removeSelf, nullptr, nullptr);
    QCOMPARE(profile_set_value("silent", "sms.alert.tone", "/1.ogg"), 0);
    QCOMPARE(profile_set_value("general", "sms.alert.tone", "/2.ogg"), 0);
    QCOMPARE(profile_set_value("general", "email.alert.tone", "/3.ogg"), 0);
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
    QCOMPARE(profile_tracker_init(), 0);
    QCOMPARE(profile_tracker_init(), 0);
    QCOMPARE(profile_set_value("silent", "sms.alert.tone", "/6.ogg"), 0);
    QVERIFY(DConfTest::barrier());
    QCOMPARE(s_calls, QStringList { "change silent sms.alert.tone /6.ogg string" });
}

// The shipped defaults: every tone is a system sound, the silent profile is silent.
void tst_Profile::shippedDefaults()
{
    QFile shipped(THEMELET_SOURCE_DIR "/data/profiles.ini");
    QVERIFY(shipped.open(QIODevice::ReadOnly));
    writeDefaults(shipped.readAll());
    for (const char *tone : { "ringing", "sms", "email", "voip", "im", "calendar", "clock" })
        QVERIFY(take(profile_get_value("themelet", tone + QByteArray(".alert.tone"))).startsWith("/usr/share/sounds/"));
    QCOMPARE(profile_get_value_as_int("general", "ringing.alert.volume"), 80);
    QCOMPARE(profile_get_value_as_bool("silent", "ringing.alert.enabled"), 0);
}

QTEST_GUILESS_MAIN(tst_Profile)
#include "tst_profile.moc"
