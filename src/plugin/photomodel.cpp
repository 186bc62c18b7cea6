// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "photomodel.h"

#include "themeletinterface.h"

PhotoModel::PhotoModel(QObject *parent)
    : ContentModel<PhotoData>(ThemeletContent::Photo, parent)
{
    if (ThemeletInterface *interface = ThemeletInterface::instance())
        connect(interface, &ThemeletInterface::contentChanged, this, &PhotoModel::contentChanged);
}

QString PhotoModel::nameFilter() const
{
    return m_nameFilter;
}

void PhotoModel::setNameFilter(const QString &filter)
{
    if (filter == m_nameFilter)
        return;
    const bool wasEmpty = m_nameFilter.isEmpty();
    m_nameFilter = filter;
    if (wasEmpty)
        setFiltered(true);
    else if (filter.isEmpty())
        setFiltered(false);
    else
        refilter();
}

void PhotoModel::componentComplete()
{
    query(new QueryAgent::Parameters);
    AbstractContentModel::componentComplete();
}

bool PhotoModel::acceptContent(const Content &content) const
{
    // Only photos are held here, and only while a filter is set.
    return static_cast<const FileData *>(content.data())->fileName.startsWith(m_nameFilter);
}

void PhotoModel::contentChanged(int type)
{
    if (type == ThemeletContent::Photo)
        query(new QueryAgent::Parameters);
}
