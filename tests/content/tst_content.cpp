#include "content.h"

#include <QtTest>

namespace {

const QUrl Tone = QUrl::fromLocalFile(QStringLiteral("/m/tone.ogg"));

template <typename T>
T *record(int permissions = 3, qint64 id = 7)
{
    T *data = new T(id, Tone);
    data->mimeType = QStringLiteral("audio/ogg");
    data->fileName = QStringLiteral("tone.ogg");
    data->displayName = QStringLiteral("Tone");
    data->category = QStringLiteral("ringtone");
    data->permissions = permissions;
    return data;
}

ThemeletData *themelet()
{
    ThemeletData *data = record<ThemeletData>();
    data->homeWallpaper = QStringLiteral("/t/home.jpg");
    data->primaryColor = QColor(Qt::blue);
    data->resources = QVariantMap { { QStringLiteral("ringerTone"), Tone } };
    data->enabledSounds = 0x195;
    data->favorite = true;
    data->zefId = QStringLiteral("zef");
    return data;
}

QVariantList allRoles(const Content &content)
{
    QVariantList values;
    for (int role = -1; role <= 25; ++role)
        values << content.data()->data(role);
    return values;
}

}

class tst_Content : public QObject
{
    Q_OBJECT

private slots:
    void equality_data()
    {
        QTest::addColumn<Content>("a");
        QTest::addColumn<Content>("b");
        QTest::addColumn<bool>("equal");
        QTest::newRow("null, file") << Content() << Content(record<FileData>()) << false;
        QTest::newRow("same id, other fields") << Content(record<FileData>()) << Content(record<FileData>(0)) << true;
        QTest::newRow("same id, other type") << Content(record<FileData>()) << Content(record<PhotoData>()) << false;
        QTest::newRow("other id") << Content(record<FileData>()) << Content(record<FileData>(3, 8)) << false;
        QTest::newRow("null, null typed") << Content() << Content(Themelet()) << true;
        QTest::newRow("typed handle") << Content(themelet()) << Content(Themelet(themelet())) << true;
    }

    void equality()
    {
        QFETCH(Content, a);
        QFETCH(Content, b);
        QFETCH(bool, equal);
        QCOMPARE(a == b, equal);
        QCOMPARE(b == a, equal);
        QCOMPARE(a != b, !equal);
        QCOMPARE(int(a.type()) == -1, !a.isValid() && !a.data());
    }

    void roles_data()
    {
        QTest::addColumn<Content>("original");
        QTest::addColumn<QByteArray>("names");
        QTest::addColumn<QVariantList>("values"); // of roles 0..; the next one and -1 give nothing
        const QByteArray file = "contentId url mimeType fileName filePath displayName readOnly category";
        const QVariantList values { qint64(7), Tone, "audio/ogg", "tone.ogg", "/m/tone.ogg", "Tone", true, "ringtone" };
        QTest::newRow("file") << Content(record<FileData>(1)) << file << values;
        QTest::newRow("photo") << Content(record<PhotoData>(2)) << file + " dateTaken width height orientation"
                               << values.mid(0, 6) + QVariantList { false, "ringtone", QDateTime(), 0, 0, 0 };
        QTest::newRow("themelet") << Content(themelet()) // role 4 is named readOnly, yet gives the local path
                << QByteArray("contentId url mimeType fileName readOnly displayName favorite wallpaperUrl applicationWallpaperUrl "
                              "primaryColor secondaryColor highlightColor secondaryHighlightColor ringerVolume ringerToneEnabled "
                              "messageToneEnabled mailToneEnabled internetCallToneEnabled chatToneEnabled calendarToneEnabled "
                              "clockAlarmToneEnabled resources zefId version")
                << QVariantList { qint64(7), Tone, "audio/ogg", "tone.ogg", "/m/tone.ogg", "Tone", true, QUrl::fromLocalFile("/t/home.jpg"),
                                  QUrl(), QColor(Qt::blue), QColor(), QColor(), QColor(), 80, true, false, true, false, true, false,
                                  false, QVariantMap { { "ringerTone", Tone } }, "zef", 2 };
    }

    void roles()
    {
        QFETCH(Content, original);
        QFETCH(QByteArray, names);
        QFETCH(QVariantList, values);
        ContentData *copy = original.data()->clone();
        QCOMPARE(copy->ref.loadRelaxed(), 0);
        const Content content(copy); // so the checks below show that a clone has every field
        QVERIFY(content.data() != original.data() && content == original);
        const int type = content.type();
        for (int role = -1; role <= 12 && type != 1; ++role)
            QVERIFY(!content.data()->setData(role, 1)); // files and photos take no edits
        const auto table = type == 0 ? FileData::roleNames() : type == 2 ? PhotoData::roleNames() : ThemeletData::roleNames();
        QCOMPARE(table.size(), values.size());
        for (int role = 0; role < values.size(); ++role) {
            QCOMPARE(table.value(role), names.split(' ').at(role));
            QCOMPARE(content.data()->data(role).userType(), values.at(role).userType());
            QCOMPARE(content.data()->data(role), values.at(role));
        }
        QVERIFY(!content.data()->data(values.size()).isValid() && !content.data()->data(-1).isValid());
    }

    void setData_data()
    {
        QTest::addColumn<int>("role");
        QTest::addColumn<QVariant>("value");
        QTest::addColumn<QVariant>("expected"); // data(role) afterwards; invalid: rejected
        QTest::newRow("5") << 5 << QVariant("Dawn") << QVariant("Dawn");
        QTest::newRow("9 no colour") << 9 << QVariant("dusky") << QVariant(QColor());
        QTest::newRow("11 text") << 11 << QVariant("#80ff0000") << QVariant(QColor("#80ff0000"));
        QTest::newRow("14 off") << 14 << QVariant(false) << QVariant(false);
        QTest::newRow("15 on") << 15 << QVariant("true") << QVariant(true);
        QTest::newRow("21") << 21 << QVariant(QVariantMap()) << QVariant(QVariantMap());
        for (int role : { -1, 4, 7, 8, 22, 23, 24 })
            QTest::addRow("%d", role) << role << QVariant("x") << QVariant();
    }

    void setData()
    {
        QFETCH(int, role);
        QFETCH(QVariant, value);
        QFETCH(QVariant, expected);
        const Themelet original(themelet());
        Themelet edited = original; // shared until the edit
        const QVariantList before = allRoles(original);
        QCOMPARE(edited->setData(role, value), expected.isValid());
        QVariantList roles = before; // only that role changes
        roles[role + 1] = expected.isValid() ? expected : before.at(role + 1);
        QCOMPARE(allRoles(edited), roles);
        QCOMPARE(allRoles(original), before);
        QCOMPARE(edited->enabledSounds & ~0x7f, 0x180); // bits without a role stay
    }
};

QTEST_GUILESS_MAIN(tst_Content)
#include "tst_content.moc"
