// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETMODEL_H
#define THEMELETMODEL_H

#include "contentmodel.h"

// The themelets of the index, favourites first, optionally only the
// favourites or only the others.
class ThemeletModel : public ContentModel<ThemeletData>
{
    Q_OBJECT
    Q_PROPERTY(Filter filter READ filter WRITE setFilter NOTIFY filterChanged)
public:
    enum Filter { NoFilter, FavoritesOnly, NonFavoritesOnly };
    Q_ENUM(Filter)

    explicit ThemeletModel(QObject *parent = nullptr);

    Filter filter() const;
    // Filters in the query: the rows change once it has run.
    void setFilter(Filter filter);

    void componentComplete() override;

    // Asks the service to make the themelet of this row the active one.
    Q_INVOKABLE void makeCurrent(int index);

signals:
    void filterChanged();

private slots:
    void contentChanged(int type);

private:
    QueryAgent::Parameters *parameters() const;

    Filter m_filter = NoFilter;
};

#endif
