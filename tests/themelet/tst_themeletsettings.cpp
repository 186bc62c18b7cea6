#include "dconftest.h"
#include "themeletsettings.h"

#include <QtTest>

static const QString s_sourceKey = QStringLiteral("/desktop/lunda/background/portrait/picture_filename");
static const QString s_applicationKey = QStringLiteral("/desktop/vorka/background/portrait/app_picture_filename");
static const QString s_homeKey = QStringLiteral("/desktop/vorka/background/portrait/home_picture_filename");

class tst_ThemeletSettings : public QObject
{
    Q_OBJECT
private slots:
    void changes_data()
    {
        QTest::addColumn<QString>("key");
        QTest::addColumn<QString>("value"); // given to the key's setter, or written by dconf if GVariant text
        QTest::addColumn<QString>("state"); // signals of source, application and home image, then the values
        QTest::newRow("source") << s_sourceKey << "file:///t/sun set.themelet" << "100 file:///t/sun set.themelet||";
        QTest::newRow("remote source clears") << s_sourceKey << "http://x/a.themelet" << "100 ||";
        QTest::newRow("application image") << s_applicationKey << "/p/app.jpg" << "010 |/p/app.jpg|";
        QTest::newRow("home image") << s_homeKey << "relative.jpg" << "001 ||relative.jpg";
        QTest::newRow("other process") << s_sourceKey << "'/t/a.themelet'" << "100 file:///t/a.themelet||";
    }

    // A setter emits nothing: the signal comes once the store reports the change.
    void changes()
    {
        QFETCH(QString, key);
        QFETCH(QString, value);
        QFETCH(QString, state);
        for (const QString &each : { s_sourceKey, s_applicationKey, s_homeKey })
            DConfTest::reset(each);
        QVERIFY(DConfTest::barrier());
        ThemeletSettings settings;
        QSignalSpy source(&settings, &ThemeletSettings::sourceChanged), application(&settings, &ThemeletSettings::applicationImageChanged),
                home(&settings, &ThemeletSettings::homeImageChanged);
        const auto current = [&] {
            return QStringLiteral("%1%2%3 ").arg(source.count()).arg(application.count()).arg(home.count())
                    + settings.source().toString() + '|' + settings.applicationImagePath() + '|' + settings.homeImagePath();
        };
        QCOMPARE(current(), QStringLiteral("000 ||")); // unset keys read empty

        if (value.startsWith('\''))
            DConfTest::write(key, value);
        else if (key == s_sourceKey)
            settings.setSource(QUrl(value));
        else if (key == s_homeKey)
            settings.setHomeImagePath(value);
        else
            settings.setApplicationImagePath(value);
        QCOMPARE(current().left(3), QStringLiteral("000"));
        QVERIFY(DConfTest::barrier());
        QCOMPARE(current(), state);
    }
};

QTEST_GUILESS_MAIN(tst_ThemeletSettings)
#include "tst_themeletsettings.moc"
