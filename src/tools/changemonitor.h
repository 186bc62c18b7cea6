// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CHANGEMONITOR_H
#define CHANGEMONITOR_H

#include <QObject>

class ServiceClient;

// Prints every contentChanged of themeletd, one line each, until the service
// leaves the bus.
class ChangeMonitor : public QObject
{
    Q_OBJECT
public:
    ChangeMonitor(ServiceClient &client, bool json, QObject *parent = nullptr);

    // Subscribes and runs the event loop; the exit code.
    int run();

private slots:
    void contentChanged(int type);
    void serviceLeft();

private:
    ServiceClient &m_client;
    bool m_json;
};

#endif
