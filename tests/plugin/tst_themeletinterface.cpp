#include "declarativethemelet.h"
#include "messagelog.h"
#include "recordingservice.h"
#include "themeletinterface.h"

#include <QDBusMetaType>
#include <QDBusPendingCallWatcher>
#include <QFile>
#include <QJSEngine>
#include <QMetaMethod>
#include <QXmlStreamReader>
#include <QtTest>

#include <memory>

namespace {

// One line a method or signal: "remove(i contentType, x contentId)", "setThemelet(s url) -> x".
QStringList interfaceFromXml(const QString &path)
{
    QFile file(path);
    if (!file.open(QIODevice::ReadOnly))
        return { "cannot read " + path };
    QStringList members;
    QXmlStreamReader xml(&file);
    QString kind, name, out;
    QStringList in;
    while (!xml.atEnd()) {
        xml.readNext();
        const QXmlStreamAttributes attributes = xml.attributes();
        if (xml.isStartElement() && (xml.name() == QLatin1String("method") || xml.name() == QLatin1String("signal"))) {
            kind = xml.name() == QLatin1String("signal") ? "signal " : "";
            name = attributes.value("name").toString();
            in.clear();
            out.clear();
        } else if (xml.isStartElement() && xml.name() == QLatin1String("arg")) {
            if (attributes.value("direction") == QLatin1String("out"))
                out = " -> " + attributes.value("type").toString();
            else
                in << attributes.value("type").toString() + ' ' + attributes.value("name").toString();
        } else if (xml.isEndElement() && (xml.name() == QLatin1String("method") || xml.name() == QLatin1String("signal"))) {
            members << kind + name + '(' + in.join(", ") + ')' + out;
        }
    }
    return xml.hasError() ? QStringList { xml.errorString() } : members;
}

QString signature(const QByteArray &typeName)
{
    return QString::fromLatin1(QDBusMetaType::typeToSignature(QMetaType::type(typeName)));
}

QStringList interfaceFromMetaObject(const QMetaObject &metaObject)
{
    // moc puts signals first; the file lists them after the methods.
    QStringList members;
    QStringList signalMembers;
    for (int i = metaObject.methodOffset(); i < metaObject.methodCount(); ++i) {
        const QMetaMethod method = metaObject.method(i);
        QStringList in;
        for (int j = 0; j < method.parameterCount(); ++j)
            in << signature(method.parameterTypes().at(j)) + ' ' + QString::fromLatin1(method.parameterNames().at(j));
        QString out;
        const QByteArray reply = method.typeName();
        const int open = reply.indexOf('<');
        if (open >= 0 && reply.indexOf('>') > open + 1)
            out = " -> " + signature(reply.mid(open + 1, reply.indexOf('>') - open - 1));
        const bool isSignal = method.methodType() == QMetaMethod::Signal;
        (isSignal ? signalMembers : members) << QString(isSignal ? "signal " : "") + QString::fromLatin1(method.name())
                        + '(' + in.join(", ") + ')' + out;
    }
    return members + signalMembers;
}

}

class tst_ThemeletInterface : public QObject
{
    Q_OBJECT

    std::unique_ptr<RecordingService> m_service;
    QJSEngine m_engine;

    // A script function that keeps its arguments in `calls`.
    QJSValue recorder()
    {
        m_engine.globalObject().setProperty("calls", m_engine.newArray());
        return m_engine.evaluate("(function() { calls.push(Array.prototype.slice.call(arguments)); })");
    }
    QString scriptCalls() { return m_engine.evaluate("JSON.stringify(calls)").toString(); }

private slots:
    void init()
    {
        m_service.reset(new RecordingService);
        QVERIFY(m_service->start());
    }
    void cleanup() { m_service.reset(); }

    void proxyMatchesInterfaceFile()
    {
        QCOMPARE(interfaceFromMetaObject(ThemeletInterface::staticMetaObject), interfaceFromXml(THEMELET_INTERFACE_XML));
        ThemeletInterface *interface = ThemeletInterface::instance();
        QVERIFY(interface);
        QCOMPARE(interface, ThemeletInterface::instance());
        QCOMPARE(interface->service(), "com.vorka.themeletd");
        QCOMPARE(interface->path(), "/com/vorka/themeletd");
        QCOMPARE(interface->interface(), "com.vorka.themeletd");
    }

    void callsReachService()
    {
        ThemeletInterface *interface = ThemeletInterface::instance();
        m_service->replyId = 7;
        QList<QDBusPendingCall> replies { interface->createThemelet("file:///a b.themelet"), interface->indexFile("file:///x.jpg"),
                                          interface->installPackage("/p"), interface->refreshThemelets(),
                                          interface->remove(2, Q_INT64_C(1) << 40),
                                          interface->saveAttributes(1, 5, { { "favorite", true }, { "none", QVariant() },
                                                                                   { "resources", QVariantMap { { "k", QColor(Qt::red) }, { "u", QUrl("file:///u") } } } }),
                                          interface->setThemelet("file:///t.themelet"), interface->setFavorite("file:///w.jpg", true) };
        // The service answers on this thread: wait in the event loop.
        QTRY_VERIFY(std::all_of(replies.begin(), replies.end(), [](const QDBusPendingCall &reply) { return reply.isFinished(); }));
        for (const QDBusPendingCall &reply : replies)
            QVERIFY2(!reply.isError(), qPrintable(reply.error().message()));
        QStringList calls;
        for (const RecordingService::Call &call : qAsConst(m_service->calls))
            calls << call.method + ' ' + QVariant(call.arguments).toStringList().join(',');
        QCOMPARE(calls, QStringList({ "createThemelet file:///a b.themelet", "indexFile file:///x.jpg", "installPackage /p",
                                      "refreshThemelets ", "remove 2,1099511627776", "saveAttributes 1,5,",
                                      "setThemelet file:///t.themelet", "setFavorite file:///w.jpg,true" }));
        // In their D-Bus form, and nothing that would make libdbus abort.
        QCOMPARE(m_service->calls.at(5).arguments.at(2).toMap(),
                 QVariantMap({ { "favorite", true }, { "none", "" }, { "resources", QVariantMap { { "k", "#ffff0000" }, { "u", "file:///u" } } } }));
        QCOMPARE(QDBusPendingReply<qlonglong>(replies.at(0)).value(), 7);
        QCOMPARE(QDBusPendingReply<bool>(replies.at(7)).value(), true);

        QSignalSpy changed(interface, &ThemeletInterface::contentChanged);
        QVERIFY(m_service->emitContentChanged(2));
        QTRY_COMPARE(changed.count(), 1);
        QCOMPARE(changed.at(0).at(0).toInt(), 2);
    }

