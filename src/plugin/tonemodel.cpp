// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "tonemodel.h"

#include "installmanager.h"
#include "themeletinterface.h"

ToneModel::ToneModel(QObject *parent)
    : ContentModel<FileData>(ThemeletContent::File, parent)
    , m_categories(toneCategories())
{
    if (ThemeletInterface *interface = ThemeletInterface::instance())
        connect(interface, &ThemeletInterface::contentChanged, this, &ToneModel::contentChanged);
}

void ToneModel::componentComplete()
{
    query(parameters());
    AbstractContentModel::componentComplete();
}

void ToneModel::contentChanged(int type)
{
    if (type == ThemeletContent::File)
        query(parameters());
}

QStringList ToneModel::toneCategories()
{
    return { QStringLiteral("Ringtone"), QStringLiteral("Customer"), QStringLiteral("Default") };
}

FileQueryAgent::FileParameters ToneModel::toneParameters(const QStringList &categories)
{
    FileQueryAgent::FileParameters parameters;
    parameters.mimeType = QStringLiteral("audio/*");
    // Read anew each time: packages come and go.
    parameters.directories = InstallManager::installPaths();
    parameters.categories = categories;
    return parameters;
}

QueryAgent::Parameters *ToneModel::parameters() const
{
    return new FileQueryAgent::FileParameters(toneParameters(m_categories));
}
