// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "mimetyper.h"

#include <QFile>
#include <QFileInfo>
#include <QIODevice>
#include <QStandardPaths>

#include <sys/stat.h>

namespace {

// Far more than the distinct extensions of any real tree: hostile names can't grow it without end.
const int MaximumCacheSize = 4096;
// As often as QMimeDatabase itself looks for a changed database.
const qint64 RecheckMilliseconds = 5000;

// Tells whether QMimeDatabase looked at the content.
class ContentProbe : public QIODevice
{
public:
    bool read = false;

protected:
    qint64 readData(char *, qint64) override
    {
        read = true;
        return 0;
    }
    qint64 writeData(const char *, qint64) override { return -1; }
};

// "*." followed by no other "*": whether it matches is decided by the name from its first dot.
bool isTailPattern(const QByteArray &pattern)
{
    return pattern.startsWith("*.") && pattern.indexOf('*', 1) < 0;
}

// Shell glob of shared-mime-info patterns: "*", "?", "[...]" with ranges and "!".
bool globMatches(const QChar *pattern, const QChar *patternEnd, const QChar *name, const QChar *nameEnd)
{
    while (pattern != patternEnd) {
        const QChar p = *pattern++;
        if (p == QLatin1Char('*')) {
            for (const QChar *rest = name; rest <= nameEnd; ++rest) {
                if (globMatches(pattern, patternEnd, rest, nameEnd))
                    return true;
            }
            return false;
        }
        if (name == nameEnd)
            return false;
        const QChar c = *name++;
        if (p == QLatin1Char('[')) {
            const bool negated = pattern != patternEnd && *pattern == QLatin1Char('!');
            if (negated)
                ++pattern;
            bool found = false;
            bool first = true;
            while (pattern != patternEnd && (first || *pattern != QLatin1Char(']'))) {
                first = false;
                const QChar low = *pattern++;
                QChar high = low;
                if (pattern + 1 < patternEnd && *pattern == QLatin1Char('-') && pattern[1] != QLatin1Char(']')) {
                    high = pattern[1];
                    pattern += 2;
                }
                found = found || (c >= low && c <= high);
            }
            if (pattern == patternEnd) // no closing bracket: not a class
                return true;
            ++pattern;
            if (found == negated)
                return false;
        } else if (p != QLatin1Char('?') && p != c) {
            return false;
        }
    }
    return name == nameEnd;
}

qint64 modificationTime(const QString &file)
{
    struct stat status;
    if (::stat(QFile::encodeName(file).constData(), &status) != 0)
        return -1;
    return qint64(status.st_mtim.tv_sec) * 1000000000 + status.st_mtim.tv_nsec;
}

}

MimeTyper::MimeTyper() = default;

bool MimeTyper::loadPatterns()
{
    m_byTail.clear();
    m_byContent.clear();
    m_otherNames.clear();
    m_otherGlobs.clear();
    m_globFiles.clear();
    m_globTimes.clear();

    const QStringList directories = QStandardPaths::locateAll(QStandardPaths::GenericDataLocation,
                                                              QStringLiteral("mime"),
                                                              QStandardPaths::LocateDirectory);
    for (const QString &directory : directories) {
        bool found = false;
        for (const char *name : { "/globs2", "/globs" }) {
            const QString path = directory + QLatin1String(name);
            QFile file(path);
            if (!file.open(QIODevice::ReadOnly))
                continue;
            found = true;
            m_globFiles.append(path);
            m_globTimes.insert(path, modificationTime(path));
            while (!file.atEnd()) {
                const QByteArray line = file.readLine().trimmed();
                if (line.isEmpty() || line.startsWith('#'))
                    continue;
                // globs2: weight:type:pattern[:flags]; globs: type:pattern. Every
                // reading of the line counts: an extra pattern only costs caching.
                const QList<QByteArray> fields = line.split(':');
                for (int i = 1; i < fields.size(); ++i) {
                    const QByteArray pattern = fields.at(i).toLower();
                    if (pattern.isEmpty() || isTailPattern(pattern))
                        continue;
                    const QString text = QString::fromUtf8(pattern);
                    if (pattern.contains('*') || pattern.contains('?') || pattern.contains('['))
                        m_otherGlobs.insert(text);
                    else
                        m_otherNames.insert(text);
                }
            }
        }
        // Patterns we can't see (only a binary cache): no answer can be kept.
        if (!found && (QFileInfo::exists(directory + QLatin1String("/mime.cache"))
                       || QFileInfo::exists(directory + QLatin1String("/packages"))))
            return false;
    }
    return !m_globFiles.isEmpty();
}