    void callback_data()
    {
        QTest::addColumn<bool>("create");
        QTest::addColumn<qlonglong>("id");
        QTest::addColumn<QString>("received");
        QTest::newRow("set") << false << qlonglong(12) << "[[12]]";
        QTest::newRow("create") << true << qlonglong(3) << "[[3]]";
        // Above 2^53 a double can't hold every id.
        QTest::newRow("large id") << true << (Q_INT64_C(1) << 53) + 1 << "[[9007199254740992]]";
    }

    void callback()
    {
        QFETCH(bool, create);
        QFETCH(qlonglong, id);
        QFETCH(QString, received);
        m_service->replyId = id;
        DeclarativeThemelet themelet;
        const QUrl url = QUrl::fromLocalFile("/t/sea #1.themelet");
        if (create)
            themelet.create(url, recorder());
        else
            themelet.setThemelet(url, recorder());
        QTRY_COMPARE(scriptCalls(), received);
        QCOMPARE(m_engine.evaluate("typeof calls[0][0]").toString(), "number");
        QCOMPARE(m_service->calls.size(), 1);
        QCOMPARE(m_service->calls.at(0).method, create ? "createThemelet" : "setThemelet");
        QCOMPARE(m_service->calls.at(0).arguments, QVariantList { url.toString() });
        QTRY_VERIFY(themelet.findChildren<QDBusPendingCallWatcher *>().isEmpty()); // deleted later
    }

    void noCallback_data()
    {
        QTest::addColumn<QJSValue>("callback");
        QTest::newRow("absent") << QJSValue();
        QTest::newRow("a number") << QJSValue(42);
        QTest::newRow("an object") << m_engine.newObject();
    }

    void noCallback()
    {
        QFETCH(QJSValue, callback);
        m_service->errorMessage = "refused";
        MessageLog log;
        DeclarativeThemelet themelet;
        themelet.setThemelet(QUrl("file:///t.themelet"), callback);
        QVERIFY(themelet.findChildren<QDBusPendingCallWatcher *>().isEmpty());
        // Writing the property is the same call, made even for the current value.
        themelet.setProperty("source", themelet.source());
        themelet.setProperty("source", themelet.source());
        QTRY_COMPARE(m_service->calls.size(), 3);
        QCOMPARE(m_service->calls.at(1).method, "setThemelet");
        QCOMPARE(m_service->calls.at(1).arguments, QVariantList { themelet.source().toString() });
        QTest::qWait(50);
        QCOMPARE(log.records().filter("Error creating themelet"), QStringList()); // dropped unread
    }

    void serviceError_data()
    {
        QTest::addColumn<bool>("running");
        QTest::addColumn<QString>("message");
        QTest::newRow("refused") << true << "Error creating themelet: no such file";
        QTest::newRow("no service") << false << "Error creating themelet: The name com.vorka.themeletd was not provided by any .service files";
    }

    void serviceError()
    {
        QFETCH(bool, running);
        QFETCH(QString, message);
        m_service->errorMessage = "no such file";
        if (!running)
            m_service.reset();
        DeclarativeThemelet themelet;
        QTest::ignoreMessage(QtInfoMsg, QRegularExpression("QML DeclarativeThemelet: " + QRegularExpression::escape(message) + "$"));
        themelet.create(QUrl("file:///t.themelet"), recorder());
        QTRY_VERIFY(themelet.findChildren<QDBusPendingCallWatcher *>().isEmpty());
        QCOMPARE(scriptCalls(), "[]");
    }

    void highlightColors_data()
    {
        QTest::addColumn<QColor>("color");
        QTest::addColumn<QString>("dimmer");
        QTest::addColumn<QString>("background");
        QTest::newRow("red") << QColor(Qt::red) << "#ff330000" << "#ffe60000";
        QTest::newRow("dark translucent red") << QColor(80, 0, 0, 20) << "#ff330000" << "#ffe60000";
        QTest::newRow("blue") << QColor(Qt::blue) << "#ff000033" << "#ff0000e6";
    }

    void highlightColors()
    {
        QFETCH(QColor, color);
        QFETCH(QString, dimmer);
        QFETCH(QString, background);
        DeclarativeThemelet themelet;
        QCOMPARE(themelet.highlightDimmerColor(color).name(QColor::HexArgb), dimmer);
        QCOMPARE(themelet.highlightBackgroundColor(color).name(QColor::HexArgb), background);
        // Returned as RGB: QColor's equality includes how the colour is held.
        const QColor rgb = themelet.highlightBackgroundColor(color);
        QCOMPARE(rgb, rgb.toRgb());
    }
};

QTEST_MAIN(tst_ThemeletInterface)
#include "tst_themeletinterface.moc"
