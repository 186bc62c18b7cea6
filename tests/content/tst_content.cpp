// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "content.h"

#include <QtTest>

static const QUrl Tone = QUrl::fromLocalFile(QStringLiteral("/m/tone.ogg"));

template <typename T>
static T *record(int permissions = 3, qint64 id = 7)
{
    T *data = new T(id, Tone);
    data->mimeType = QStringLiteral("audio/ogg");
    data->fileName = QStringLiteral("tone.ogg");
    data->displayName = QStringLiteral("Tone");
    data->category = QStringLiteral("ringtone");
    data->permissions = permissions;
    if constexpr (std::is_same_v<T, ThemeletData>) {
        data->homeWallpaper = QStringLiteral("/t/home.jpg");
        data->primaryColor = QColor(Qt::blue);
        data->resources = QVariantMap { { QStringLiteral("ringerTone"), Tone } };
        data->enabledSounds = 0x195; // tones 1, 3 and 5, and two bits without a role
        data->favorite = true;
        data->zefId = QStringLiteral("zef");
    }
    return data;
}

class tst_Content : public QObject
{
    Q_OBJECT

private slots:
    void equality()
    {
        const Content file(record<FileData>()), null; // equal: both null, or the same type and id
        const QVector<std::tuple<Content, Content, bool>> cases {
            { null, file, false }, { file, Content(record<FileData>(0)), true }, { file, Content(record<PhotoData>()), false },
            { file, Content(record<FileData>(3, 8)), false }, { null, Content(Themelet()), true } };
        for (const auto &[a, b, equal] : cases)
            QCOMPARE(QVector<bool>({ a == b, b == a, !(a != b) }), QVector<bool>(3, equal));
        QVERIFY(!null.isValid() && !null.data() && int(null.type()) == -1 && file.isValid());
        const Content themelet(record<ThemeletData>());
        QVERIFY(Themelet(file).isNull() && Themelet(null).isNull() && Themelet(themelet).constData() == themelet.data());
        // Assigned through an alias of the only handle: the record survives its own replacement.
        Content only(record<FileData>());
        const Content &alias = only;
        only = alias;
        QVERIFY(only.isValid() && only.data()->ref.loadRelaxed() == 1 && only.type() == ThemeletContent::File);
    }

    void roles_data()
    {
        QTest::addColumn<Content>("original");
        QTest::addColumn<QVariantList>("values"); // of roles 0..
        const QVariantList values { qint64(7), Tone, "audio/ogg", "tone.ogg", "/m/tone.ogg", "Tone", true, "ringtone" };
        QTest::newRow("file") << Content(record<FileData>(1)) << values;
        QTest::newRow("photo") << Content(record<PhotoData>(2)) << values.mid(0, 6) + QVariantList { false, "ringtone", QDateTime(), 0, 0, 0 };
        QTest::newRow("themelet") << Content(record<ThemeletData>()) // role 4 is named readOnly, yet gives the local path
                << QVariantList { qint64(7), Tone, "audio/ogg", "tone.ogg", "/m/tone.ogg", "Tone", true, QUrl::fromLocalFile("/t/home.jpg"),
                                  QUrl(), QColor(Qt::blue), QColor(), QColor(), QColor(), 80, true, false, true, false, true, false,
                                  false, QVariantMap { { "ringerTone", Tone } }, "zef", 2 };
    }

    void roles()
    {
        QFETCH(Content, original);
        QFETCH(QVariantList, values);
        const Content content(original.data()->clone()); // so the checks below show that a clone has every field
        QVERIFY(content.data() != original.data() && content == original && content.data()->ref.loadRelaxed() == 1);
        const int type = content.type();
        QCOMPARE((type == 0 ? FileData::roleNames() : type == 2 ? PhotoData::roleNames() : ThemeletData::roleNames()).size(), values.size());
        for (int role = -1; role <= values.size(); ++role) { // -1 and one past the last give nothing
            QCOMPARE(content.data()->data(role).userType(), values.value(role).userType());
            QCOMPARE(content.data()->data(role), values.value(role));
            QVERIFY(type == 1 || !content.data()->setData(role, 1)); // files and photos take no edits
        }
    }

    void setData_data()
    {
        QTest::addColumn<int>("role");
        QTest::addColumn<QVariant>("value");
        QTest::addColumn<QVariant>("expected"); // data(role) afterwards; invalid: rejected
        QTest::newRow("5") << 5 << QVariant("Dawn") << QVariant("Dawn");
        QTest::newRow("9 no colour") << 9 << QVariant("dusky") << QVariant(QColor());
        QTest::newRow("11 text") << 11 << QVariant("#80ff0000") << QVariant(QColor("#80ff0000"));
        QTest::newRow("15 on") << 15 << QVariant("true") << QVariant(true);
        for (int role : { -1, 4, 7, 8, 22, 23, 24 })
            QTest::addRow("%d", role) << role << QVariant("x") << QVariant();
    }

    void setData()
    {
        QFETCH(int, role);
        QFETCH(QVariant, value);
        QFETCH(QVariant, expected);
        const Themelet original(record<ThemeletData>());
        Themelet edited = original; // shared until the edit
        const auto allRoles = [](const Themelet &t) { QVariantList v; for (int r = -1; r <= 25; ++r) v << t->data(r); return v; };
        const QVariantList before = allRoles(original);
        QCOMPARE(edited->setData(role, value), expected.isValid());
        QVariantList roles = before; // only that role changes
        roles[role + 1] = expected.isValid() ? expected : roles.at(role + 1);
        QCOMPARE(allRoles(edited), roles);
        QCOMPARE(allRoles(original), before);
        QCOMPARE(edited->enabledSounds & ~0x7f, 0x180); // bits without a role stay
    }
};

QTEST_GUILESS_MAIN(tst_Content)
#include "tst_content.moc"
