// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef SERVICECLIENT_H
#define SERVICECLIENT_H

#include <QDBusConnection>
#include <QDBusPendingCall>
#include <QString>

class ThemeletInterface;

// themeletd as a command-line client needs it: is it there, and the replies
// of the process-wide proxy waited for, with their errors as one line.
class ServiceClient
{
public:
    static QString serviceName();

    // Asks the bus who owns the name; never starts the service by activation.
    bool isRunning();
    // Whether the service is there, started by D-Bus activation if the bus
    // knows how; otherwise the error says how to start it.
    bool ensureRunning();
    // 0 when unknown.
    uint pid();
    // Directories and packages the service has queued for reading; -1 when unknown.
    qint64 queued();

    ThemeletInterface *proxy() const;
    QDBusConnection connection() const;

    // Blocks until the reply; false when it is an error, also one of a typed
    // reply whose arguments don't match.
    bool wait(QDBusPendingCall call);

    // One line, for the user.
    QString errorString() const { return m_error; }

private:
    QString m_error;
};

#endif
