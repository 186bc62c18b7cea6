// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexreader.h"

#include "filequeryagent.h"
#include "themeletqueryagent.h"
#include "tonemodel.h"

#include <QFile>
#include <QSqlQuery>

namespace {

class Collector : public QueryAgent::Recipient
{
public:
    void contentQueried(const QVector<Content> &content) override { rows += content; }

    QVector<Content> rows;
};

}

QString IndexReader::databasePath()
{
    return QueryAgent::databaseUrl(0).toLocalFile();
}

QueryAgent *IndexReader::agent(ThemeletContent::Type type)
{
    // Opening a missing file would create an empty index that themeletd then
    // has to throw away.
    if (!QFile::exists(databasePath())) {
        m_error = QStringLiteral("no index at ") + databasePath()
                + QStringLiteral(" (themeletd has not run yet)");
        return nullptr;
    }
    QueryAgent *agent = QueryAgent::agentFor(type);
    if (agent)
        m_error.clear();
    else
        m_error = QStringLiteral("cannot open the index at ") + databasePath();
    return agent;
}

bool IndexReader::list(List which, QVector<Content> *rows)
{
    static const ThemeletContent::Type s_types[] = { ThemeletContent::Themelet, ThemeletContent::Photo,
                                                     ThemeletContent::File };
    QueryAgent *reader = agent(s_types[which]);
    if (!reader)
        return false;

    Collector collector;
    bool ok = false;
    switch (which) {
    case Themelets: ok = reader->query(&collector, ThemeletQueryAgent::ThemeletParameters()); break;
    case Photos: ok = reader->query(&collector, QueryAgent::Parameters()); break;
    case Tones: ok = reader->query(&collector, ToneModel::toneParameters()); break;
    }
    if (!ok) {
        m_error = QStringLiteral("cannot read the index at ") + databasePath();
        return false;
    }
    *rows = collector.rows;
    return true;
}

Content IndexReader::asPhoto(const Content &file)
{
    const auto *data = static_cast<const FileData *>(file.data());
    if (!data->mimeType.startsWith(QLatin1String("image/")))
        return file;
    // The photo agent's own lookups can't run on this schema; its list can.
    QVector<Content> photos;
    if (list(Photos, &photos)) {
        for (const Content &photo : qAsConst(photos)) {
            if (photo.data()->id == data->id)
                return photo;
        }
    }
    return file;
}

Content IndexReader::find(qint64 id)
{
    return find([id](QueryAgent *agent) { return agent->queryById(id); });
}

Content IndexReader::find(const QUrl &url)
{
    return find([&url](QueryAgent *agent) { return agent->queryByUrl(url); });
}

template <typename Lookup>
Content IndexReader::find(Lookup lookup)
{
    QueryAgent *themelets = agent(ThemeletContent::Themelet);
    if (!themelets)
        return Content();
    const Content themelet = lookup(themelets);
    if (themelet.isValid())
        return themelet;
    QueryAgent *files = agent(ThemeletContent::File);
    const Content file = files ? lookup(files) : Content();
    return file.isValid() ? asPhoto(file) : file;
}

bool IndexReader::count(const QString &statement, qint64 *value)
{
    QueryAgent *reader = agent(ThemeletContent::File);
    if (!reader)
        return false;
    QSqlQuery query = reader->prepareQuery(statement);
    if (!query.exec() || !query.next()) {
        m_error = QStringLiteral("cannot read the index at ") + databasePath();
        return false;
    }
    *value = query.value(0).toLongLong();
    query.finish();
    return true;
}

bool IndexReader::statistics(Counts *counts, int *schemaVersion)
{
    static const QPair<const char *, const char *> s_counts[] = {
        { "directories", "SELECT COUNT(*) FROM directory;" },
        { "files", "SELECT COUNT(*) FROM file;" },
        // Stale rows that a manager will read; other types stay stale for good.
        { "pending", "SELECT COUNT(*) FROM file WHERE metadataCurrent = 0 AND (mimeType GLOB 'image/*' "
                     "OR mimeType IN ('application/x-vorka-themelet', 'application/x-vorka-index'));" },
        { "themelets", "SELECT COUNT(*) FROM themelet;" },
        { "photos", "SELECT COUNT(*) FROM image;" },
    };
    qint64 version = 0;
    if (!count(QStringLiteral("PRAGMA user_version;"), &version))
        return false;
    *schemaVersion = int(version);
    counts->clear();
    for (const auto &entry : s_counts) {
        qint64 value = 0;
        if (!count(QString::fromLatin1(entry.second), &value))
            return false;
        counts->append({ QString::fromLatin1(entry.first), value });
    }
    QVector<Content> tones;
    if (!list(Tones, &tones))
        return false;
    counts->append({ QStringLiteral("tones"), tones.size() });
    return true;
}
