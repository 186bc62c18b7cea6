// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletsettings.h"

namespace {

QString stringValue(const MGConfItem &item)
{
    QVariant value = item.value();
    if (value.userType() != QMetaType::QString && !value.convert(QMetaType::QString))
        return QString();
    return value.toString();
}

}

ThemeletSettings::ThemeletSettings(QObject *parent)
    : QObject(parent)
    , m_sourceItem(QStringLiteral("/desktop/lunda/background/portrait/picture_filename"), nullptr)
    , m_applicationImageItem(QStringLiteral("/desktop/vorka/background/portrait/app_picture_filename"), nullptr)
    , m_homeImageItem(QStringLiteral("/desktop/vorka/background/portrait/home_picture_filename"), nullptr)
{
    connect(&m_sourceItem, &MGConfItem::valueChanged, this, &ThemeletSettings::sourceChanged);
    connect(&m_applicationImageItem, &MGConfItem::valueChanged,
            this, &ThemeletSettings::applicationImageChanged);
    connect(&m_homeImageItem, &MGConfItem::valueChanged, this, &ThemeletSettings::homeImageChanged);
}

QUrl ThemeletSettings::source() const
{
    return QUrl::fromLocalFile(stringValue(m_sourceItem));
}

void ThemeletSettings::setSource(const QUrl &source)
{
    m_sourceItem.set(source.toLocalFile());
}

QString ThemeletSettings::applicationImagePath() const
{
    return stringValue(m_applicationImageItem);
}

void ThemeletSettings::setApplicationImagePath(const QString &path)
{
    m_applicationImageItem.set(path);
}

QString ThemeletSettings::homeImagePath() const
{
    return stringValue(m_homeImageItem);
}

void ThemeletSettings::setHomeImagePath(const QString &path)
{
    m_homeImageItem.set(path);
}
