// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletmodel.h"

#include "themeletinterface.h"
#include "themeletqueryagent.h"

ThemeletModel::ThemeletModel(QObject *parent)
    : ContentModel<ThemeletData>(ThemeletContent::Themelet, parent)
{
    if (ThemeletInterface *interface = ThemeletInterface::instance())
        connect(interface, &ThemeletInterface::contentChanged, this, &ThemeletModel::contentChanged);
}

ThemeletModel::Filter ThemeletModel::filter() const
{
    return m_filter;
}

void ThemeletModel::setFilter(Filter filter)
{
    if (filter == m_filter)
        return;
    m_filter = filter;
    query(parameters());
    emit filterChanged();
}

void ThemeletModel::componentComplete()
{
    query(parameters());
    AbstractContentModel::componentComplete();
}

void ThemeletModel::makeCurrent(int index)
{
    const Content content = contentAt(index);
    if (!content.isValid() || content.type() != ThemeletContent::Themelet)
        return;
    if (ThemeletInterface *interface = ThemeletInterface::instance())
        interface->setThemelet(content.data()->url.toString());
}

void ThemeletModel::contentChanged(int type)
{
    // A themelet is also a file, so plain file changes concern this list too.
    if (unsigned(type) <= unsigned(ThemeletContent::Themelet))
        query(parameters());
}

QueryAgent::Parameters *ThemeletModel::parameters() const
{
    auto *parameters = new ThemeletQueryAgent::ThemeletParameters;
    parameters->filter = m_filter;
    return parameters;
}
