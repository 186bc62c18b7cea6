#include "qmlrecordingservice.h"
#include "testfixture.h"

#include <QQmlExtensionPlugin>
#include <QtQml>

// Test-only helpers, in a module of their own so that the module under test
// is loaded exactly as a client loads it.
class TestingPlugin : public QQmlExtensionPlugin
{
    Q_OBJECT
    Q_PLUGIN_METADATA(IID "ThemeletTesting")
public:
    void registerTypes(const char *uri) override
    {
        qmlRegisterType<QmlRecordingService>(uri, 1, 0, "RecordingService");
        qmlRegisterSingletonType<TestFixture>(uri, 1, 0, "Fixture",
                                              [](QQmlEngine *, QJSEngine *) -> QObject * { return new TestFixture; });
    }
};

#include "testingplugin.moc"
