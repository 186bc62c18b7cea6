#include "changemonitor.h"

#include "contentprinter.h"
#include "serviceclient.h"

#include <QCoreApplication>
#include <QDBusError>
#include <QDBusServiceWatcher>
#include <QJsonObject>

ChangeMonitor::ChangeMonitor(ServiceClient &client, bool json, QObject *parent)
    : QObject(parent)
    , m_client(client)
    , m_json(json)
{
}

int ChangeMonitor::run()
{
    QDBusConnection bus = m_client.connection();
    QDBusServiceWatcher watcher(ServiceClient::s_service, bus,
                                QDBusServiceWatcher::WatchForUnregistration);
    connect(&watcher, &QDBusServiceWatcher::serviceUnregistered, this, &ChangeMonitor::serviceLeft);
    // Bound to the name's owner, so nobody else can speak for the service.
    if (!bus.connect(ServiceClient::s_service, ServiceClient::s_path, ServiceClient::s_interface,
                     QStringLiteral("contentChanged"), QStringLiteral("i"),
                     this, SLOT(contentChanged(int)))) {
        ContentPrinter::printError(QStringLiteral("cannot subscribe to contentChanged: ")
                                   + bus.lastError().message());
        return 1;
    }
    // Asked after subscribing: the bus handles our messages in order, so no
    // signal sent after this answer is missed.
    if (!m_client.isRunning()) {
        ContentPrinter::printError(m_client.errorString());
        return 1;
    }
    return QCoreApplication::exec();
}

void ChangeMonitor::contentChanged(int type)
{
    if (m_json) {
        QJsonObject line;
        line.insert(QStringLiteral("signal"), QStringLiteral("contentChanged"));
        line.insert(QStringLiteral("type"), type);
        line.insert(QStringLiteral("typeName"), ContentPrinter::typeName(type));
        ContentPrinter::printJson(line, true);
    } else {
        ContentPrinter::print(QStringLiteral("contentChanged ") + QString::number(type) + QStringLiteral(" ")
                              + ContentPrinter::typeName(type));
    }
}

void ChangeMonitor::serviceLeft()
{
    ContentPrinter::printError(QStringLiteral("themeletd left the session bus"));
    QCoreApplication::exit(1);
}
