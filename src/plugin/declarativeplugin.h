// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef DECLARATIVEPLUGIN_H
#define DECLARATIVEPLUGIN_H

#include <QQmlExtensionPlugin>

// The entry of the QML module. Loading it only registers types: no daemon
// proxy, thread or database exists until the first object needs one.
class DeclarativePlugin : public QQmlExtensionPlugin
{
    Q_OBJECT
    // No Q_PLUGIN_METADATA: moc leaves an empty "MetaData" object out, and
    // plugin tools want one. The record and the entry points are written out
    // in the source instead.
public:
    void registerTypes(const char *uri) override;
    void initializeEngine(QQmlEngine *engine, const char *uri) override;
};

#endif
