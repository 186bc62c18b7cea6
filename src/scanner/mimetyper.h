// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef MIMETYPER_H
#define MIMETYPER_H

#include <QElapsedTimer>
#include <QHash>
#include <QMimeDatabase>
#include <QSet>
#include <QString>
#include <QStringList>

// The MIME type QMimeDatabase gives a file (MatchDefault), without its cost
// per name: QMimeDatabase matches a few glob patterns through a regular
// expression made for every name. The answer for a name is decided by its
// part from the first dot on, unless a pattern of another shape matches it
// ("makefile", "*~", "[0-9][0-9][0-9].vdr"...). Such answers are kept per
// that part; names whose type needs their content (.ogg, no extension) and
// names another pattern matches go to QMimeDatabase every time.
class MimeTyper
{
public:
    MimeTyper();

    // isRegularFile: the caller has seen a regular file (after links) at
    // path, so the directory and special-file checks are already answered.
    QString typeOfFile(const QString &path, bool isRegularFile = false);

private:
    bool loadPatterns();
    bool matchesOtherPattern(const QString &fileName) const;
    QString typeByContent(const QString &path, const QString &tail);

    QMimeDatabase m_database;
    // Keyed by the name from its first dot; a null value: the content decides.
    QHash<QString, QString> m_byTail;
    // Keyed by the tail and the type of the content alone.
    QHash<QString, QString> m_byContent;
    QSet<QString> m_otherNames; // patterns without wildcards, in lower case
    QSet<QString> m_otherGlobs;
    QStringList m_globFiles;
    QHash<QString, qint64> m_globTimes;
    QElapsedTimer m_checked;
    bool m_usable = false;
};

#endif
