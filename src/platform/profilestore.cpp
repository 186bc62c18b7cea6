// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "profilestore.h"

#include "dconfstore.h"
#include "profiledefaults.h"

#include <QDebug>

namespace ProfileStore {

const char *const FallbackProfile = "fallback";
const char *const DefaultProfile = "general";

namespace {

bool isName(const QString &name)
{
    return !name.isEmpty() && !name.contains(QLatin1Char('/'));
}

// Names directly under a dconf directory, without the "/" of subdirectories.
QStringList storedNames(const QString &dir, bool directories)
{
    QStringList names;
    DConfStore *store = DConfStore::instance();
    if (!store)
        return names;
    for (QString name : store->list(dir)) {
        if (name.endsWith(QLatin1Char('/')) != directories)
            continue;
        if (directories)
            name.chop(1);
        names.append(name);
    }
    return names;
}

QStringList unique(QStringList names)
{
    names.removeDuplicates();
    return names;
}

}

QString trackedDir()
{
    return QStringLiteral("/org/orbaline/themelet/");
}

QString activeProfileKey()
{
    return QStringLiteral("/org/orbaline/themelet/profile");
}

QString profilesDir()
{
    return QStringLiteral("/org/orbaline/themelet/profiles/");
}

QString valueKey(const QString &profile, const QString &key)
{
    if (!isName(profile) || !isName(key))
        return QString();
    return profilesDir() + profile + QLatin1Char('/') + key;
}

QVariant value(const QString &profile, const QString &key)
{
    const QString path = valueKey(profile, key);
    if (path.isEmpty())
        return QVariant();
    DConfStore *store = DConfStore::instance();
    const QVariant stored = store ? store->read(path) : QVariant();
    if (stored.isValid())
        return stored;

    const ProfileDefaults defaults;
    QString text = defaults.value(profile, key);
    if (text.isNull())
        text = defaults.value(QLatin1String(FallbackProfile), key);
    return text.isNull() ? QVariant() : QVariant(text);
}

bool setValue(const QString &profile, const QString &key, const QVariant &value)
{
    const QString path = valueKey(profile, key);
    if (path.isEmpty()) {
        qWarning() << "bool ProfileStore::setValue(const QString&, const QString&, const QVariant&)"
                   << "Invalid profile or key" << profile << key;
        return false;
    }
    DConfStore *store = DConfStore::instance();
    return store && store->write(path, value);
}

QString activeProfile()
{
    DConfStore *store = DConfStore::instance();
    const QString name = store ? store->read(activeProfileKey()).toString() : QString();
    return name.isEmpty() ? QString::fromLatin1(DefaultProfile) : name;
}

bool setActiveProfile(const QString &profile)
{
    if (!isName(profile)) {
        qWarning() << "bool ProfileStore::setActiveProfile(const QString&)"
                   << "Invalid profile" << profile;
        return false;
    }
    DConfStore *store = DConfStore::instance();
    return store && store->write(activeProfileKey(), profile);
}

QStringList profiles()
{
    return unique(storedNames(profilesDir(), true) + ProfileDefaults().groups());
}

QStringList keys(const QString &profile)
{
    if (!isName(profile))
        return QStringList();
    const ProfileDefaults defaults;
    return unique(storedNames(profilesDir() + profile + QLatin1Char('/'), false)
                  + defaults.keys(profile) + defaults.keys(QLatin1String(FallbackProfile)));
}

QString text(const QVariant &value)
{
    switch (value.userType()) {
    case QMetaType::UnknownType:
        return QString();
    case QMetaType::Bool:
        return value.toBool() ? QStringLiteral("true") : QStringLiteral("false");
    case QMetaType::QStringList:
        return value.toStringList().join(QLatin1Char(','));
    default:
        return value.toString();
    }
}

const char *typeName(const QVariant &value)
{
    switch (value.userType()) {
    case QMetaType::UnknownType:
        return nullptr;
    case QMetaType::Bool:
        return "boolean";
    case QMetaType::Int:
    case QMetaType::UInt:
    case QMetaType::LongLong:
    case QMetaType::ULongLong:
        return "integer";
    case QMetaType::Double:
        return "double";
    default:
        return "string";
    }
}

}
