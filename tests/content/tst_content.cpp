#include "content.h"

#include <QtTest>

typedef QHash<int, QByteArray> RoleNames;

namespace {

const QString TonePath = QStringLiteral("/home/user/Music/tone.ogg");
const QString ThemeletPath = QStringLiteral("/usr/share/themelet/dusk/dusk.themelet");

// Counts live records, to see which handle release deletes one.
class TrackedData : public FileData
{
public:
    TrackedData(qint64 id, int *alive) : FileData(id, QUrl()), m_alive(alive) { ++*m_alive; }
    TrackedData(const TrackedData &other) : FileData(other), m_alive(other.m_alive) { ++*m_alive; }
    ~TrackedData() override { --*m_alive; }
    ContentData *clone() const override { return new TrackedData(*this); }

private:
    int *m_alive;
};

FileData *fileRecord(qint64 id = 7, int permissions = 3)
{
    FileData *data = new FileData(id, QUrl::fromLocalFile(TonePath));
    data->mimeType = QStringLiteral("audio/ogg");
    data->fileName = QStringLiteral("tone.ogg");
    data->displayName = QStringLiteral("Tone");
    data->category = QStringLiteral("ringtone");
    data->permissions = permissions;
    return data;
}

PhotoData *photoRecord(qint64 id = 7)
{
    PhotoData *data = new PhotoData(id, QUrl::fromLocalFile(QStringLiteral("/home/user/Pictures/a.jpg")));
    data->mimeType = QStringLiteral("image/jpeg");
    data->fileName = QStringLiteral("a.jpg");
    data->displayName = QStringLiteral("A");
    data->category = QStringLiteral("camera");
    data->dateTaken = QDateTime(QDate(2014, 5, 1), QTime(12, 0), Qt::UTC);
    data->width = 640;
    data->height = 480;
    data->orientation = 6;
    return data;
}

ThemeletData *themeletRecord(qint64 id = 7)
{
    ThemeletData *data = new ThemeletData(id, QUrl::fromLocalFile(ThemeletPath));
    data->mimeType = QStringLiteral("application/x-vorka-themelet");
    data->fileName = QStringLiteral("dusk.themelet");
    data->permissions = 3;
    data->displayName = QStringLiteral("Dusk");
    data->homeWallpaper = QStringLiteral("/usr/share/themelet/dusk/images/home.jpg");
    data->applicationWallpaper = QStringLiteral("/usr/share/themelet/dusk/images/app.jpg");
    data->partnerSpace = QStringLiteral("partner");
    data->zefId = QStringLiteral("zef-1");
    data->highlightColor = QColor(Qt::red);
    data->secondaryHighlightColor = QColor(Qt::green);
    data->primaryColor = QColor(Qt::blue);
    data->secondaryColor = QColor(Qt::yellow);
    data->timestamp = QDateTime(QDate(2015, 1, 2), QTime(3, 4), Qt::UTC);
    data->resources = QVariantMap { { QStringLiteral("ringerTone"), QUrl::fromLocalFile(TonePath) } };
    data->ringerVolume = 60;
    data->enabledSounds = 0x15; // ringer, mail, chat
    data->version = 3;
    data->favorite = true;
    return data;
}

ThemeletData *themeletWithSounds(int enabledSounds)
{
    ThemeletData *data = new ThemeletData(1, QUrl::fromLocalFile(ThemeletPath));
    data->enabledSounds = enabledSounds;
    return data;
}

QVector<QVariant> allRoles(const Content &content)
{
    QVector<QVariant> values;
    for (int role = -1; role <= 25; ++role)
        values.append(content.data()->data(role));
    return values;
}

}

class tst_Content : public QObject
{
    Q_OBJECT

private slots:
    void nullHandles();
    void equality_data();
    void equality();
    void lifetime();
    void clone_data();
    void clone();
    void typedHandleDetach();
    void roleNames_data();
    void roleNames();
    void data_data();
    void data();
    void setData_data();
    void setData();
};

void tst_Content::nullHandles()
{
    const Content null;
    QCOMPARE(int(null.type()), -1);
    QVERIFY(!null.isValid());
    QVERIFY(!null.data());

    const Content fromNullTyped = Themelet();
    QVERIFY(!fromNullTyped.isValid());
    QCOMPARE(int(fromNullTyped.type()), -1);
    QVERIFY(Themelet().isNull());
}

