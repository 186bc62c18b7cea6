#include "dconftest.h"
#include "themeletsettings.h"

#include <QSignalSpy>
#include <QtTest>

namespace {

const QString s_sourceKey = QStringLiteral("/desktop/lunda/background/portrait/picture_filename");
const QString s_applicationKey = QStringLiteral("/desktop/vorka/background/portrait/app_picture_filename");
const QString s_homeKey = QStringLiteral("/desktop/vorka/background/portrait/home_picture_filename");

void record(ThemeletSettings *settings, QStringList *names)
{
    QObject::connect(settings, &ThemeletSettings::sourceChanged, [=] { *names << "source"; });
    QObject::connect(settings, &ThemeletSettings::applicationImageChanged, [=] { *names << "application"; });
    QObject::connect(settings, &ThemeletSettings::homeImageChanged, [=] { *names << "home"; });
}

// All three values as one text, to compare in one go.
QString values(const ThemeletSettings &settings)
{
    return settings.source().toString() + QLatin1Char('|') + settings.applicationImagePath()
            + QLatin1Char('|') + settings.homeImagePath();
}

}

class tst_ThemeletSettings : public QObject
{
    Q_OBJECT
private slots:
    void init();
    void changes_data();
    void changes();
    void equalValue();
};

void tst_ThemeletSettings::init()
{
    for (const QString &key : { s_sourceKey, s_applicationKey, s_homeKey })
        DConfTest::reset(key);
    QVERIFY(DConfTest::barrier());
}

void tst_ThemeletSettings::changes_data()
{
    QTest::addColumn<QString>("how");  // a setter, or "other process" writing key
    QTest::addColumn<QString>("key");
    QTest::addColumn<QString>("value");
    QTest::addColumn<QString>("stored");
    QTest::addColumn<QString>("values");

    QTest::newRow("source") << "setSource" << s_sourceKey << "file:///t/sun set.themelet"
                            << "'/t/sun set.themelet'" << "file:///t/sun set.themelet||";
    QTest::newRow("remote source clears") << "setSource" << s_sourceKey << "http://x/a.themelet" << "''" << "||";
    QTest::newRow("application image") << "setApplicationImagePath" << s_applicationKey << "/p/app.jpg"
                                       << "'/p/app.jpg'" << "|/p/app.jpg|";
    QTest::newRow("home image") << "setHomeImagePath" << s_homeKey << "relative.jpg" << "'relative.jpg'"
                                << "||relative.jpg";
    QTest::newRow("source by other process") << "other process" << s_sourceKey << "'/t/a.themelet'"
                                             << "'/t/a.themelet'" << "file:///t/a.themelet||";
    QTest::newRow("number converts") << "other process" << s_homeKey << "12" << "12" << "||12";
    QTest::newRow("list doesn't convert") << "other process" << s_applicationKey << "['a', 'b']"
                                          << "['a', 'b']" << "||";
}

// Nothing is emitted by a setter: the signal of the changed key comes once
// the store reports the change, to every settings object alike.
void tst_ThemeletSettings::changes()
{
    QFETCH(QString, how);
    QFETCH(QString, key);
    QFETCH(QString, value);
    QFETCH(QString, stored);
    QFETCH(QString, values);

    ThemeletSettings settings;
    ThemeletSettings observer;
    QStringList emitted;
    QStringList observed;
    record(&settings, &emitted);
    record(&observer, &observed);

    if (how == QLatin1String("setSource"))
        settings.setSource(QUrl(value));
    else if (how == QLatin1String("setApplicationImagePath"))
        settings.setApplicationImagePath(value);
    else if (how == QLatin1String("setHomeImagePath"))
        settings.setHomeImagePath(value);
    else
        DConfTest::write(key, value);
    QCOMPARE(emitted, QStringList());
    QCOMPARE(DConfTest::read(key), stored);

    QVERIFY(DConfTest::barrier());
    const QString name = key == s_sourceKey ? "source" : key == s_homeKey ? "home" : "application";
    QCOMPARE(emitted, QStringList { name });
    QCOMPARE(observed, QStringList { name });
    QCOMPARE(::values(settings), values);
    QCOMPARE(::values(observer), values);
}

// dconf reports no change for a value equal to the present one, so neither
// setting it here nor in another process emits anything.
void tst_ThemeletSettings::equalValue()
{
    ThemeletSettings settings;
    QSignalSpy spy(&settings, &ThemeletSettings::homeImageChanged);
    settings.setHomeImagePath(QStringLiteral("/p/same.jpg"));
    QVERIFY(DConfTest::barrier());
    QCOMPARE(spy.count(), 1);

    settings.setHomeImagePath(QStringLiteral("/p/same.jpg"));
    DConfTest::write(s_homeKey, QStringLiteral("'/p/same.jpg'"));
    QVERIFY(DConfTest::barrier());
    QCOMPARE(spy.count(), 1);
}

QTEST_GUILESS_MAIN(tst_ThemeletSettings)
#include "tst_themeletsettings.moc"
