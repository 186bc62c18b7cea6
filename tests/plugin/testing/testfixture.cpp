#include "testfixture.h"

#include <QDebug>
#include <QProcess>

QString TestFixture::sandbox() const
{
    return qEnvironmentVariable("THEMELET_SANDBOX");
}

QString TestFixture::dconf(const QStringList &arguments) const
{
    bool ok = false;
    return run(QStringLiteral("dconf"), arguments, &ok);
}

bool TestFixture::index(const QStringList &arguments) const
{
    bool ok = false;
    run(qEnvironmentVariable("THEMELET_QML_FIXTURE"), arguments, &ok);
    return ok;
}

QString TestFixture::run(const QString &program, const QStringList &arguments, bool *ok)
{
    QProcess process;
    process.setProcessChannelMode(QProcess::ForwardedErrorChannel);
    process.start(program, arguments);
    *ok = process.waitForFinished(120000) && process.exitStatus() == QProcess::NormalExit && process.exitCode() == 0;
    if (!*ok)
        qWarning() << program << arguments << "failed";
    return QString::fromUtf8(process.readAllStandardOutput()).trimmed();
}
