// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "changemonitor.h"

#include "contentprinter.h"
#include "serviceclient.h"
#include "themeletinterface.h"

#include <QCoreApplication>
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
    QDBusServiceWatcher watcher(ServiceClient::serviceName(), m_client.connection(),
                                QDBusServiceWatcher::WatchForUnregistration);
    connect(&watcher, &QDBusServiceWatcher::serviceUnregistered, this, &ChangeMonitor::serviceLeft);
    // The proxy's signal is bound to the name's owner: nobody else can speak for the service.
    connect(m_client.proxy(), &ThemeletInterface::contentChanged, this, &ChangeMonitor::contentChanged);
    // Asked after subscribing: the bus handles our messages in order, so no
    // signal sent after this answer is missed.
    if (!m_client.ensureRunning()) {
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
