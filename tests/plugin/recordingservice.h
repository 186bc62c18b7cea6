// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef RECORDINGSERVICE_H
#define RECORDINGSERVICE_H

#include <QDBusArgument>
#include <QDBusConnection>
#include <QDBusContext>
#include <QDBusMessage>
#include <QTest>

#include <utility>

// A stand-in for themeletd on the test's private session bus, on a connection
// of its own so that calls really cross the bus. Writes down every call as
// [method, arguments...], nested containers made plain.
class RecordingService : public QObject, protected QDBusContext
{
    Q_OBJECT
    Q_CLASSINFO("D-Bus Interface", "com.vorka.themeletd")
public:
    RecordingService() : m_bus(QDBusConnection::connectToBus(QDBusConnection::SessionBus, QStringLiteral("recording-service"))) {}
    ~RecordingService() override
    {
        m_bus.unregisterService(QStringLiteral("com.vorka.themeletd"));
        m_bus.unregisterObject(QStringLiteral("/com/vorka/themeletd"));
        QDBusConnection::disconnectFromBus(QStringLiteral("recording-service"));
    }

    bool start()
    {
        return m_bus.registerObject(QStringLiteral("/com/vorka/themeletd"), this, QDBusConnection::ExportAllSlots)
                && m_bus.registerService(QStringLiteral("com.vorka.themeletd"));
    }

    bool emitContentChanged(int type)
    {
        return m_bus.send(QDBusMessage::createSignal(QStringLiteral("/com/vorka/themeletd"), QStringLiteral("com.vorka.themeletd"),
                                                     QStringLiteral("contentChanged")) << type);
    }

    // Nested containers arrive as QDBusArgument.
    static QVariant plain(QVariant value)
    {
        if (value.userType() == qMetaTypeId<QDBusArgument>()) {
            const QDBusArgument argument = value.value<QDBusArgument>();
            value = argument.currentType() == QDBusArgument::MapType ? QVariant(qdbus_cast<QVariantMap>(argument))
                                                                     : QVariant(qdbus_cast<QVariantList>(argument));
        }
        if (value.userType() != QMetaType::QVariantMap && value.userType() != QMetaType::QVariantList)
            return value;
        QVariantMap map = value.toMap();
        QVariantList list = value.toList();
        for (QVariant &entry : map)
            entry = plain(entry);
        for (QVariant &entry : list)
            entry = plain(entry);
        return value.userType() == QMetaType::QVariantMap ? QVariant(map) : QVariant(list);
    }

    // The calls since the last take, once `count` have come and a little longer, so that one too many shows.
    QVariantList take(int count = 0)
    {
        if (QTest::qWaitFor([this, count]() { return calls.size() >= count; }))
            QTest::qWait(50);
        return std::exchange(calls, {});
    }

    QVariantList calls;
    qlonglong replyId = 0;
    QString errorMessage; // answers every call with an error when set

public slots:
    // The calls that the module makes.
    qlonglong createThemelet(const QString &url) { return record({ "createThemelet", url }); }
    void remove(int contentType, qlonglong contentId) { record({ "remove", contentType, contentId }); }
    void saveAttributes(int contentType, qlonglong contentId, const QVariantMap &args)
    {
        record({ "saveAttributes", contentType, contentId, plain(args) });
    }
    qlonglong setThemelet(const QString &url) { return record({ "setThemelet", url }); }

private:
    qlonglong record(const QVariantList &call)
    {
        calls.append(QVariant(call));
        if (!errorMessage.isEmpty())
            sendErrorReply(QStringLiteral("com.vorka.themeletd.Error"), errorMessage);
        return replyId;
    }

    QDBusConnection m_bus;
};

#endif
