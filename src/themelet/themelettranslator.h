// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETTRANSLATOR_H
#define THEMELETTRANSLATOR_H

#include <QString>
#include <QTranslator>

// Translates the display names of one update batch. The catalogues stay loaded
// while consecutive files name the same one.
class ThemeletTranslator
{
public:
    ThemeletTranslator();
    // `localeSuffix` ends the names of the locale catalogues; ".qm" also finds
    // the plain catalogue in the "C" locale.
    explicit ThemeletTranslator(const QString &localeSuffix);

    // Switches to the catalogue a file names; an empty name switches translation
    // off but keeps the remembered name, so that the same catalogue named again
    // later in the batch stays off.
    void selectCatalog(const QString &catalog);

    // The locale's translation, else the engineering one, else the text itself.
    QString translate(const QString &text) const;
    // Whether the selected catalogue was found, in either form.
    bool isLoaded() const { return m_loaded; }

private:
    QTranslator m_localeTranslator;
    QTranslator m_engineeringTranslator;
    QString m_catalog;
    QString m_localeSuffix;
    bool m_loaded;

    Q_DISABLE_COPY(ThemeletTranslator)
};

#endif
