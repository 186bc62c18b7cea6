// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef INDEXREADER_H
#define INDEXREADER_H

#include "content.h"
#include "themeletcontent.h"

#include <QPair>
#include <QString>
#include <QUrl>
#include <QVector>

class QueryAgent;

// Reads the index through this thread's query agents, as any client does.
// A missing index file is reported, never created.
class IndexReader
{
public:
    enum List { Themelets, Photos, Tones };
    typedef QVector<QPair<QString, qint64>> Counts;

    static QString databasePath();

    bool list(List which, QVector<Content> *rows);
    // A themelet, else a photo, else a plain file; null when not indexed or on
    // failure (then errorString() is set).
    Content find(qint64 id);
    Content find(const QUrl &url);
    // Row counts by name, in a fixed order, and the schema version.
    bool statistics(Counts *counts, int *schemaVersion);

    QString errorString() const { return m_error; }

private:
    QueryAgent *agent(ThemeletContent::Type type);
    // Through the themelet agent, else the file agent.
    template <typename Lookup>
    Content find(Lookup lookup);
    // A file that is an indexed image comes back as its photo record.
    Content asPhoto(const Content &file);
    bool count(const QString &statement, qint64 *value);

    QString m_error;
};

#endif
