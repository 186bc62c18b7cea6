#include "dconftest.h"
#include "profile.h"
#include "sysroot.h"

#include <QDir>
#include <QFile>
#include <QtTest>

#include <cstdlib>

namespace {

const QString s_tree = QStringLiteral("/org/orbaline/themelet/");

const char s_defaults[] =
        "[fallback]\n"
        "ringing.alert.tone=/snd/ring.ogg\n"
        "sms.alert.tone=/snd/sms.ogg\n"
        "ringing.alert.volume=70\n"
        "sms.alert.enabled=true\n"
                "[silent]\n"
        "ringing.alert.volume=0\n"
        "sms.alert.enabled=false\n";

QString defaultsPath()
{
    return Sysroot::path(QStringLiteral("/etc/themelet/profiles.ini"));
}

void writeDefaults(const QByteArray &content)
{
    QDir().mkpath(QFileInfo(defaultsPath()).path());
    QFile file(defaultsPath());
    QVERIFY(file.open(QIODevice::WriteOnly | QIODevice::Truncate));
    file.write(content);
}

QString orNull(const char *text)
{
    return text ? QString::fromUtf8(text) : QStringLiteral("<null>");
}

QString take(char *text)
{
    const QString result = orNull(text);
    free(text);
    return result;
}

QString getValue(const char *profile, const char *key)
{
    return take(profile_get_value(profile, key));
}

QStringList s_calls;

void recordProfile(const char *profile, void *userData)
{
    s_calls << QStringLiteral("%1 profile %2").arg(static_cast<const char *>(userData), orNull(profile));
}

void recordValue(const char *profile, const char *key, const char *value, const char *type, void *userData)
{
    s_calls << QStringLiteral("%1 %2 %3 %4 %5")
                       .arg(static_cast<const char *>(userData), orNull(profile), orNull(key),
                            orNull(value), orNull(type));
}

char s_active[] = "active";
char s_change[] = "change";
char s_current[] = "current";

int s_freed = 0;
void countFree(void *)
{
    ++s_freed;
}

void removeSelf(const char *, const char *, const char *, const char *, void *userData)
{
    s_calls << QStringLiteral("removing");
    profile_track_remove_active_cb(&removeSelf, userData);
}

}

class tst_Profile : public QObject
{
    Q_OBJECT
private slots:
    void initTestCase();
    void init();
    void values_data();
    void values();
    void activeProfile();
    void callbackRemovalAndTrackerStop();
    void brokenDefaults();
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
    writeDefaults(s_defaults);
    DConfTest::reset(s_tree);
    QVERIFY(DConfTest::barrier());
    s_calls.clear();
}

// Each row sets a profile active, optionally sets a value beforehand, makes
// one change, and then reads the value back and compares the callbacks.
void tst_Profile::values_data()
{
    QTest::addColumn<QString>("active");
    QTest::addColumn<QString>("before");
    QTest::addColumn<QString>("how");   // "", "text", "int", "bool", "profile", "other process", "reset"
    QTest::addColumn<QString>("path");  // profile/key
    QTest::addColumn<QString>("value");
    QTest::addColumn<QString>("text");
    QTest::addColumn<int>("number");
    QTest::addColumn<int>("flag");
    QTest::addColumn<QStringList>("calls");

    QTest::newRow("fallback profile") << "general" << "" << "" << "fallback/sms.alert.tone" << ""
                                      << "/snd/sms.ogg" << 0 << 0 << QStringList();
    QTest::newRow("group before fallback") << "general" << "" << "" << "silent/ringing.alert.volume" << ""
                                           << "0" << 0 << 0 << QStringList();
    QTest::newRow("fallback group") << "general" << "" << "" << "themelet/ringing.alert.volume" << ""
                                    << "70" << 70 << 1 << QStringList();
    QTest::newRow("active text") << "general" << "" << "text" << "general/email.alert.tone" << "/x/é.ogg"
                                 << "/x/é.ogg" << 0 << 0
                                 << QStringList { "active general email.alert.tone /x/é.ogg string" };
    QTest::newRow("text as switch") << "general" << "" << "text" << "general/sms.alert.enabled" << "On"
                                    << "On" << 0 << 1
                                    << QStringList { "active general sms.alert.enabled On string" };
    QTest::newRow("number") << "general" << "" << "int" << "silent/ringing.alert.volume" << "55"
                            << "55" << 55 << 1 << QStringList { "change silent ringing.alert.volume 55 integer" };
    QTest::newRow("switch") << "silent" << "" << "bool" << "silent/sms.alert.enabled" << "1"
                            << "true" << 1 << 1 << QStringList { "active silent sms.alert.enabled true boolean" };
    QTest::newRow("other process") << "general" << "" << "other process" << "general/ringing.alert.volume"
                                   << "12.75" << "12.75" << 12 << 0
                                   << QStringList { "active general ringing.alert.volume 12.75 double" };
    QTest::newRow("cleared shows default") << "general" << "/a.ogg" << "text" << "general/ringing.alert.tone" << ""
                                           << "/snd/ring.ogg" << 0 << 0
                                           << QStringList { "active general ringing.alert.tone /snd/ring.ogg string" };
    QTest::newRow("cleared without default") << "general" << "x" << "text" << "general/custom.key" << ""
                                             << "<null>" << 0 << 0
                                             << QStringList { "active general custom.key <null> <null>" };
    QTest::newRow("profile switch") << "general" << "" << "profile" << "general/sms.alert.tone" << "silent"
                                    << "/snd/sms.ogg" << 0 << 0 << QStringList { "current profile silent" };
    QTest::newRow("profile reset") << "silent" << "" << "reset" << "general/sms.alert.tone" << ""
                                   << "/snd/sms.ogg" << 0 << 0 << QStringList { "current profile general" };
}

