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

namespace {

// Qt's default session bus connection: opened by the first D-Bus use in the process.
bool sessionBusOpen()
{
    return QDBusConnection(QStringLiteral("qt_default_session_bus")).isConnected();
}

}

class tst_Module : public QObject
{
    Q_OBJECT

    QQmlEngine m_engine;
    QString m_moduleDir;

    std::unique_ptr<QObject> create(const QByteArray &body, QStringList *errors = nullptr)
    {
        QQmlComponent component(&m_engine);
        component.setData("import QtQml 2.0\nimport Orbaline.Themelet 1.0\n" + body, QUrl(QStringLiteral("file:///tst_module.qml")));
        std::unique_ptr<QObject> object(component.create());
        if (errors) {
            for (const QQmlError &error : component.errors())
                *errors << error.description();
        }
        return object;
    }

private slots:
    void initTestCase()
    {
        QVERIFY(qEnvironmentVariableIsSet("QML2_IMPORT_PATH"));
        for (const QString &path : m_engine.importPathList()) {
            if (QFile::exists(path + QStringLiteral("/Orbaline/Themelet/qmldir")))
                m_moduleDir = path + QStringLiteral("/Orbaline/Themelet");
        }
        QVERIFY(!m_moduleDir.isEmpty());

        // Before the engine loads it lazily: a load that binds every symbol at once, as
        // LD_BIND_NOW or a -z now link would, in a process that isn't the service.
        QLibrary now(m_moduleDir + QStringLiteral("/libthemelet.so"));
        now.setLoadHints(QLibrary::ResolveAllSymbolsHint);
        QVERIFY2(now.load(), qPrintable(now.errorString()));
    }

    // Importing registers types and nothing else: no proxy, no D-Bus traffic. Profile
    // doesn't use the bus of Qt either; the first list model does.
    void importTouchesNoBus()
    {
        QStringList errors;
        QVERIFY(create("QtObject {}", &errors));
        QCOMPARE(errors, QStringList());
        QVERIFY(create("Profile {}"));
        QVERIFY(!sessionBusOpen());

        // Without index and service, the list ends in Error rather than waiting.
        auto model = create("ThemeletModel {}");
        QVERIFY(model && sessionBusOpen());
        QTRY_COMPARE(model->property("status").toInt(), 3);
    }

    void types_data()
    {
        QTest::addColumn<QByteArray>("body");
        QTest::addColumn<QString>("error");
        for (const char *name : { "ThemeletModel", "ContentInfo", "PhotoModel", "ToneModel", "Profile" })
            QTest::newRow(name) << QByteArray(name) + " {}" << QString();
        QTest::newRow("Themelet") << QByteArray("QtObject { property QtObject themelet: Themelet }") << QString();
        for (const char *name : { "AbstractContentModel", "ContentModel", "ThemeletInterface", "ProfileManager", "DeclarativeThemelet" })
            QTest::newRow(name) << QByteArray(name) + " {}" << QString(name) + " is not a type";
    }

    void types()
    {
        QFETCH(QByteArray, body);
        QFETCH(QString, error);
        QStringList errors;
        const auto object = create(body, &errors);
        QCOMPARE(errors, error.isEmpty() ? QStringList() : QStringList { error });
        QCOMPARE(object != nullptr, error.isEmpty());
    }

    // What tools read beside the library: the qmldir points at the type information, which
    // exports the six names and nothing else.
    void typeInformation()
    {
        QFile qmldir(m_moduleDir + QStringLiteral("/qmldir"));
        QVERIFY(qmldir.open(QIODevice::ReadOnly));
        const QStringList lines = QString::fromUtf8(qmldir.readAll()).split(QLatin1Char('\n'), Qt::SkipEmptyParts);
        QVERIFY(lines.contains(QStringLiteral("typeinfo plugins.qmltypes")));

        QFile types(m_moduleDir + QStringLiteral("/plugins.qmltypes"));
        QVERIFY(types.open(QIODevice::ReadOnly));
        const QString text = QString::fromUtf8(types.readAll());
        QStringList exports;
        QRegularExpressionMatchIterator it = QRegularExpression(QStringLiteral("exports: \\[\"([^\"]+)\"\\]")).globalMatch(text);
        while (it.hasNext())
            exports << it.next().captured(1);
        exports.sort();
        QCOMPARE(exports, (QStringList { "Orbaline.Themelet/ContentInfo 1.0", "Orbaline.Themelet/PhotoModel 1.0",
                                         "Orbaline.Themelet/Profile 1.0", "Orbaline.Themelet/Themelet 1.0",
                                         "Orbaline.Themelet/ThemeletModel 1.0", "Orbaline.Themelet/ToneModel 1.0" }));
        QVERIFY(text.contains(QStringLiteral("name: \"AbstractContentModel\"")));
        QVERIFY(QRegularExpression(QStringLiteral("prototype: \"AbstractContentModel\"")).match(text).hasMatch());
    }

    // The loader's record, read without instantiating.
    void pluginEntry()
    {
        const QString library = m_moduleDir + QStringLiteral("/libthemelet.so");
        const QJsonObject metaData = QPluginLoader(library).metaData();
        QCOMPARE(metaData.value(QStringLiteral("IID")).toString(), QStringLiteral("Orbaline.Themelet"));
        QCOMPARE(metaData.value(QStringLiteral("className")).toString(), QStringLiteral("DeclarativePlugin"));
        QCOMPARE(metaData.value(QStringLiteral("MetaData")).toObject(), QJsonObject());
    }
};

QTEST_MAIN(tst_Module)
#include "tst_module.moc"
