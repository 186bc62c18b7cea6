// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PHOTOQUERYAGENT_H
#define PHOTOQUERYAGENT_H

#include "queryagentspecialization.h"

class PhotoQueryAgent : public QueryAgentSpecialization<PhotoData>
{
public:
    explicit PhotoQueryAgent(QueryAgentDatabase &database);

    Content queryById(qint64 id) override;
    Content queryByUrl(const QUrl &url) override;
    // Reads nothing from parameters: the list is always all images by date taken.
    bool query(QueryAgent::Recipient *recipient, const QueryAgent::Parameters &parameters) override;

    Content querySinglePhoto(QSqlQuery &query);
};

#endif
