// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PROFILEDEFAULTS_H
#define PROFILEDEFAULTS_H

#include <QHash>
#include <QString>
#include <QStringList>

// The defaults of the sound profiles, read from the key file
// $THEMELET_SYSROOT<sysconfdir>/themelet/profiles.ini (sysconfdir: /etc for the
// /usr prefix, fixed at build time): one group per profile, named
// after it, with one "key=value" line per value, in the GLib key file format
// (UTF-8, "#" comments, escapes such as "\s" for a leading space). The group
// [fallback] is the profile "fallback", and it also answers for every key
// that another profile's group lacks. A missing file means no defaults.
class ProfileDefaults
{
public:
    // Reads the file now; a file that can't be parsed is reported and counts as empty.
    ProfileDefaults();

    static QString path();

    // Null when the group lacks the key.
    QString value(const QString &group, const QString &key) const;
    QStringList keys(const QString &group) const;
    QStringList groups() const;

private:
    QHash<QString, QHash<QString, QString>> m_groups;
};

#endif
