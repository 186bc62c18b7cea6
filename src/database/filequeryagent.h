// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef FILEQUERYAGENT_H
#define FILEQUERYAGENT_H

#include "queryagentspecialization.h"

#include <QStringList>

class FileQueryAgent : public QueryAgentSpecialization<FileData>
{
public:
    class FileParameters : public QueryAgent::Parameters
    {
    public:
        QString mimeType;        // with a '*', a GLOB pattern
        QStringList directories; // subtrees to search; empty for all
        QStringList categories;  // sort order of file.category
    };

    explicit FileQueryAgent(QueryAgentDatabase &database);

    Content queryById(qint64 id) override;
    Content queryByUrl(const QUrl &url) override;
    bool query(QueryAgent::Recipient *recipient, const QueryAgent::Parameters &parameters) override;

    Content querySingleFile(QSqlQuery &query);

    // The list statement and its bound values, as query() runs them.
    static QString listStatement(const FileParameters &parameters, QVariantList *values);
};

#endif
