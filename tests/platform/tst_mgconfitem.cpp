// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "dconftest.h"
#include "mgconfitem.h"

#include <QRect>
#include <QtTest>

static const QString s_dir = QStringLiteral("/org/orbaline/test/items/");

class tst_MGConfItem : public QObject
{
    Q_OBJECT
private slots:
    void init() { DConfTest::reset(s_dir); QVERIFY(DConfTest::barrier()); }

    void roundTrip_data()
    {
        QTest::addColumn<QVariant>("value");
        QTest::addColumn<QString>("stored"); // in GVariant text form
        QTest::newRow("string") << QVariant("it's") << "\"it's\"";
        QTest::newRow("int32") << QVariant(-42) << "-42";
        QTest::newRow("int64") << QVariant(5000000000LL) << "int64 5000000000";
        QTest::newRow("bool") << QVariant(true) << "true";
        QTest::newRow("double") << QVariant(2.5) << "2.5";
        QTest::newRow("string list") << QVariant(QStringList { "a", "b" }) << "['a', 'b']";
    }

    // Every change of a key, made here or by another process, arrives later as one
    // valueChanged() at every item of the key; values keep their type.
    void roundTrip()
    {
        QFETCH(QVariant, value);
        QFETCH(QString, stored);
        MGConfItem item(s_dir + "key"), other(item.key()), unrelated(s_dir + "key2");
        QSignalSpy spy(&item, &MGConfItem::valueChanged), otherSpy(&other, &MGConfItem::valueChanged);
        QSignalSpy unrelatedSpy(&unrelated, &MGConfItem::valueChanged);
        const auto counts = [&] { return QString("%1 %2 %3").arg(spy.count()).arg(otherSpy.count()).arg(unrelatedSpy.count()); };
        const auto typed = [](const QVariant &read) { return QVariantList { read, read.userType() }; };
        QVERIFY(!item.value().isValid());

        item.set(value);
        QCOMPARE(spy.count(), 0);
        QCOMPARE(typed(item.value()), typed(value));
        QCOMPARE(DConfTest::read(item.key()), stored);
        QVERIFY(DConfTest::barrier());
        QCOMPARE(counts(), QString("1 1 0"));

        item.set(QVariant());
        QVERIFY(!item.value().isValid() && DConfTest::read(item.key()).isEmpty());
        DConfTest::write(item.key(), stored);
        QVERIFY(DConfTest::barrier());
        QCOMPARE(typed(other.value()), typed(value));
        QCOMPARE(counts(), QString("3 3 0"));

        // A directory above the key reset; an item deleted before its notice arrives.
        DConfTest::reset(s_dir);
        std::unique_ptr<MGConfItem>(new MGConfItem(item.key()))->set(value);
        QVERIFY(DConfTest::barrier());
        QCOMPARE(item.value(), value);
        QCOMPARE(counts(), QString("5 5 1")); // the other key hears only of its directory
    }

    // A value the store can't hold is refused, and the stored one kept.
    void unsupportedType()
    {
        MGConfItem item(s_dir + "typed");
        item.set("kept");
        QTest::ignoreMessage(QtWarningMsg, QRegularExpression("^bool DConfStore::write\\(.*\\) Unsupported value type QRect"));
        item.set(QRect(1, 2, 3, 4));
        QCOMPARE(item.value(), QVariant("kept"));
    }
};

QTEST_GUILESS_MAIN(tst_MGConfItem)
#include "tst_mgconfitem.moc"
