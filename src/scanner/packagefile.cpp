// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "packagefile.h"

#include <QDebug>
#include <QFile>
#include <QFileInfo>

bool PackageFile::isPlainName(const QString &name)
{
    return !name.isEmpty() && !name.contains(QLatin1Char('/')) && name != QLatin1String(".")
            && name != QLatin1String("..");
}

QString PackageFile::regularFile(const QString &directory, const QString &name)
{
    if (!isPlainName(name))
        return QString();
    const QString path = directory + QLatin1Char('/') + name;
    return QFileInfo(path).isFile() ? path : QString();
}

QString PackageFile::fileInside(const QString &package, const QString &subdirectory, const QString &name)
{
    const QString path = regularFile(package + QLatin1Char('/') + subdirectory, name);
    const QString root = QFileInfo(package).canonicalFilePath();
    if (path.isEmpty() || root.isEmpty())
        return QString();
    return QFileInfo(path).canonicalFilePath().startsWith(root + QLatin1Char('/')) ? path : QString();
}

bool PackageFile::read(const QString &path, QByteArray *content)
{
    QFile file(path);
    if (!QFileInfo(path).isFile() || !file.open(QIODevice::ReadOnly))
        return false;
    // Read in pieces up to one byte past the limit, since the file may grow after its size
    // was asked; one read of the limit would allocate it whole for every small file.
    const bool tooLarge = file.size() > MaximumSize;
    content->clear();
    while (!tooLarge && content->size() <= MaximumSize) {
        const QByteArray piece = file.read(qMin<qint64>(64 * 1024, MaximumSize + 1 - content->size()));
        if (piece.isEmpty())
            break;
        content->append(piece);
    }
    if (tooLarge || content->size() > MaximumSize) {
        qWarning() << "Skipping a file of more than" << MaximumSize << "bytes" << path;
        content->clear();
        return false;
    }
    return true;
}

QString PackageFile::text(const QJsonValue &value)
{
    QString text = value.toString();
    for (int i = 0; i < text.size(); ++i) {
        const QChar c = text.at(i);
        if (c.isHighSurrogate() && i + 1 < text.size() && text.at(i + 1).isLowSurrogate())
            ++i;
        else if (c.isSurrogate())
            text[i] = QChar::ReplacementCharacter;
    }
    return text;
}
