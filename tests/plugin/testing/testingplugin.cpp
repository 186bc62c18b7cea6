// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "recordingservice.h"

#include <QProcess>
#include <QtQml>

// What a QML test needs from outside its engine: the sandbox's path, the dconf tool as
// another process, and the recording stand-in for themeletd, which starts only when asked.
class Fixture : public QObject
{
    Q_OBJECT
    Q_PROPERTY(QString sandbox READ sandbox CONSTANT)
public:
    QString sandbox() const { return qEnvironmentVariable("THEMELET_SANDBOX"); }
    // The tool's output, trimmed; a failure is a warning, which fails the test.
    Q_INVOKABLE QString dconf(const QStringList &arguments) const
    {
        QProcess process;
        process.setProcessChannelMode(QProcess::ForwardedErrorChannel);
        process.start(QStringLiteral("dconf"), arguments);
        if (!process.waitForFinished(120000) || process.exitStatus() != QProcess::NormalExit || process.exitCode() != 0)
            qWarning() << "dconf" << arguments << "failed";
        return QString::fromUtf8(process.readAllStandardOutput()).trimmed();
    }

    Q_INVOKABLE bool startService() { return m_service.start(); }
    Q_INVOKABLE bool emitContentChanged(int type) { return m_service.emitContentChanged(type); }
    // Each call as [method, arguments...].
    Q_INVOKABLE QVariantList takeCalls(int count = 0) { return m_service.take(count); }

private:
    RecordingService m_service;
};

// A module of its own, so that the module under test is loaded exactly as a client loads it.
class TestingPlugin : public QQmlExtensionPlugin
{
    Q_OBJECT
    Q_PLUGIN_METADATA(IID "ThemeletTesting")
public:
    void registerTypes(const char *uri) override
    {
        qmlRegisterSingletonType<Fixture>(uri, 1, 0, "Fixture", [](QQmlEngine *, QJSEngine *) -> QObject * { return new Fixture; });
    }
};

#include "testingplugin.moc"
