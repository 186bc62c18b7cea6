// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETQUERYAGENT_H
#define THEMELETQUERYAGENT_H

#include "queryagentspecialization.h"

class ThemeletQueryAgent : public QueryAgentSpecialization<ThemeletData>
{
public:
    enum Filter { NoFilter = 0, FavoritesOnly = 1, NonFavoritesOnly = 2 };

    class ThemeletParameters : public QueryAgent::Parameters
    {
    public:
        int filter = NoFilter;
    };

    explicit ThemeletQueryAgent(QueryAgentDatabase &database);

    Content queryById(qint64 id) override;
    Content queryByUrl(const QUrl &url) override;
    bool query(QueryAgent::Recipient *recipient, const QueryAgent::Parameters &parameters) override;

    Content querySingleThemelet(QSqlQuery &query);
};

#endif