void tst_Profile::values()
{
    QFETCH(QString, active);
    QFETCH(QString, before);
    QFETCH(QString, how);
    QFETCH(QString, path);
    QFETCH(QString, value);
    QFETCH(QString, text);
    QFETCH(int, number);
    QFETCH(int, flag);
    QFETCH(QStringList, calls);

    const QByteArray profile = path.section(QLatin1Char('/'), 0, 0).toUtf8();
    const QByteArray key = path.section(QLatin1Char('/'), 1).toUtf8();
    QCOMPARE(profile_set_profile(active.toUtf8()), 0);
    if (!before.isEmpty())
        QCOMPARE(profile_set_value(profile, key, before.toUtf8()), 0);
    QVERIFY(DConfTest::barrier());
    s_calls.clear();

    if (how == QLatin1String("text"))
        QCOMPARE(profile_set_value(profile, key, value.toUtf8()), 0);
    else if (how == QLatin1String("int"))
        QCOMPARE(profile_set_value_as_int(profile, key, value.toInt()), 0);
    else if (how == QLatin1String("bool"))
        QCOMPARE(profile_set_value_as_bool(profile, key, value.toInt()), 0);
    else if (how == QLatin1String("profile"))
        QCOMPARE(profile_set_profile(value.toUtf8()), 0);
    else if (how == QLatin1String("other process"))
        DConfTest::write(s_tree + QStringLiteral("profiles/") + path, value);
    else if (how == QLatin1String("reset"))
        DConfTest::reset(s_tree + QStringLiteral("profile"));
    // Never from inside the setter.
    QCOMPARE(s_calls, QStringList());

    QVERIFY(DConfTest::barrier());
    QCOMPARE(s_calls, calls);
    QCOMPARE(take(profile_get_value(profile, key)), text);
    QCOMPARE(profile_get_value_as_int(profile, key), number);
    QCOMPARE(profile_get_value_as_bool(profile, key), flag);
}

void tst_Profile::activeProfile()
{
    QCOMPARE(take(profile_get_profile()), QStringLiteral("general"));
    QCOMPARE(profile_set_profile("silent"), 0);
    QCOMPARE(take(profile_get_profile()), QStringLiteral("silent"));
    QCOMPARE(DConfTest::read(s_tree + QStringLiteral("profile")), QStringLiteral("'silent'"));
    QCOMPARE(profile_set_value_as_int("silent", "ringing.alert.volume", 9), 0);
    QCOMPARE(DConfTest::read(s_tree + QStringLiteral("profiles/silent/ringing.alert.volume")), QStringLiteral("9"));

    QTest::ignoreMessage(QtWarningMsg, "bool ProfileStore::setActiveProfile(const QString&) Invalid profile \"a/b\"");
    QCOMPARE(profile_set_profile("a/b"), -1);
    QCOMPARE(take(profile_get_profile()), QStringLiteral("silent"));
    QTest::ignoreMessage(QtWarningMsg,
                         "bool ProfileStore::setValue(const QString&, const QString&, const QVariant&) "
                         "Invalid profile or key \"general\" \"../x\"");
    QCOMPARE(profile_set_value_as_int("general", "../x", 1), -1);
    QCOMPARE(take(profile_get_value("", "sms.alert.tone")), QStringLiteral("<null>"));
    QCOMPARE(take(profile_get_value(nullptr, nullptr)), QStringLiteral("<null>"));
}

