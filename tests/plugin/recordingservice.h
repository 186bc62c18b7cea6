#ifndef RECORDINGSERVICE_H
#define RECORDINGSERVICE_H

#include <QDBusArgument>
#include <QDBusConnection>
#include <QDBusContext>
#include <QDBusMessage>
#include <QDBusMetaType>
#include <QObject>
#include <QStringList>
#include <QVariantMap>

// A stand-in for themeletd on the test's private session bus, on a connection
// of its own so that calls really cross the bus. Writes down every call.
class RecordingService : public QObject, protected QDBusContext
{
    Q_OBJECT
    Q_CLASSINFO("D-Bus Interface", "com.vorka.themeletd")
public:
    struct Call
    {
        QString method;
        QVariantList arguments;
    };

    RecordingService()
        : m_connection(QDBusConnection::connectToBus(QDBusConnection::SessionBus, QStringLiteral("recording-service")))
    {
    }
    ~RecordingService() override
    {
        m_connection.unregisterService(QStringLiteral("com.vorka.themeletd"));
        m_connection.unregisterObject(QStringLiteral("/com/vorka/themeletd"));
        QDBusConnection::disconnectFromBus(QStringLiteral("recording-service"));
    }

    bool start()
    {
        return m_connection.registerObject(QStringLiteral("/com/vorka/themeletd"), this, QDBusConnection::ExportAllSlots)
                && m_connection.registerService(QStringLiteral("com.vorka.themeletd"));
    }

    bool emitContentChanged(int type)
    {
        QDBusMessage signal = QDBusMessage::createSignal(QStringLiteral("/com/vorka/themeletd"), QStringLiteral("com.vorka.themeletd"),
                                                         QStringLiteral("contentChanged"));
        signal << type;
        return m_connection.send(signal);
    }

    // Nested containers arrive as QDBusArgument.
    static QVariant plain(const QVariant &value)
    {
        if (value.userType() != qMetaTypeId<QDBusArgument>())
            return value;
        QVariantMap map = qdbus_cast<QVariantMap>(value.value<QDBusArgument>());
        for (QVariant &entry : map)
            entry = plain(entry);
        return map;
    }

    QList<Call> calls;
    qlonglong replyId = 0;
    QString errorMessage; // answers createThemelet and setThemelet with an error when set

public slots:
    qlonglong createThemelet(const QString &url) { return record("createThemelet", { url }); }
    void indexFile(const QString &url) { record("indexFile", { url }); }
    void installPackage(const QString &path) { record("installPackage", { path }); }
    void refreshThemelets() { record("refreshThemelets", {}); }
    void remove(int contentType, qlonglong contentId) { record("remove", { contentType, contentId }); }
    void saveAttributes(int contentType, qlonglong contentId, const QVariantMap &args)
    {
        record("saveAttributes", { contentType, contentId, plainMap(args) });
    }
    qlonglong setThemelet(const QString &url) { return record("setThemelet", { url }); }
    bool setFavorite(const QString &url, bool value) { return record("setFavorite", { url, value }) != 0; }

private:
    static QVariantMap plainMap(QVariantMap map)
    {
        for (QVariant &entry : map)
            entry = plain(entry);
        return map;
    }

    qlonglong record(const QString &method, const QVariantList &arguments)
    {
        calls.append({ method, arguments });
        if (!errorMessage.isEmpty() && (method == QLatin1String("createThemelet") || method == QLatin1String("setThemelet")))
            sendErrorReply(QStringLiteral("com.vorka.themeletd.Error"), errorMessage);
        return replyId;
    }

    QDBusConnection m_connection;
};

#endif
