// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef DBMANAGER_H
#define DBMANAGER_H

#include "queryagentdatabase.h"

#include <QHash>

class ContentManager;

// The service's one writing connection. It creates, upgrades or, as the last
// resort, rebuilds the index, and it owns the content managers.
class DbManager : public QueryAgentDatabase
{
public:
    static DbManager &instance();

    DbManager();
    ~DbManager() override;

    static bool createDatabaseSchema(const QSqlDatabase &database);
    bool updateSchemaVersion(const QString &version);
    bool updateSchema_v7to8();
    bool updateSchema_v8to10();
    bool updateSchema_v11to12();
    bool dropSchema_v13();
    bool resetThemeletsForReparsing();
    bool resetIndexesForReparsing();

private:
    friend class ContentManager;

    bool updateSchema(const char *function, const char *message, const QString &statement,
                      const QString &version);
    bool resetForReparsing(const char *function, const QString &statement);
    int upgrade(int version);
    void checkLocale();

    QHash<ThemeletContent::Type, ContentManager *> m_contentManagers;
};

#endif
