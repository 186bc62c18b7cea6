// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// GLib before Qt: GIO has a struct member named "signals".
#include <dconf.h>

#include "dconfstore.h"

#include <QDBusConnection>
#include <QDBusError>
#include <QDBusMessage>
#include <QDebug>
#include <QGlobalStatic>

Q_GLOBAL_STATIC(DConfStore, s_store)

namespace {

// A floating reference, or null for a value the store can't hold. Other
// types go as their text, when they have one.
GVariant *toGVariant(const QVariant &value)
{
    switch (value.userType()) {
    case QMetaType::Bool:
        return g_variant_new_boolean(value.toBool());
    case QMetaType::Int:
        return g_variant_new_int32(value.toInt());
    case QMetaType::UInt:
        return g_variant_new_uint32(value.toUInt());
    case QMetaType::LongLong:
        return g_variant_new_int64(value.toLongLong());
    case QMetaType::ULongLong:
        return g_variant_new_uint64(value.toULongLong());
    case QMetaType::Double:
        return g_variant_new_double(value.toDouble());
    case QMetaType::QStringList: {
        GVariantBuilder builder;
        g_variant_builder_init(&builder, G_VARIANT_TYPE_STRING_ARRAY);
        for (const QString &item : value.toStringList())
            g_variant_builder_add(&builder, "s", item.toUtf8().constData());
        return g_variant_builder_end(&builder);
    }
    default:
        break;
    }
    QVariant text = value;
    if (text.convert(QMetaType::QString))
        return g_variant_new_string(text.toString().toUtf8().constData());
    return nullptr;
}

// Invalid for a type that has no plain QVariant form, such as a tuple.
QVariant fromGVariant(GVariant *value)
{
    switch (g_variant_classify(value)) {
    case G_VARIANT_CLASS_BOOLEAN:
        return bool(g_variant_get_boolean(value));
    case G_VARIANT_CLASS_BYTE:
        return int(g_variant_get_byte(value));
    case G_VARIANT_CLASS_INT16:
        return int(g_variant_get_int16(value));
    case G_VARIANT_CLASS_UINT16:
        return int(g_variant_get_uint16(value));
    case G_VARIANT_CLASS_INT32:
        return int(g_variant_get_int32(value));
    case G_VARIANT_CLASS_UINT32:
        return uint(g_variant_get_uint32(value));
    case G_VARIANT_CLASS_INT64:
        return qlonglong(g_variant_get_int64(value));
    case G_VARIANT_CLASS_UINT64:
        return qulonglong(g_variant_get_uint64(value));
    case G_VARIANT_CLASS_DOUBLE:
        return g_variant_get_double(value);
    case G_VARIANT_CLASS_STRING:
    case G_VARIANT_CLASS_OBJECT_PATH:
    case G_VARIANT_CLASS_SIGNATURE:
        return QString::fromUtf8(g_variant_get_string(value, nullptr));
    case G_VARIANT_CLASS_VARIANT: {
        GVariant *inner = g_variant_get_variant(value);
        const QVariant result = fromGVariant(inner);
        g_variant_unref(inner);
        return result;
    }
    case G_VARIANT_CLASS_ARRAY:
        if (g_variant_is_of_type(value, G_VARIANT_TYPE_STRING_ARRAY)) {
            gsize count = 0;
            const gchar **items = g_variant_get_strv(value, &count);
            QStringList list;
            for (gsize i = 0; i < count; ++i)
                list.append(QString::fromUtf8(items[i]));
            g_free(items);
            return list;
        }
        break;
    default:
        break;
    }
    return QVariant();
}

bool isDirPath(const QString &path)
{
    return path.endsWith(QLatin1Char('/'));
}

bool watchMatches(const QString &watched, const QString &changed)
{
    return watched == changed
            || (isDirPath(watched) && changed.startsWith(watched))
            || (isDirPath(changed) && watched.startsWith(changed));
}

}

DConfStore *DConfStore::instance()
{
    return s_store.isDestroyed() ? nullptr : s_store();
}

DConfStore::DConfStore()
    : m_client(dconf_client_new())
{
}

DConfStore::~DConfStore()
{
    dconf_client_sync(m_client);
    g_object_unref(m_client);
}

bool DConfStore::isKey(const QString &path)
{
    return dconf_is_key(path.toUtf8().constData(), nullptr);
}

