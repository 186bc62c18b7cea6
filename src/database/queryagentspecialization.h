// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef QUERYAGENTSPECIALIZATION_H
#define QUERYAGENTSPECIALIZATION_H

#include "queryagent.h"

// Gives an agent the role table of the record type it produces.
template <typename T>
class QueryAgentSpecialization : public QueryAgent
{
public:
    explicit QueryAgentSpecialization(QueryAgentDatabase &database) : QueryAgent(database) {}

    QHash<int, QByteArray> roleNames() const override { return T::roleNames(); }
};

#endif
