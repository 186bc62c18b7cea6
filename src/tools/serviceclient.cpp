// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "serviceclient.h"

#include "contentprinter.h"
#include "themeletinterface.h"

#include <QCoreApplication>
#include <QDBusConnectionInterface>
#include <QDBusError>
#include <QDBusReply>

namespace {
const int MaxMessageLength = 300;

// Text from the bus reaches a terminal: no control characters, no new lines.
QString oneLine(const QString &text)
{
    return ContentPrinter::oneLine(text.left(MaxMessageLength)).trimmed();
}
}

QString ServiceClient::serviceName()
{
    return QLatin1String(ThemeletInterface::s_serviceName);
}

ThemeletInterface *ServiceClient::proxy() const
{
    return ThemeletInterface::instance();
}

QDBusConnection ServiceClient::connection() const
{
    return proxy()->connection();
}

bool ServiceClient::isRunning()
{
    const QDBusConnection bus = connection();
    if (!bus.isConnected()) {
        m_error = QStringLiteral("no D-Bus session bus: ") + bus.lastError().message();
        return false;
    }
    const QDBusReply<bool> registered = bus.interface()->isServiceRegistered(serviceName());
    if (!registered.isValid()) {
        m_error = QStringLiteral("cannot ask the session bus about themeletd: ")
                + oneLine(registered.error().message());
        return false;
    }
    if (!registered.value()) {
        m_error = QStringLiteral("themeletd is not running (nobody owns ") + serviceName()
                + QStringLiteral(" on the session bus)");
        return false;
    }
    return true;
}

bool ServiceClient::ensureRunning()
{
    if (isRunning())
        return true;
    QDBusConnectionInterface *bus = connection().interface();
    if (!bus)
        return false;
    const QDBusReply<QStringList> activatable = bus->activatableServiceNames();
    if (!activatable.isValid() || !activatable.value().contains(serviceName())) {
        m_error += QStringLiteral("; start it with 'themeletd &' or install its D-Bus activation file");
        return false;
    }
    const QDBusReply<void> started = bus->startService(serviceName());
    if (!started.isValid()) {
        m_error = QStringLiteral("themeletd could not be started by D-Bus activation: ")
                + oneLine(started.error().message());
        return false;
    }
    return isRunning();
}

uint ServiceClient::pid()
{
    const QDBusConnection bus = connection();
    if (!bus.isConnected())
        return 0;
    const QDBusReply<uint> reply = bus.interface()->servicePid(serviceName());
    return reply.isValid() ? reply.value() : 0;
}

qint64 ServiceClient::queued()
{
    const QDBusMessage call = QDBusMessage::createMethodCall(serviceName(), QLatin1String(ThemeletInterface::s_objectPath),
                                                             QStringLiteral("com.vorka.themeletd.Status"),
                                                             QStringLiteral("queued"));
    const QDBusReply<qlonglong> reply = connection().call(call, QDBus::Block, 5000);
    return reply.isValid() ? reply.value() : -1;
}

bool ServiceClient::wait(QDBusPendingCall call)
{
    call.waitForFinished();
    if (!call.isError())
        return true;
    const QDBusError error = call.error();
    m_error = oneLine(error.message().isEmpty() ? error.name() : error.message());
    // Qt's D-Bus thread wakes us before it has told its own listeners of the
    // failure; a round trip on the same thread lets it finish, so that exiting
    // right after an error reply leaves nothing of the call behind.
    connection().call(QDBusMessage::createMethodCall(QStringLiteral("org.freedesktop.DBus"),
                                                     QStringLiteral("/org/freedesktop/DBus"),
                                                     QStringLiteral("org.freedesktop.DBus.Peer"),
                                                     QStringLiteral("Ping")));
    QCoreApplication::sendPostedEvents();
    return false;
}
