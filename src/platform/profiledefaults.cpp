// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// GLib before Qt: GIO has a struct member named "signals".
#include <glib.h>

#include "profiledefaults.h"

#include "sysroot.h"

#include <QDebug>
#include <QFile>

ProfileDefaults::ProfileDefaults()
{
    const QString file = path();
    if (!QFile::exists(file))
        return;

    GKeyFile *keyFile = g_key_file_new();
    GError *error = nullptr;
    if (!g_key_file_load_from_file(keyFile, QFile::encodeName(file).constData(), G_KEY_FILE_NONE, &error)) {
        qWarning() << "ProfileDefaults::ProfileDefaults()" << "Failed to read profile defaults"
                   << file << QString::fromUtf8(error->message);
        g_error_free(error);
        g_key_file_free(keyFile);
        return;
    }

    gchar **groups = g_key_file_get_groups(keyFile, nullptr);
    for (gchar **group = groups; *group; ++group) {
        QHash<QString, QString> &values = m_groups[QString::fromUtf8(*group)];
        gchar **keys = g_key_file_get_keys(keyFile, *group, nullptr, nullptr);
        for (gchar **key = keys; key && *key; ++key) {
            // Only fails for text that isn't UTF-8, which then counts as absent.
            gchar *value = g_key_file_get_string(keyFile, *group, *key, nullptr);
            if (value)
                values.insert(QString::fromUtf8(*key), QString::fromUtf8(value));
            g_free(value);
        }
        g_strfreev(keys);
    }
    g_strfreev(groups);
    g_key_file_free(keyFile);
}

QString ProfileDefaults::path()
{
    return Sysroot::path(QStringLiteral(THEMELET_SYSCONFDIR "/themelet/profiles.ini"));
}

QString ProfileDefaults::value(const QString &group, const QString &key) const
{
    return m_groups.value(group).value(key);
}

QStringList ProfileDefaults::keys(const QString &group) const
{
    return m_groups.value(group).keys();
}

QStringList ProfileDefaults::groups() const
{
    return m_groups.keys();
}
