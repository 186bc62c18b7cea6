// The service's demarshalling of a{sv} maps. The input is a recipe for a
// nested value (maps with string and integer keys, arrays, structures,
// variants, basic values); it is sent over a peer-to-peer D-Bus connection to
// an object of this process, so that it arrives with its containers as
// QDBusArgument, as a client's call does. After plainDBusMap no QDBusArgument
// may remain at any depth.
#include "dbusvalue.h"
#include "fuzzsupport.h"

#include <QDBusArgument>
#include <QDBusConnection>
#include <QDBusMessage>
#include <QDBusObjectPath>
#include <QDBusServer>
#include <QDBusSignature>
#include <QDBusVariant>
#include <QElapsedTimer>

namespace {

class Sink : public QObject
{
    Q_OBJECT
public:
    bool received = false;

public slots:
    Q_SCRIPTABLE void take(const QVariantMap &map)
    {
        received = true;
        check(plainDBusMap(map), 0);
    }

private:
    static void check(const QVariant &value, int depth)
    {
        if (depth > 200)
            Fuzz::fail(QStringLiteral("nesting deeper than the bus allows"));
        if (value.userType() == qMetaTypeId<QDBusArgument>() || value.userType() == qMetaTypeId<QDBusVariant>())
            Fuzz::fail(QStringLiteral("a D-Bus container left after demarshalling"));
        if (value.userType() == QMetaType::QVariantMap) {
            const QVariantMap map = value.toMap();
            for (const QVariant &item : map)
                check(item, depth + 1);
        } else if (value.userType() == QMetaType::QVariantList) {
            const QVariantList list = value.toList();
            for (const QVariant &item : list)
                check(item, depth + 1);
        }
    }
};

// Reads the recipe byte by byte; past its end every read gives 0.
struct Recipe
{
    const uint8_t *data;
    size_t size;
    size_t at = 0;
    uint8_t next() { return at < size ? data[at++] : 0; }
    QString text()
    {
        const int length = next() % 16;
        QByteArray bytes;
        for (int i = 0; i < length; ++i)
            bytes.append(char(next()));
        return QString::fromUtf8(bytes);
    }
};

QVariant build(Recipe &recipe, int depth);

// A structure of basic values, written directly.
QVariant structure(Recipe &recipe)
{
    QDBusArgument argument;
    argument.beginStructure();
    const int count = recipe.next() % 4 + 1;
    for (int i = 0; i < count; ++i) {
        switch (recipe.next() % 3) {
        case 0: argument << int(recipe.next()); break;
        case 1: argument << recipe.text(); break;
        default: argument << QDBusVariant(QVariant(double(recipe.next()) / 7)); break;
        }
    }
    argument.endStructure();
    return QVariant::fromValue(argument);
}

// A map of integers to variants: keys that aren't strings.
QVariant integerMap(Recipe &recipe, int depth)
{
    QDBusArgument argument;
    argument.beginMap(QVariant::Int, qMetaTypeId<QDBusVariant>());
    const int count = recipe.next() % 4;
    for (int i = 0; i < count; ++i) {
        argument.beginMapEntry();
        argument << int(recipe.next()) << QDBusVariant(build(recipe, depth + 1));
        argument.endMapEntry();
    }
    argument.endMap();
    return QVariant::fromValue(argument);
}

QVariant build(Recipe &recipe, int depth)
{
    // Past the bus's nesting limit only basic values are made.
    const int kinds = depth > 20 ? 8 : 13;
    switch (recipe.next() % kinds) {
    case 0: return int(recipe.next()) - 128;
    case 1: return recipe.text();
    case 2: return bool(recipe.next() & 1);
    case 3: return double(recipe.next()) / 3;
    case 4: return qlonglong(recipe.next()) << 40;
    case 5: return QVariant::fromValue(uchar(recipe.next()));
    case 6: return QVariant::fromValue(QDBusObjectPath(QStringLiteral("/o/p%1").arg(recipe.next())));
    case 7: return QByteArray(int(recipe.next() % 8), char(recipe.next()));
    case 8: {
        QVariantMap map;
        const int count = recipe.next() % 5;
        for (int i = 0; i < count; ++i)
            map.insert(recipe.text(), build(recipe, depth + 1));
        return map;
    }
    case 9: {
        QVariantList list;
        const int count = recipe.next() % 5;
        for (int i = 0; i < count; ++i)
            list.append(build(recipe, depth + 1));
        return list;
    }
    case 10: return QVariant::fromValue(QDBusVariant(build(recipe, depth + 1)));
    case 11: return structure(recipe);
    default: return integerMap(recipe, depth);
    }
}

QDBusServer *s_server = nullptr;
Sink *s_sink = nullptr;
QDBusConnection *s_client = nullptr;

}

extern "C" int LLVMFuzzerInitialize(int *, char ***)
{
    const QString sandbox = Fuzz::start();
    s_server = new QDBusServer(QStringLiteral("unix:tmpdir=") + sandbox);
    s_sink = new Sink;
    QObject::connect(s_server, &QDBusServer::newConnection, [](const QDBusConnection &connection) {
        QDBusConnection(connection).registerObject(QStringLiteral("/sink"), s_sink, QDBusConnection::ExportScriptableSlots);
    });
    s_client = new QDBusConnection(QDBusConnection::connectToPeer(s_server->address(), QStringLiteral("fuzz")));
    if (!s_client->isConnected())
        Fuzz::fail(QStringLiteral("no peer connection: ") + s_client->lastError().message());
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    Recipe recipe { data, size };
    QVariantMap map;
    while (recipe.at < recipe.size && map.size() < 16)
        map.insert(recipe.text(), build(recipe, 1));

    QDBusMessage call = QDBusMessage::createMethodCall(QString(), QStringLiteral("/sink"), QString(), QStringLiteral("take"));
    call << map;
    s_sink->received = false;
    const QDBusMessage reply = s_client->call(call, QDBus::BlockWithGui, 10000);
    if (reply.type() == QDBusMessage::ErrorMessage)
        return 0; // refused by Qt's marshaller or the peer, before any of our code
    if (!s_sink->received)
        Fuzz::fail(QStringLiteral("the call never arrived"));
    return 0;
}

#include "fuzz_dbusmap.moc"
