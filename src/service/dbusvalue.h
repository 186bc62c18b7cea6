// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef DBUSVALUE_H
#define DBUSVALUE_H

#include <QVariant>
#include <QVariantMap>

// Values that arrive in an a{sv} keep their nested containers as QDBusArgument.
// This turns them into plain QVariantMap, QVariantList and basic values at
// every depth: maps with keys as strings, structures as lists, object paths
// and signatures as strings, file descriptors dropped. Nesting deeper than
// the bus allows gives an invalid value.
QVariantMap plainDBusMap(const QVariantMap &map);

#endif