void tst_Profile::callbackRemovalAndTrackerStop()
{
    static char extra[] = "extra";
    profile_track_add_change_cb(&recordValue, extra, &countFree);
    profile_track_add_active_cb(&removeSelf, nullptr, nullptr);
    QCOMPARE(profile_set_value("silent", "sms.alert.tone", "/1.ogg"), 0);
    QCOMPARE(profile_set_value("general", "sms.alert.tone", "/2.ogg"), 0);
    QCOMPARE(profile_set_value("general", "email.alert.tone", "/3.ogg"), 0);
    QVERIFY(DConfTest::barrier());
    QCOMPARE(s_calls, (QStringList { "change silent sms.alert.tone /1.ogg string",
                                     "extra silent sms.alert.tone /1.ogg string",
                                     "active general sms.alert.tone /2.ogg string",
                                     "removing",
                                     "active general email.alert.tone /3.ogg string" }));

    s_calls.clear();
    profile_track_remove_change_cb(&recordValue, extra);
    QCOMPARE(s_freed, 1);
    profile_track_remove_change_cb(&recordValue, extra);
    QCOMPARE(s_freed, 1);
    QCOMPARE(profile_set_value("silent", "sms.alert.tone", "/4.ogg"), 0);
    QVERIFY(DConfTest::barrier());
    QCOMPARE(s_calls, QStringList { "change silent sms.alert.tone /4.ogg string" });

    // Stopped, nothing arrives, not even what was queued before the stop.
    s_calls.clear();
    QCOMPARE(profile_set_value("general", "sms.alert.tone", "/5.ogg"), 0);
    profile_tracker_quit();
    QCOMPARE(profile_set_profile("silent"), 0);
    DConfTest::write(s_tree + QStringLiteral("profiles/silent/sms.alert.tone"), QStringLiteral("'/6.ogg'"));
    QVERIFY(DConfTest::barrier());
    QCOMPARE(s_calls, QStringList());

    QCOMPARE(profile_tracker_init(), 0);
    QCOMPARE(profile_tracker_init(), 0);
    QCOMPARE(profile_set_value("silent", "sms.alert.tone", "/7.ogg"), 0);
    QVERIFY(DConfTest::barrier());
    QCOMPARE(s_calls, QStringList { "active silent sms.alert.tone /7.ogg string" });
}

void tst_Profile::brokenDefaults()
{
    writeDefaults("[fallback\nnot a key file");
    QCOMPARE(profile_set_value("general", "sms.alert.tone", "/stored.ogg"), 0);
    QCOMPARE(getValue("general", "sms.alert.tone"), QStringLiteral("/stored.ogg"));
    QTest::ignoreMessage(QtWarningMsg,
                         QRegularExpression(QStringLiteral("^ProfileDefaults::ProfileDefaults\\(\\) Failed to "
                                                           "read profile defaults \".*/etc/themelet/profiles.ini\" ")));
    QCOMPARE(getValue("general", "ringing.alert.tone"), QStringLiteral("<null>"));

    QVERIFY(QFile::remove(defaultsPath()));
    QCOMPARE(getValue("fallback", "ringing.alert.tone"), QStringLiteral("<null>"));
}

// The file that is installed: every tone of the fallback profile is a
// system sound, and the silent profile is silent.
void tst_Profile::shippedDefaults()
{
    QFile shipped(QStringLiteral(THEMELET_SOURCE_DIR "/data/profiles.ini"));
    QVERIFY(shipped.open(QIODevice::ReadOnly));
    writeDefaults(shipped.readAll());

    const char *const tones[] = { "ringing.alert.tone", "sms.alert.tone", "email.alert.tone",
                                  "voip.alert.tone", "im.alert.tone", "calendar.alert.tone",
                                  "clock.alert.tone" };
    for (const char *tone : tones) {
        QVERIFY2(getValue("fallback", tone).startsWith(QLatin1String("/usr/share/sounds/")), tone);
        QCOMPARE(getValue("themelet", tone), getValue("fallback", tone));
    }
    QCOMPARE(profile_get_value_as_int("general", "ringing.alert.volume"), 80);
    QCOMPARE(profile_get_value_as_int("silent", "ringing.alert.volume"), 0);
    QCOMPARE(profile_get_value_as_bool("general", "ringing.alert.enabled"), 1);
    QCOMPARE(profile_get_value_as_bool("silent", "ringing.alert.enabled"), 0);
}

QTEST_GUILESS_MAIN(tst_Profile)
#include "tst_profile.moc"