void tst_Content::equality_data()
{
    QTest::addColumn<Content>("a");
    QTest::addColumn<Content>("b");
    QTest::addColumn<bool>("equal");

    const Content file(fileRecord(7));
    FileData *renamed = fileRecord(7);
    renamed->displayName = QStringLiteral("Renamed");
    renamed->url = QUrl::fromLocalFile(QStringLiteral("/elsewhere.ogg"));

    QTest::newRow("null, null") << Content() << Content() << true;
    QTest::newRow("null, file") << Content() << file << false;
    QTest::newRow("file, null") << file << Content() << false;
    QTest::newRow("one record") << file << file << true;
    QTest::newRow("same id, other fields") << file << Content(renamed) << true;
    QTest::newRow("same id, file and themelet") << file << Content(themeletRecord(7)) << false;
    QTest::newRow("same id, file and photo") << file << Content(photoRecord(7)) << false;
    QTest::newRow("other id") << file << Content(fileRecord(8)) << false;
    QTest::newRow("themelet, typed handle of it")
            << Content(themeletRecord(9)) << Content(Themelet(themeletRecord(9))) << true;
}

void tst_Content::equality()
{
    QFETCH(Content, a);
    QFETCH(Content, b);
    QFETCH(bool, equal);

    QCOMPARE(a == b, equal);
    QCOMPARE(b == a, equal);
    QCOMPARE(a != b, !equal);
    QCOMPARE(b != a, !equal);
}

void tst_Content::lifetime()
{
    int alive = 0;
    {
        Content first(new TrackedData(1, &alive));
        QCOMPARE(first.data()->ref.loadRelaxed(), 1);
        {
            Content second = first;
            QCOMPARE(first.data()->ref.loadRelaxed(), 2);
            QVector<Content> batch { first, second };
            QCOMPARE(first.data()->ref.loadRelaxed(), 4);
        }
        QCOMPARE(first.data()->ref.loadRelaxed(), 1);

        Content &alias = first;
        first = alias;
        QCOMPARE(alive, 1);
        QCOMPARE(first.data()->ref.loadRelaxed(), 1);

        // The old record goes through its virtual destructor as soon as the new one is held.
        first = Content(new TrackedData(2, &alive));
        QCOMPARE(alive, 1);
        QCOMPARE(first.data()->id, qint64(2));

        first = Content();
        QCOMPARE(alive, 0);
        first = Content(new TrackedData(3, &alive));
    }
    QCOMPARE(alive, 0);
}

void tst_Content::clone_data()
{
    QTest::addColumn<Content>("original");

    QTest::newRow("file") << Content(fileRecord());
    QTest::newRow("photo") << Content(photoRecord());
    QTest::newRow("themelet") << Content(themeletRecord());
}

void tst_Content::clone()
{
    QFETCH(Content, original);

    ContentData *copy = original.data()->clone();
    QCOMPARE(copy->ref.loadRelaxed(), 0);
    const Content cloned(copy);
    QCOMPARE(copy->ref.loadRelaxed(), 1);

    QVERIFY(cloned.data() != original.data());
    QCOMPARE(cloned.type(), original.type());
    QVERIFY(cloned == original);
    QCOMPARE(allRoles(cloned), allRoles(original));

    if (auto *themelet = dynamic_cast<ThemeletData *>(copy)) {
        // Fields without a role travel too.
        QCOMPARE(themelet->partnerSpace, QStringLiteral("partner"));
        QCOMPARE(themelet->timestamp, QDateTime(QDate(2015, 1, 2), QTime(3, 4), Qt::UTC));
        QCOMPARE(themelet->permissions, 3);
    }

    // An edit of the clone leaves the shared original alone.
    const QVector<QVariant> before = allRoles(original);
    cloned.data()->setData(ThemeletData::DisplayNameRole, QStringLiteral("Edited"));
    QCOMPARE(allRoles(original), before);
}