bool MimeTyper::matchesOtherPattern(const QString &fileName) const
{
    // Lower case on both sides covers the patterns that match case-sensitively too.
    const QString name = fileName.toLower();
    if (name.isEmpty() || m_otherNames.contains(name))
        return true;
    const auto isLiteral = [](QChar c) {
        return c != QLatin1Char('*') && c != QLatin1Char('?') && c != QLatin1Char('[') && c != QLatin1Char(']');
    };
    for (const QString &pattern : m_otherGlobs) {
        // A literal first or last character settles most names at once.
        if ((isLiteral(pattern.front()) && pattern.front() != name.front())
            || (isLiteral(pattern.back()) && pattern.back() != name.back()))
            continue;
        if (globMatches(pattern.constBegin(), pattern.constEnd(), name.constBegin(), name.constEnd()))
            return true;
    }
    return false;
}

QString MimeTyper::typeOfFile(const QString &path, bool isRegularFile)
{
    if (!isRegularFile) {
        struct stat status;
        // Directories, devices, FIFOs and sockets are typed by what they are.
        if (::stat(QFile::encodeName(path).constData(), &status) == 0 && !S_ISREG(status.st_mode))
            return m_database.mimeTypeForFile(path, QMimeDatabase::MatchDefault).name();
    }

    if (!m_checked.isValid()) {
        m_checked.start();
        m_usable = loadPatterns();
    } else if (m_checked.elapsed() > RecheckMilliseconds) {
        m_checked.restart();
        bool changed = false;
        for (const QString &file : qAsConst(m_globFiles))
            changed = changed || modificationTime(file) != m_globTimes.value(file);
        if (changed)
            m_usable = loadPatterns();
    }

    const QString fileName = path.mid(path.lastIndexOf(QLatin1Char('/')) + 1);
    const int dot = fileName.indexOf(QLatin1Char('.'));
    if (!m_usable || dot < 0 || matchesOtherPattern(fileName))
        return m_database.mimeTypeForFile(path, QMimeDatabase::MatchDefault).name();

    const QString tail = fileName.mid(dot);
    const auto known = m_byTail.constFind(tail);
    if (known != m_byTail.constEnd()) {
        if (!known->isNull())
            return *known;
        return typeByContent(path, tail);
    }

    ContentProbe probe;
    probe.open(QIODevice::ReadOnly);
    QString type = m_database.mimeTypeForFileNameAndData(fileName, &probe).name();
    if (m_byTail.size() >= MaximumCacheSize)
        m_byTail.clear();
    if (probe.read || type.isEmpty()) {
        m_byTail.insert(tail, QString());
        return typeByContent(path, tail);
    }
    m_byTail.insert(tail, type);
    return type;
}

QString MimeTyper::typeByContent(const QString &path, const QString &tail)
{
    // With the name's candidates fixed by the tail, the answer follows from the
    // type the content alone gives; only that pair's first answer costs the name matching.
    QFile file(path);
    if (!file.open(QIODevice::ReadOnly))
        return m_database.mimeTypeForFile(path, QMimeDatabase::MatchDefault).name();
    const QString key = tail + QLatin1Char('/') + m_database.mimeTypeForData(&file).name();
    const auto known = m_byContent.constFind(key);
    if (known != m_byContent.constEnd())
        return *known;
    const QString type = m_database.mimeTypeForFileNameAndData(path, &file).name();
    if (m_byContent.size() >= MaximumCacheSize)
        m_byContent.clear();
    m_byContent.insert(key, type);
    return type;
}
