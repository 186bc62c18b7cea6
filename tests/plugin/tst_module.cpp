// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The module as a client process gets it: found through QML2_IMPORT_PATH alone,
// in a program that links nothing of ours and defines no Content::signalChanged.
#include <QDBusConnection>
#include <QJsonObject>
#include <QLibrary>
#include <QPluginLoader>
#include <QQmlComponent>
#include <QQmlEngine>
#include <QRegularExpression>
#include <QtTest>

#include <memory>

class tst_Module : public QObject
{
    Q_OBJECT

    QQmlEngine m_engine;
    QString m_moduleDir;

    std::unique_ptr<QObject> create(const QByteArray &body, QStringList *errors)
    {
        QQmlComponent component(&m_engine);
        component.setData("import QtQml 2.0\nimport Orbaline.Themelet 1.0\n" + body, QUrl(QStringLiteral("file:///tst_module.qml")));
        std::unique_ptr<QObject> object(component.create());
        for (const QQmlError &error : component.errors())
            *errors << error.description();
        return object;
    }

    // Qt's default session bus connection: opened by the first D-Bus use in the process.
    static bool sessionBusOpen() { return QDBusConnection(QStringLiteral("qt_default_session_bus")).isConnected(); }

private slots:
    void initTestCase()
    {
        m_moduleDir = qEnvironmentVariable("QML2_IMPORT_PATH") + QStringLiteral("/Orbaline/Themelet");

        // Before the engine loads it lazily: a load that binds every symbol at once, as
        // LD_BIND_NOW or a -z now link would, in a process that isn't the service.
        QLibrary now(m_moduleDir + QStringLiteral("/libthemelet.so"));
        now.setLoadHints(QLibrary::ResolveAllSymbolsHint);
        QVERIFY2(now.load(), qPrintable(now.errorString()));
        const QJsonObject meta = QPluginLoader(now.fileName()).metaData();
        QCOMPARE(meta.value(QStringLiteral("IID")).toString(), QStringLiteral("Orbaline.Themelet"));
    }

    // Importing registers types and nothing else: no proxy, no D-Bus traffic. Profile
    // doesn't use the bus of Qt either; the first list model does.
    void importTouchesNoBus()
    {
        QStringList errors;
        QVERIFY(create("Profile {}", &errors));
        QCOMPARE(errors, QStringList());
        QVERIFY(!sessionBusOpen());

        // Without index and service, the list ends in Error rather than waiting.
        auto model = create("ThemeletModel {}", &errors);
        QVERIFY(model && sessionBusOpen());
        QTRY_COMPARE(model->property("status").toInt(), 3);
    }

    // The six names and nothing else, for tools (the type information, which the build dumps
    // from the registered types) and so for the engine; the QML tests and the gallery create them.
    void types()
    {
        // A literal id is refused with the engine's words, which the module's documentation quotes.
        QStringList errors;
        QVERIFY(!create("ContentInfo { contentId: 39 }", &errors) && create("ContentInfo { contentId: 39 + 0 }", &errors));
        QFile doc(QStringLiteral(THEMELET_QML_DOC));
        QVERIFY(errors.size() == 1 && doc.open(QIODevice::ReadOnly));
        QVERIFY2(QString::fromUtf8(doc.readAll()).contains(errors.first()), qPrintable(errors.first()));

        QFile types(m_moduleDir + QStringLiteral("/plugins.qmltypes"));
        QVERIFY(types.open(QIODevice::ReadOnly));
        QStringList exports;
        for (auto it = QRegularExpression(QStringLiteral("exports: \\[\"Orbaline.Themelet/([^\"]+)\"\\]")).globalMatch(types.readAll()); it.hasNext();)
            exports << it.next().captured(1);
        exports.sort();
        QCOMPARE(exports.join(' '), QStringLiteral("ContentInfo 1.0 PhotoModel 1.0 Profile 1.0 Themelet 1.0 ThemeletModel 1.0 ToneModel 1.0"));
    }
};

QTEST_MAIN(tst_Module)
#include "tst_module.moc"
