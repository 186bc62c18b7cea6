#ifndef SERVICECLIENT_H
#define SERVICECLIENT_H

#include <QDBusConnection>
#include <QString>
#include <QVariant>

// Calls of themeletd on the session bus. Whatever comes back is checked
// against the interface, since anything on the bus may be hostile.
class ServiceClient
{
public:
    static const QString s_service;
    static const QString s_path;
    static const QString s_interface;

    ServiceClient();

    // Asks the bus who owns the name; never starts the service by activation.
    bool isRunning();
    // 0 when unknown.
    uint pid();

    // Blocks until the reply. With a non-empty replySignature the reply must
    // carry exactly that; its first argument goes to *reply.
    bool call(const QString &method, const QVariantList &arguments,
              const QString &replySignature = QString(), QVariant *reply = nullptr);

    QDBusConnection connection() const { return m_bus; }
    // One line, for the user.
    QString errorString() const { return m_error; }

private:
    QDBusConnection m_bus;
    QString m_error;
};

#endif