QVariant DConfStore::read(const QString &key) const
{
    if (!isKey(key))
        return QVariant();
    GVariant *value = dconf_client_read(m_client, key.toUtf8().constData());
    if (!value)
        return QVariant();
    const QVariant result = fromGVariant(value);
    g_variant_unref(value);
    return result;
}

bool DConfStore::write(const QString &key, const QVariant &value)
{
    if (!isKey(key)) {
        qWarning() << "bool DConfStore::write(const QString&, const QVariant&)"
                   << "Invalid key" << key;
        return false;
    }
    GVariant *data = nullptr;
    if (value.isValid()) {
        data = toGVariant(value);
        if (!data) {
            qWarning() << "bool DConfStore::write(const QString&, const QVariant&)"
                       << "Unsupported value type" << value.typeName() << "for" << key;
            return false;
        }
    }
    GError *error = nullptr;
    // Takes the floating reference of data.
    if (!dconf_client_write_fast(m_client, key.toUtf8().constData(), data, &error)) {
        qWarning() << "bool DConfStore::write(const QString&, const QVariant&)"
                   << "Failed to write" << key << QString::fromUtf8(error->message);
        g_error_free(error);
        return false;
    }
    // A fast write is only queued; the process may exit right after a set.
    dconf_client_sync(m_client);
    return true;
}

QStringList DConfStore::list(const QString &dir) const
{
    QStringList names;
    if (!dconf_is_dir(dir.toUtf8().constData(), nullptr))
        return names;
    gchar **items = dconf_client_list(m_client, dir.toUtf8().constData(), nullptr);
    for (gchar **item = items; item && *item; ++item)
        names.append(QString::fromUtf8(*item));
    g_strfreev(items);
    return names;
}

void DConfStore::watch(const QString &path, QObject *receiver, const Handler &handler)
{
    if (!m_listening)
        listen();
    m_watches[path].append({ receiver, handler });
}

void DConfStore::unwatch(const QString &path, QObject *receiver)
{
    auto it = m_watches.find(path);
    if (it == m_watches.end())
        return;
    for (int i = 0; i < it->size(); ++i) {
        if (it->at(i).receiver == receiver) {
            it->removeAt(i);
            break;
        }
    }
    if (it->isEmpty())
        m_watches.erase(it);
}

// The writer service announces every change, this process's own included, on
// the session bus. Listening there through Qt rather than through dconf's own
// watches keeps GDBus, its thread and its second bus connection out of a
// process that only reads: a start of themeletd is faster and smaller for it.
void DConfStore::listen()
{
    m_listening = true;
    QDBusConnection bus = QDBusConnection::sessionBus();
    if (!bus.connect(QString(), QString(), QStringLiteral("ca.desrt.dconf.Writer"), QStringLiteral("Notify"),
                     this, SLOT(notified(QString,QStringList,QString)))) {
        qWarning() << "void DConfStore::listen()" << "No change notices from the settings store:"
                   << bus.lastError().message();
        return;
    }
    // The bus handles one connection's messages in order: once this answer is
    // in, the match rule is too, and no later change can pass unheard.
    bus.call(QDBusMessage::createMethodCall(QStringLiteral("org.freedesktop.DBus"),
                                            QStringLiteral("/org/freedesktop/DBus"),
                                            QStringLiteral("org.freedesktop.DBus.Peer"), QStringLiteral("Ping")));
}

void DConfStore::notified(const QString &prefix, const QStringList &changes, const QString &)
{
    for (const QString &change : changes)
        dispatch(prefix + change);
}

void DConfStore::dispatch(const QString &changedPath)
{
    for (auto it = m_watches.cbegin(); it != m_watches.cend(); ++it) {
        if (watchMatches(it.key(), changedPath))
            post(it.key(), changedPath);
    }
}

void DConfStore::post(const QString &watchedPath, const QString &changedPath)
{
    // Queued, so that a notice never re-enters the code that made the change;
    // a receiver destroyed meanwhile drops it.
    for (const Watch &watch : m_watches.value(watchedPath)) {
        const Handler handler = watch.handler;
        QMetaObject::invokeMethod(watch.receiver, [handler, changedPath]() { handler(changedPath); },
                                  Qt::QueuedConnection);
    }
}
