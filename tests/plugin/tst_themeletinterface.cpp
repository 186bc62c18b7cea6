// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "declarativethemelet.h"
#include "messagelog.h"
#include "recordingservice.h"
#include "themeletdproxy.h" // generated from the interface file
#include "themeletinterface.h"

#include <QDBusPendingCallWatcher>
#include <QJSEngine>
#include <QMetaMethod>
#include <QtTest>

#include <memory>

namespace {

QStringList members(const QMetaObject &metaObject)
{
    QStringList members;
    for (int i = metaObject.methodOffset(); i < metaObject.methodCount(); ++i) {
        const QMetaMethod method = metaObject.method(i);
        members << QString::fromLatin1(method.typeName() + (' ' + method.methodSignature()) + ' ' + method.parameterNames().join(','));
    }
    members.sort(); // Qt's tool orders them by name
    return members;
}

}

class tst_ThemeletInterface : public QObject
{
    Q_OBJECT

    std::unique_ptr<RecordingService> m_service;
    QJSEngine m_engine;

private slots:
    void init()
    {
        m_service.reset(new RecordingService);
        QVERIFY(m_service->start());
    }
    void cleanup() { m_service.reset(); }

    // Methods and signals as the interface file has them; the CLI's tests call most of them.
    void proxyMatchesInterfaceFile()
    {
        QCOMPARE(members(ThemeletInterface::staticMetaObject), members(ComVorkaThemeletdInterface::staticMetaObject));
    }

    // Values in their D-Bus form, and nothing that would make libdbus abort.
    void attributesReachService()
    {
        ThemeletInterface *interface = ThemeletInterface::instance();
        const QVariantMap attributes { { "favorite", true }, { "none", QVariant() }, { "object", QVariant::fromValue<QObject *>(this) },
                                       { "resources", QVariantMap { { "k", QColor(Qt::red) }, { "u", QVariantList { QUrl("file:///u"), QVariant() } } } } };
        interface->remove(2, Q_INT64_C(1) << 40);
        const QDBusPendingCall reply = interface->saveAttributes(1, 5, attributes);
        QTRY_VERIFY(reply.isFinished()); // the service answers on this thread
        QVERIFY2(!reply.isError(), qPrintable(reply.error().message()));
        const QVariantMap sent { { "favorite", true }, { "none", "" }, { "object", "" },
                                 { "resources", QVariantMap { { "k", "#ffff0000" }, { "u", QVariantList { "file:///u", "" } } } } };
        QCOMPARE(m_service->calls,
                 QVariantList({ QVariantList { "remove", 2, Q_INT64_C(1) << 40 }, QVariantList { "saveAttributes", 1, 5, sent } }));
    }

    // callback: a script that keeps its arguments in `calls`, or a value that isn't callable.
    void setThemelet_data()
    {
        QTest::addColumn<bool>("create");
        QTest::addColumn<QString>("callback");
        QTest::addColumn<qlonglong>("id");
        QTest::addColumn<QString>("error"); // of the service; "absent": no service at all
        QTest::addColumn<QString>("received");
        QTest::addColumn<QString>("line");
        const QString recorder = "(function() { calls.push(Array.prototype.slice.call(arguments)); })";
        QTest::newRow("set") << false << recorder << qlonglong(12) << "" << "[[12]]" << "";
        // Above 2^53 a double can't hold every id.
        QTest::newRow("create, large id") << true << recorder << (Q_INT64_C(1) << 53) + 1 << "" << "[[9007199254740992]]" << "";
        QTest::newRow("an object") << true << "({})" << qlonglong(1) << "refused" << "[]" << "";
        QTest::newRow("refused") << true << recorder << qlonglong(1) << "no such file" << "[]" << "Error creating themelet: no such file";
        QTest::newRow("no service") << false << recorder << qlonglong(1) << "absent" << "[]"
                                    << "Error creating themelet: The name com.vorka.themeletd was not provided by any .service files";
    }

    void setThemelet()
    {
        QFETCH(bool, create);
        QFETCH(QString, callback);
        QFETCH(qlonglong, id);
        QFETCH(QString, error);
        QFETCH(QString, received);
        QFETCH(QString, line);
        m_service->replyId = id;
        m_service->errorMessage = error;
        if (error == "absent")
            m_service.reset();
        MessageLog log;
        m_engine.globalObject().setProperty("calls", m_engine.newArray());
        const QJSValue function = callback.isEmpty() ? QJSValue() : m_engine.evaluate(callback);
        DeclarativeThemelet themelet;
        const QUrl url = QUrl::fromLocalFile("/t/sea #1.themelet");
        create ? themelet.create(url, function) : themelet.setThemelet(url, function);
        // Without a callable callback the reply is dropped unread.
        QCOMPARE(themelet.findChildren<QDBusPendingCallWatcher *>().size(), function.isCallable() ? 1 : 0);
        QTRY_VERIFY(themelet.findChildren<QDBusPendingCallWatcher *>().isEmpty()); // deleted later
        if (m_service)
            QTRY_COMPARE(m_service->calls, QVariantList { QVariant(QVariantList { create ? "createThemelet" : "setThemelet", url.toString() }) });
        QTest::qWait(50);
        QCOMPARE(m_engine.evaluate("JSON.stringify(calls)").toString(), received);
        const QStringList lines = log.records().filter("Error creating themelet");
        QCOMPARE(lines.size(), line.isEmpty() ? 0 : 1);
        if (!line.isEmpty())
            QVERIFY2(lines.at(0).endsWith("QML DeclarativeThemelet: " + line), qPrintable(lines.at(0)));

        // Writing the property is the same call, made even for the current value.
        if (!create && m_service) {
            themelet.setProperty("source", themelet.source());
            themelet.setProperty("source", themelet.source());
            QTRY_COMPARE(m_service->calls.size(), 3);
            QCOMPARE(m_service->calls.at(2).toList(), QVariantList({ "setThemelet", themelet.source().toString() }));
        }
    }

    void highlightColors()
    {
        DeclarativeThemelet themelet;
        // Only the hue counts; the colours come back as RGB, which QColor's equality tells apart.
        for (const QColor &color : { QColor(80, 0, 0, 20), QColor(Qt::blue) }) {
            const QColor dimmer = themelet.highlightDimmerColor(color), background = themelet.highlightBackgroundColor(color);
            QCOMPARE(dimmer.name(QColor::HexArgb) + background.name(QColor::HexArgb),
                     color == Qt::blue ? "#ff000033#ff0000e6" : "#ff330000#ffe60000");
            QVERIFY(dimmer == dimmer.toRgb() && background == background.toRgb());
        }
    }
};

QTEST_MAIN(tst_ThemeletInterface)
#include "tst_themeletinterface.moc"
