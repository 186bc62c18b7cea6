// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "queryagentdatabase.h"

#include "queryagent.h"

#include <QAtomicInt>

namespace {
QAtomicInt s_nextThreadId(0);
}

QueryAgentDatabase::QueryAgentDatabase()
    : QSqlDatabase(QStringLiteral("QSQLITE"))
    , m_queryCache(20)
    , m_threadId(s_nextThreadId.fetchAndAddOrdered(1))
{
}

QueryAgentDatabase::~QueryAgentDatabase()
{
    qDeleteAll(m_agents);
    m_agents.clear();
    m_queryCache.clear();
}
