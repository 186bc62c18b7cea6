// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The service's demarshalling of a{sv} maps. The input is a recipe for a
// nested value (maps with string and integer keys, arrays, structures,
// variants, basic values), sent over a peer-to-peer connection to an object of
// this process so that its containers arrive as QDBusArgument, as a client's
// call does. After plainDBusMap no D-Bus container may remain at any depth.
#include "dbusvalue.h"
#include "fuzzsupport.h"

#include <QDBusArgument>
#include <QDBusConnection>
#include <QDBusMessage>
#include <QDBusObjectPath>
#include <QDBusServer>
#include <QDBusVariant>

namespace {

void check(const QVariant &value, int depth)
{
    if (depth > 200)
        Fuzz::fail(QStringLiteral("nesting deeper than the bus allows"));
    if (value.userType() == qMetaTypeId<QDBusArgument>() || value.userType() == qMetaTypeId<QDBusVariant>())
        Fuzz::fail(QStringLiteral("a D-Bus container left after demarshalling"));
    if (value.userType() == QMetaType::QVariantMap || value.userType() == QMetaType::QVariantList) {
        const QVariantList items = value.userType() == QMetaType::QVariantMap ? value.toMap().values() : value.toList();
        for (const QVariant &item : items)
            check(item, depth + 1);
    }
}

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
        QByteArray bytes;
        for (int length = next() % 16; length > 0; --length)
            bytes.append(char(next()));
        return QString::fromUtf8(bytes);
    }
};

QVariant build(Recipe &recipe, int depth)
{
    // Past the bus's nesting limit only basic values are made.
    switch (recipe.next() % (depth > 20 ? 8 : 13)) {
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
        for (int count = recipe.next() % 5; count > 0; --count)
            map.insert(recipe.text(), build(recipe, depth + 1));
        return map;
    }
    case 9: {
        QVariantList list;
        for (int count = recipe.next() % 5; count > 0; --count)
            list.append(build(recipe, depth + 1));
        return list;
    }
    case 10: return QVariant::fromValue(QDBusVariant(build(recipe, depth + 1)));
    case 11: { // a structure of basic values
        QDBusArgument argument;
        argument.beginStructure();
        for (int count = recipe.next() % 4 + 1; count > 0; --count) {
            switch (recipe.next() % 3) {
            case 0: argument << int(recipe.next()); break;
            case 1: argument << recipe.text(); break;
            default: argument << QDBusVariant(QVariant(double(recipe.next()) / 7)); break;
            }
        }
        argument.endStructure();
        return QVariant::fromValue(argument);
    }
    default: { // a map whose keys aren't strings
        QDBusArgument argument;
        argument.beginMap(QVariant::Int, qMetaTypeId<QDBusVariant>());
        for (int count = recipe.next() % 4; count > 0; --count) {
            argument.beginMapEntry();
            argument << int(recipe.next()) << QDBusVariant(build(recipe, depth + 1));
            argument.endMapEntry();
        }
        argument.endMap();
        return QVariant::fromValue(argument);
    }
    }
}

Sink *s_sink = nullptr;
QDBusConnection *s_client = nullptr;

}

extern "C" int LLVMFuzzerInitialize(int *, char ***)
{
    auto *server = new QDBusServer(QStringLiteral("unix:tmpdir=") + Fuzz::start());
    s_sink = new Sink;
    QObject::connect(server, &QDBusServer::newConnection, [](QDBusConnection connection) {
        connection.registerObject(QStringLiteral("/sink"), s_sink, QDBusConnection::ExportScriptableSlots);
    });
    s_client = new QDBusConnection(QDBusConnection::connectToPeer(server->address(), QStringLiteral("fuzz")));
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
    // An error reply is a refusal by Qt's marshaller or the peer, before any of our code.
    if (s_client->call(call, QDBus::BlockWithGui, 10000).type() != QDBusMessage::ErrorMessage && !s_sink->received)
        Fuzz::fail(QStringLiteral("the call never arrived"));
    return 0;
}

#include "fuzz_dbusmap.moc"