void tst_Content::typedHandleDetach()
{
    Themelet first(themeletRecord());
    Themelet second = first;
    QCOMPARE(first.constData(), second.constData());

    second->displayName = QStringLiteral("Edited");
    QVERIFY(first.constData() != second.constData());
    QCOMPARE(first.constData()->displayName, QStringLiteral("Dusk"));
    QCOMPARE(second.constData()->displayName, QStringLiteral("Edited"));
    QCOMPARE(second.constData()->partnerSpace, QStringLiteral("partner"));
    QCOMPARE(first.constData()->ref.loadRelaxed(), 1);
    QCOMPARE(second.constData()->ref.loadRelaxed(), 1);

    // A sole typed handle edits in place.
    const ThemeletData *record = second.constData();
    second->favorite = false;
    QCOMPARE(second.constData(), record);

    // Converting shares the record; editing through the typed handle then copies.
    const Content shared = first;
    QCOMPARE(shared.data(), static_cast<ContentData *>(const_cast<ThemeletData *>(first.constData())));
    QCOMPARE(shared.data()->ref.loadRelaxed(), 2);
    first->setData(ThemeletData::FavoriteRole, false);
    QCOMPARE(shared.data()->data(ThemeletData::FavoriteRole), QVariant(true));
    QCOMPARE(first.constData()->data(ThemeletData::FavoriteRole), QVariant(false));

    // A typed handle made from a Content detaches the same way.
    Themelet fromContent(shared);
    fromContent->ringerVolume = 10;
    QCOMPARE(shared.data()->data(ThemeletData::RingerVolumeRole), QVariant(60));
    QCOMPARE(shared.data()->ref.loadRelaxed(), 1);
}

void tst_Content::roleNames_data()
{
    QTest::addColumn<RoleNames>("names");
    QTest::addColumn<QByteArrayList>("expected");

    const QByteArrayList file { "contentId", "url", "mimeType", "fileName", "filePath",
                                "displayName", "readOnly", "category" };
    QTest::newRow("file") << FileData::roleNames() << file;
    QTest::newRow("photo") << PhotoData::roleNames()
                           << file + QByteArrayList { "dateTaken", "width", "height", "orientation" };
    QTest::newRow("themelet")
            << ThemeletData::roleNames()
            << QByteArrayList { "contentId", "url", "mimeType", "fileName", "readOnly",
                                "displayName", "favorite", "wallpaperUrl",
                                "applicationWallpaperUrl", "primaryColor", "secondaryColor",
                                "highlightColor", "secondaryHighlightColor", "ringerVolume",
                                "ringerToneEnabled", "messageToneEnabled", "mailToneEnabled",
                                "internetCallToneEnabled", "chatToneEnabled",
                                "calendarToneEnabled", "clockAlarmToneEnabled", "resources",
                                "zefId", "version" };
}

void tst_Content::roleNames()
{
    QFETCH(RoleNames, names);
    QFETCH(QByteArrayList, expected);

    QCOMPARE(names.size(), expected.size());
    for (int role = 0; role < expected.size(); ++role)
        QCOMPARE(names.value(role), expected.at(role));
}

