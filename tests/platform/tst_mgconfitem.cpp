#include "dconftest.h"
#include "mgconfitem.h"

#include <QRect>
#include <QSignalSpy>
#include <QtTest>

class tst_MGConfItem : public QObject
{
    Q_OBJECT
private slots:
    void init();
    void otherProcessWrite_data();
    void otherProcessWrite();
    void ownWrite_data();
    void ownWrite();
    void unsetAndReset();
    void deletedItemDropsNotice();
    void badInput();
};

static const QString s_dir = QStringLiteral("/org/orbaline/test/items/");

void tst_MGConfItem::init()
{
    DConfTest::reset(s_dir);
    QVERIFY(DConfTest::barrier());
}

void tst_MGConfItem::otherProcessWrite_data()
{
    QTest::addColumn<QString>("written");
    QTest::addColumn<QVariant>("expected");

    QTest::newRow("string") << "'hello world'" << QVariant(QStringLiteral("hello world"));
    QTest::newRow("int32") << "-42" << QVariant(-42);
    QTest::newRow("int64") << "int64 5000000000" << QVariant(qlonglong(5000000000LL));
    QTest::newRow("bool") << "true" << QVariant(true);
    QTest::newRow("double") << "2.5" << QVariant(2.5);
    QTest::newRow("string list") << "['a', 'b']" << QVariant(QStringList { "a", "b" });
}

void tst_MGConfItem::otherProcessWrite()
{
    QFETCH(QString, written);
    QFETCH(QVariant, expected);

    MGConfItem item(s_dir + QStringLiteral("value"));
    QSignalSpy spy(&item, &MGConfItem::valueChanged);
    DConfTest::write(item.key(), written);

    QTRY_COMPARE(spy.count(), 1);
    QCOMPARE(item.value().userType(), expected.userType());
    QCOMPARE(item.value(), expected);
    QVERIFY(DConfTest::barrier());
    QCOMPARE(spy.count(), 1);
}

void tst_MGConfItem::ownWrite_data()
{
    QTest::addColumn<QVariant>("value");
    QTest::addColumn<QVariant>("readBack");
    QTest::addColumn<QString>("stored");

    QTest::newRow("string") << QVariant(QStringLiteral("it's")) << QVariant(QStringLiteral("it's"))
                            << "\"it's\"";
    QTest::newRow("int") << QVariant(42) << QVariant(42) << "42";
    QTest::newRow("bool") << QVariant(false) << QVariant(false) << "false";
    QTest::newRow("double") << QVariant(0.25) << QVariant(0.25) << "0.25";
    QTest::newRow("string list") << QVariant(QStringList { "x", "y" })
                                 << QVariant(QStringList { "x", "y" }) << "['x', 'y']";
    QTest::newRow("list of strings") << QVariant(QVariantList { "x" }) << QVariant(QStringList { "x" })
                                     << "['x']";
}

// A value set here reads back at once, has reached the store for other
// processes when set() returns, and is announced once, later, to every item
// of the key.
void tst_MGConfItem::ownWrite()
{
    QFETCH(QVariant, value);
    QFETCH(QVariant, readBack);
    QFETCH(QString, stored);

    MGConfItem item(s_dir + QStringLiteral("own"));
    MGConfItem other(item.key());
    MGConfItem unrelated(s_dir + QStringLiteral("own2"));
    QSignalSpy spy(&item, &MGConfItem::valueChanged);
    QSignalSpy otherSpy(&other, &MGConfItem::valueChanged);
    QSignalSpy unrelatedSpy(&unrelated, &MGConfItem::valueChanged);

    item.set(value);
    QCOMPARE(spy.count(), 0);
    QCOMPARE(item.value().userType(), readBack.userType());
    QCOMPARE(item.value(), readBack);
    QCOMPARE(DConfTest::read(item.key()), stored);

    QTRY_COMPARE(spy.count(), 1);
    QTRY_COMPARE(otherSpy.count(), 1);
    QCOMPARE(other.value(), readBack);
    QVERIFY(DConfTest::barrier());
    QCOMPARE(spy.count(), 1);
    QCOMPARE(otherSpy.count(), 1);
    QCOMPARE(unrelatedSpy.count(), 0);
}

void tst_MGConfItem::unsetAndReset()
{
    MGConfItem item(s_dir + QStringLiteral("sub/key"));
    QSignalSpy spy(&item, &MGConfItem::valueChanged);
    QVERIFY(!item.value().isValid());
    QCOMPARE(item.value(QStringLiteral("default")), QVariant(QStringLiteral("default")));

    item.set(QStringLiteral("set"));
    QTRY_COMPARE(spy.count(), 1);
    item.unset();
    QVERIFY(!item.value().isValid());
    QCOMPARE(DConfTest::read(item.key()), QString());
    QTRY_COMPARE(spy.count(), 2);

    // Another process resets the key, then a directory above it.
    item.set(4);
    QTRY_COMPARE(spy.count(), 3);
    DConfTest::reset(item.key());
    QTRY_COMPARE(spy.count(), 4);
    QVERIFY(!item.value().isValid());
    item.set(QStringList());
    QTRY_COMPARE(spy.count(), 5);
    DConfTest::reset(s_dir);
    QTRY_COMPARE(spy.count(), 6);
    QVERIFY(!item.value().isValid());
}

void tst_MGConfItem::deletedItemDropsNotice()
{
    auto *item = new MGConfItem(s_dir + QStringLiteral("gone"));
    item->set(1);
    delete item;
    MGConfItem survivor(s_dir + QStringLiteral("gone"));
    QCOMPARE(survivor.value(), QVariant(1));
    QVERIFY(DConfTest::barrier());
}

void tst_MGConfItem::badInput()
{
    QTest::ignoreMessage(QtWarningMsg,
                         "MGConfItem::MGConfItem(const QString&, QObject*) Invalid key \"relative/key\"");
    MGConfItem invalid(QStringLiteral("relative/key"));
    QCOMPARE(invalid.key(), QStringLiteral("relative/key"));
    QVERIFY(!invalid.value().isValid());
    QTest::ignoreMessage(QtWarningMsg,
                         "bool DConfStore::write(const QString&, const QVariant&) Invalid key \"relative/key\"");
    invalid.set(1);

    MGConfItem item(s_dir + QStringLiteral("typed"));
    item.set(QStringLiteral("kept"));
    QTest::ignoreMessage(QtWarningMsg,
                         "bool DConfStore::write(const QString&, const QVariant&) Unsupported value type "
                         "QRect for \"/org/orbaline/test/items/typed\"");
    item.set(QRect(1, 2, 3, 4));
    QCOMPARE(item.value(), QVariant(QStringLiteral("kept")));
}

QTEST_GUILESS_MAIN(tst_MGConfItem)
#include "tst_mgconfitem.moc"
