// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef QUERYAGENT_H
#define QUERYAGENT_H

#include "content.h"
#include "queryactor.h"

#include <QByteArray>
#include <QHash>
#include <QUrl>
#include <QVector>

// Read-only facade over one content type, one instance per thread and connection.
class QueryAgent : public QueryActor
{
public:
    enum UrlFlag { ReadOnlyUrl = 0x1 };

    static constexpr int BatchSize = 50;

    class Parameters
    {
    public:
        virtual ~Parameters();
    };

    // Receives result batches on the querying thread; the batch is only valid
    // during the call.
    class Recipient
    {
    public:
        virtual void contentQueried(const QVector<Content> &content) = 0;
        virtual ~Recipient();
    };

    explicit QueryAgent(QueryAgentDatabase &database);
    ~QueryAgent() override;

    virtual QHash<int, QByteArray> roleNames() const = 0;
    virtual Content queryById(qint64 id) = 0;
    virtual Content queryByUrl(const QUrl &url) = 0;
    virtual bool query(Recipient *recipient, const Parameters &parameters) = 0;

    static QUrl databaseUrl(int flags);
    static QueryAgent *agentFor(ThemeletContent::Type type);

    // A row's id column as qint64; 0 when it can't be converted.
    static qint64 idFromColumn(const QSqlQuery &query, int column);

protected:
    // Delivers the executed statement's rows in batches of BatchSize; always ends
    // with the batch that follows the last row, so an empty result is one call.
    template <typename Convert, typename BeforeDelivery>
    static void deliver(QSqlQuery &query, Recipient *recipient, Convert convert,
                        BeforeDelivery beforeDelivery)
    {
        QVector<Content> batch;
        batch.reserve(BatchSize);
        bool more = true;
        while (more) {
            more = query.next();
            if (more)
                batch.append(convert(query));
            if (!more || batch.size() == BatchSize) {
                beforeDelivery(batch);
                recipient->contentQueried(batch);
                batch = QVector<Content>();
                batch.reserve(BatchSize);
            }
        }
    }

    template <typename Convert>
    static void deliver(QSqlQuery &query, Recipient *recipient, Convert convert)
    {
        deliver(query, recipient, convert, [](QVector<Content> &) {});
    }

    // For a local URL binds (directory, file name), else the URL text, to the
    // statement chosen by the caller.
    static QSqlQuery prepareUrlQuery(QueryActor &actor, const QUrl &url,
                                     const QString &byPath, const QString &bySource);
};

#endif
