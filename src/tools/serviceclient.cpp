#include "serviceclient.h"

#include <QDBusConnectionInterface>
#include <QDBusMessage>
#include <QDBusReply>

const QString ServiceClient::s_service = QStringLiteral("com.vorka.themeletd");
const QString ServiceClient::s_path = QStringLiteral("/com/vorka/themeletd");
const QString ServiceClient::s_interface = QStringLiteral("com.vorka.themeletd");

namespace {
// Creating a themelet copies and reads a picture; allow for a slow disk.
const int CallTimeout = 120000;
const int MaxMessageLength = 300;

// Text from the bus reaches a terminal: no control characters, no new lines.
QString oneLine(const QString &text)
{
    QString line = text.left(MaxMessageLength);
    for (QChar &c : line) {
        if (c.category() == QChar::Other_Control)
            c = QLatin1Char(' ');
    }
    return line.trimmed();
}
}

ServiceClient::ServiceClient()
    : m_bus(QDBusConnection::sessionBus())
{
}

bool ServiceClient::isRunning()
{
    if (!m_bus.isConnected()) {
        m_error = QStringLiteral("no D-Bus session bus: ") + m_bus.lastError().message();
        return false;
    }
    const QDBusReply<bool> registered = m_bus.interface()->isServiceRegistered(s_service);
    if (!registered.isValid()) {
        m_error = QStringLiteral("cannot ask the session bus about themeletd: ")
                + registered.error().message();
        return false;
    }
    if (!registered.value()) {
        m_error = QStringLiteral("themeletd is not running (nobody owns ") + s_service
                + QStringLiteral(" on the session bus)");
        return false;
    }
    return true;
}

uint ServiceClient::pid()
{
    if (!m_bus.isConnected())
        return 0;
    const QDBusReply<uint> reply = m_bus.interface()->servicePid(s_service);
    return reply.isValid() ? reply.value() : 0;
}

bool ServiceClient::call(const QString &method, const QVariantList &arguments,
                         const QString &replySignature, QVariant *reply)
{
    if (!isRunning())
        return false;
    QDBusMessage message = QDBusMessage::createMethodCall(s_service, s_path, s_interface, method);
    message.setArguments(arguments);
    const QDBusMessage answer = m_bus.call(message, QDBus::Block, CallTimeout);
    if (answer.type() == QDBusMessage::ErrorMessage) {
        m_error = oneLine(answer.errorMessage().isEmpty() ? answer.errorName() : answer.errorMessage());
        return false;
    }
    if (answer.type() != QDBusMessage::ReplyMessage) {
        m_error = QStringLiteral("no reply from themeletd to ") + method;
        return false;
    }
    if (!replySignature.isEmpty()) {
        if (answer.signature() != replySignature) {
            m_error = QStringLiteral("unexpected reply from themeletd to ") + method
                    + QStringLiteral(": signature '") + oneLine(answer.signature())
                    + QStringLiteral("' instead of '") + replySignature + QLatin1Char('\'');
            return false;
        }
        if (reply)
            *reply = answer.arguments().value(0);
    }
    return true;
}
