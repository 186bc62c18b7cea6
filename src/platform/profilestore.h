// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PROFILESTORE_H
#define PROFILESTORE_H

#include <QString>
#include <QStringList>
#include <QVariant>

// Where the sound profiles live in dconf, and how a value is looked up:
// the profile's own key, else its group in the defaults file, else the
// group [fallback] there.
namespace ProfileStore {

extern const char *const FallbackProfile;  // "fallback"
extern const char *const DefaultProfile;   // "general", active while none is set

QString trackedDir();        // "/org/orbaline/themelet/"
QString activeProfileKey();  // "/org/orbaline/themelet/profile"
QString profilesDir();       // "/org/orbaline/themelet/profiles/"

// Empty when the profile or key is empty or holds a "/".
QString valueKey(const QString &profile, const QString &key);

// The value as stored (typed), or the text of the defaults; invalid when neither has it.
QVariant value(const QString &profile, const QString &key);
// An invalid value clears the key.
bool setValue(const QString &profile, const QString &key, const QVariant &value);

QString activeProfile();
bool setActiveProfile(const QString &profile);

// Profiles named in the store or the defaults, and the keys a profile has
// in either (its own group and [fallback] included).
QStringList profiles();
QStringList keys(const QString &profile);

// Text and type name of a value as the profile interface hands them out;
// a null text and null type for an invalid value.
QString text(const QVariant &value);
const char *typeName(const QVariant &value);

}

#endif
