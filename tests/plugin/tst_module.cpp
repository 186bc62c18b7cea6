// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The module as a client process gets it: found through QML2_IMPORT_PATH alone,
// in a program that links nothing of ours and defines no Content::signalChanged.
#include <QDBusConnection>
#include <QLibrary>
#include <QQmlComponent>
#include <QQmlEngine>
#include <QtTest>

class tst_Module : public QObject
{
    Q_OBJECT

    QQmlEngine m_engine;

    std::unique_ptr<QObject> create(const QByteArray &body)
    {
        QQmlComponent component(&m_engine);
        component.setData("import Orbaline.Themelet 1.0\n" + body, QUrl(QStringLiteral("file:///tst_module.qml")));
        std::unique_ptr<QObject> object(component.create());
        if (!object)
            qWarning() << component.errors();
        return object;
    }

private slots:
    void import()
    {
        // Before the engine loads it lazily: a load that binds every symbol at once, as
        // LD_BIND_NOW or a -z now link would, in a process that isn't the service.
        QLibrary now(qEnvironmentVariable("QML2_IMPORT_PATH") + QStringLiteral("/Orbaline/Themelet/libthemelet.so"));
        now.setLoadHints(QLibrary::ResolveAllSymbolsHint);
        QVERIFY2(now.load(), qPrintable(now.errorString()));

        // Importing registers types and nothing else: no proxy, no D-Bus traffic (Qt's default session bus
        // connection opens with the first use); the first list model uses it.
        const auto sessionBusOpen = []() { return QDBusConnection(QStringLiteral("qt_default_session_bus")).isConnected(); };
        QVERIFY(create("import QtQml 2.0\nQtObject {}"));
        QVERIFY(!sessionBusOpen());
        // Without index and service, the list ends in Error rather than waiting.
        const auto model = create("ThemeletModel {}");
        QVERIFY(model && sessionBusOpen());
        QTRY_COMPARE(model->property("status").toInt(), 3);
        // The singleton, the one type that the QML tests don't reach.
        const auto profile = create("Profile { property var themelet: Themelet }");
        QVERIFY(profile && profile->property("themelet").value<QObject *>());
    }
};

QTEST_MAIN(tst_Module)
#include "tst_module.moc"