void tst_Content::data_data()
{
    QTest::addColumn<Content>("content");
    QTest::addColumn<int>("role");
    QTest::addColumn<QVariant>("expected");

    const Content file(fileRecord());
    const QUrl toneUrl = QUrl::fromLocalFile(TonePath);
    QTest::newRow("file 0 contentId") << file << 0 << QVariant(qint64(7));
    QTest::newRow("file 1 url") << file << 1 << QVariant(toneUrl);
    QTest::newRow("file 2 mimeType") << file << 2 << QVariant(QStringLiteral("audio/ogg"));
    QTest::newRow("file 3 fileName") << file << 3 << QVariant(QStringLiteral("tone.ogg"));
    QTest::newRow("file 4 filePath") << file << 4 << QVariant(TonePath);
    QTest::newRow("file 5 displayName") << file << 5 << QVariant(QStringLiteral("Tone"));
    QTest::newRow("file 6 readOnly, permissions 3") << file << 6 << QVariant(false);
    QTest::newRow("file 6 readOnly, permissions 2") << Content(fileRecord(7, 2)) << 6 << QVariant(false);
    QTest::newRow("file 6 readOnly, permissions 1") << Content(fileRecord(7, 1)) << 6 << QVariant(true);
    QTest::newRow("file 6 readOnly, permissions 0") << Content(fileRecord(7, 0)) << 6 << QVariant(true);
    QTest::newRow("file 7 category") << file << 7 << QVariant(QStringLiteral("ringtone"));
    for (int role : { -1, 8, 9, 10, 11, 24 })
        QTest::addRow("file %d beyond the table", role) << file << role << QVariant();

    const Content photo(photoRecord());
    QTest::newRow("photo 5 displayName") << photo << 5 << QVariant(QStringLiteral("A"));
    QTest::newRow("photo 7 category") << photo << 7 << QVariant(QStringLiteral("camera"));
    QTest::newRow("photo 8 dateTaken") << photo << 8
                                       << QVariant(QDateTime(QDate(2014, 5, 1), QTime(12, 0), Qt::UTC));
    QTest::newRow("photo 9 width") << photo << 9 << QVariant(640);
    QTest::newRow("photo 10 height") << photo << 10 << QVariant(480);
    QTest::newRow("photo 11 orientation") << photo << 11 << QVariant(6);
    for (int role : { -1, 12, 13 })
        QTest::addRow("photo %d beyond the table", role) << photo << role << QVariant();

    const Content themelet(themeletRecord());
    QTest::newRow("themelet 0 contentId") << themelet << 0 << QVariant(qint64(7));
    QTest::newRow("themelet 1 url") << themelet << 1 << QVariant(QUrl::fromLocalFile(ThemeletPath));
    QTest::newRow("themelet 2 mimeType") << themelet << 2
                                         << QVariant(QStringLiteral("application/x-vorka-themelet"));
    QTest::newRow("themelet 3 fileName") << themelet << 3 << QVariant(QStringLiteral("dusk.themelet"));
    // Named readOnly, yet the local path: the file table's role 4.
    QTest::newRow("themelet 4 readOnly is the path") << themelet << 4 << QVariant(ThemeletPath);
    QTest::newRow("themelet 5 displayName") << themelet << 5 << QVariant(QStringLiteral("Dusk"));
    QTest::newRow("themelet 6 favorite") << themelet << 6 << QVariant(true);
    QTest::newRow("themelet 7 wallpaperUrl") << themelet << 7
            << QVariant(QUrl::fromLocalFile(QStringLiteral("/usr/share/themelet/dusk/images/home.jpg")));
    QTest::newRow("themelet 8 applicationWallpaperUrl") << themelet << 8
            << QVariant(QUrl::fromLocalFile(QStringLiteral("/usr/share/themelet/dusk/images/app.jpg")));
    QTest::newRow("themelet 9 primaryColor") << themelet << 9 << QVariant(QColor(Qt::blue));
    QTest::newRow("themelet 10 secondaryColor") << themelet << 10 << QVariant(QColor(Qt::yellow));
    QTest::newRow("themelet 11 highlightColor") << themelet << 11 << QVariant(QColor(Qt::red));
    QTest::newRow("themelet 12 secondaryHighlightColor") << themelet << 12 << QVariant(QColor(Qt::green));
    QTest::newRow("themelet 13 ringerVolume") << themelet << 13 << QVariant(60);
    const bool bits[] = { true, false, true, false, true, false, false };
    for (int bit = 0; bit < 7; ++bit)
        QTest::addRow("themelet %d tone bit %d", 14 + bit, bit) << themelet << 14 + bit << QVariant(bits[bit]);
    QTest::newRow("themelet 21 resources") << themelet << 21
            << QVariant(QVariantMap { { QStringLiteral("ringerTone"), QUrl::fromLocalFile(TonePath) } });
    QTest::newRow("themelet 22 zefId") << themelet << 22 << QVariant(QStringLiteral("zef-1"));
    QTest::newRow("themelet 23 version") << themelet << 23 << QVariant(3);
    for (int role : { -1, 24, 25 })
        QTest::addRow("themelet %d beyond the table", role) << themelet << role << QVariant();

    const Content plain(new ThemeletData(1, QUrl::fromLocalFile(ThemeletPath)));
    QTest::newRow("default themelet 7 empty wallpaper") << plain << 7 << QVariant(QUrl());
    QTest::newRow("default themelet 8 empty wallpaper") << plain << 8 << QVariant(QUrl());
    QTest::newRow("default themelet 9 invalid colour") << plain << 9 << QVariant(QColor());
    QTest::newRow("default themelet 13 ringerVolume") << plain << 13 << QVariant(80);
    QTest::newRow("default themelet 20 all tones on") << plain << 20 << QVariant(true);
    QTest::newRow("default themelet 23 version") << plain << 23 << QVariant(2);
    QTest::newRow("default themelet 6 favorite") << plain << 6 << QVariant(false);
}

void tst_Content::data()
{
    QFETCH(Content, content);
    QFETCH(int, role);
    QFETCH(QVariant, expected);

    const QVariant value = content.data()->data(role);
    QCOMPARE(value.userType(), expected.userType());
    QCOMPARE(value, expected);
    if (expected.userType() == QMetaType::QUrl && expected.toUrl().isEmpty())
        QVERIFY(value.toUrl().isEmpty());
}

