// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themelettranslator.h"

#include "sysroot.h"

#include <QLocale>

// Themelet catalogues of a locale are looked up without a suffix.
ThemeletTranslator::ThemeletTranslator()
    : ThemeletTranslator(QStringLiteral(""))
{
}

ThemeletTranslator::ThemeletTranslator(const QString &localeSuffix)
    : m_localeSuffix(localeSuffix)
    , m_loaded(false)
{
}

void ThemeletTranslator::selectCatalog(const QString &catalog)
{
    if (catalog == m_catalog)
        return;
    m_loaded = false;
    // A stem names a catalogue of the translations directory, never a path.
    if (catalog.isEmpty() || catalog.contains(QLatin1Char('/')))
        return;

    m_catalog = catalog;
    const QString directory = Sysroot::path(QStringLiteral("/usr/share/translations/"));
    const bool engineering = m_engineeringTranslator.load(catalog + QLatin1String("_eng_en"), directory);
    const bool locale = m_localeTranslator.load(QLocale(), catalog, QStringLiteral("-"), directory,
                                                m_localeSuffix);
    m_loaded = engineering || locale;
}

QString ThemeletTranslator::translate(const QString &text) const
{
    if (!m_loaded)
        return text;
    const QByteArray source = text.toUtf8();
    QString translation = m_localeTranslator.translate(nullptr, source.constData(), nullptr, -1);
    if (translation.isEmpty())
        translation = m_engineeringTranslator.translate(nullptr, source.constData(), nullptr, -1);
    return translation.isEmpty() ? text : translation;
}
