// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "mgconfitem.h"

#include "dconfstore.h"

#include <QDebug>

MGConfItem::MGConfItem(const QString &key, QObject *parent)
    : QObject(parent)
    , m_key(key)
{
    if (!DConfStore::isKey(key)) {
        qWarning() << "MGConfItem::MGConfItem(const QString&, QObject*)" << "Invalid key" << key;
        return;
    }
    if (DConfStore *store = DConfStore::instance())
        store->watch(m_key, this, [this](const QString &) { emit valueChanged(); });
}

MGConfItem::~MGConfItem()
{
    if (DConfStore *store = DConfStore::instance())
        store->unwatch(m_key, this);
}

QString MGConfItem::key() const
{
    return m_key;
}

QVariant MGConfItem::value() const
{
    DConfStore *store = DConfStore::instance();
    return store ? store->read(m_key) : QVariant();
}

void MGConfItem::set(const QVariant &val)
{
    if (DConfStore *store = DConfStore::instance())
        store->write(m_key, val);
}