void tst_Content::setData_data()
{
    QTest::addColumn<Content>("content");
    QTest::addColumn<int>("role");
    QTest::addColumn<QVariant>("value");
    QTest::addColumn<bool>("accepted");
    QTest::addColumn<QVariant>("expected");      // data(role) afterwards, for accepted rows
    QTest::addColumn<QVariant>("enabledSounds"); // checked when valid

    const QVariantMap map { { QStringLiteral("wallpaper"), 3 } };
    auto themelet = [] { return Content(themeletRecord()); };
    auto sounds = [](int bits) { return Content(themeletWithSounds(bits)); };

    QTest::newRow("5 displayName") << themelet() << 5 << QVariant(QStringLiteral("Dawn")) << true
                                   << QVariant(QStringLiteral("Dawn")) << QVariant();
    QTest::newRow("6 favorite") << themelet() << 6 << QVariant(0) << true << QVariant(false) << QVariant();
    QTest::newRow("9 colour") << themelet() << 9 << QVariant(QColor(Qt::cyan)) << true
                              << QVariant(QColor(Qt::cyan)) << QVariant();
    QTest::newRow("10 colour from text") << themelet() << 10 << QVariant(QStringLiteral("#80ff0000")) << true
                                         << QVariant(QColor(QStringLiteral("#80ff0000"))) << QVariant();
    QTest::newRow("11 text that is no colour") << themelet() << 11 << QVariant(QStringLiteral("dusky"))
                                               << true << QVariant(QColor()) << QVariant();
    QTest::newRow("12 int that is no colour") << themelet() << 12 << QVariant(5) << true
                                              << QVariant(QColor()) << QVariant();
    QTest::newRow("13 ringerVolume from text") << themelet() << 13 << QVariant(QStringLiteral("55"))
                                               << true << QVariant(55) << QVariant();
    QTest::newRow("14 off on default") << sounds(-1) << 14 << QVariant(false) << true << QVariant(false)
                                       << QVariant(-2);
    QTest::newRow("20 off on default") << sounds(-1) << 20 << QVariant(false) << true << QVariant(false)
                                       << QVariant(-65);
    QTest::newRow("14 on keeps high bits") << sounds(0x180) << 14 << QVariant(true) << true
                                           << QVariant(true) << QVariant(0x181);
    QTest::newRow("17 off keeps high bits") << sounds(0x1ff) << 17 << QVariant(false) << true
                                            << QVariant(false) << QVariant(0x1f7);
    QTest::newRow("19 on when set") << sounds(0x20) << 19 << QVariant(QStringLiteral("true")) << true
                                    << QVariant(true) << QVariant(0x20);
    QTest::newRow("21 resources") << themelet() << 21 << QVariant(map) << true << QVariant(map) << QVariant();

    for (int role : { -1, 0, 1, 2, 3, 4, 7, 8, 22, 23, 24 })
        QTest::addRow("themelet %d rejected", role) << themelet() << role << QVariant(QStringLiteral("x"))
                                                    << false << QVariant() << QVariant(0x15);
    QTest::newRow("themelet 7 rejected url") << themelet() << 7
            << QVariant(QUrl::fromLocalFile(QStringLiteral("/tmp/a.jpg"))) << false << QVariant() << QVariant();

    for (int role = -1; role <= 12; ++role) {
        QTest::addRow("file %d rejected", role) << Content(fileRecord()) << role
                                                << QVariant(QStringLiteral("x")) << false << QVariant()
                                                << QVariant();
        QTest::addRow("photo %d rejected", role) << Content(photoRecord()) << role << QVariant(1) << false
                                                 << QVariant() << QVariant();
    }
}

void tst_Content::setData()
{
    QFETCH(Content, content);
    QFETCH(int, role);
    QFETCH(QVariant, value);
    QFETCH(bool, accepted);
    QFETCH(QVariant, expected);
    QFETCH(QVariant, enabledSounds);

    QVector<QVariant> others = allRoles(content);
    QCOMPARE(content.data()->setData(role, value), accepted);

    QVector<QVariant> after = allRoles(content);
    if (accepted) {
        const QVariant result = content.data()->data(role);
        QCOMPARE(result.userType(), expected.userType());
        QCOMPARE(result, expected);
        // Only the role that was set changes.
        others[role + 1] = after[role + 1] = QVariant();
    }
    QCOMPARE(after, others);

    if (enabledSounds.isValid())
        QCOMPARE(static_cast<ThemeletData *>(content.data())->enabledSounds, enabledSounds.toInt());
}

QTEST_GUILESS_MAIN(tst_Content)
#include "tst_content.moc"
