#include "tonemodel.h"

#include "filequeryagent.h"
#include "installmanager.h"
#include "themeletinterface.h"

ToneModel::ToneModel(QObject *parent)
    : ContentModel<FileData>(ThemeletContent::File, parent)
    , m_categories({ QStringLiteral("Ringtone"), QStringLiteral("Customer"), QStringLiteral("Default") })
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

QueryAgent::Parameters *ToneModel::parameters() const
{
    auto *parameters = new FileQueryAgent::FileParameters;
    parameters->mimeType = QStringLiteral("audio/*");
    // Read anew each time: packages come and go.
    parameters->directories = InstallManager::installPaths();
    parameters->categories = m_categories;
    return parameters;
}
