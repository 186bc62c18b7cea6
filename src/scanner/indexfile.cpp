// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexfile.h"

#include "packagefile.h"

#include <QDebug>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

bool IndexFile::read(const QString &indexPath)
{
    QByteArray content;
    if (!PackageFile::read(indexPath, &content))
        return false;

    QJsonParseError error;
    const QJsonDocument document = QJsonDocument::fromJson(content, &error);
    if (document.isNull() || !document.isObject()) {
        qWarning() << "Error parsing index from file" << indexPath << ", offset:" << error.offset
                   << ", errorString:" << error.errorString();
        parseError = error.error == QJsonParseError::NoError ? QStringLiteral("not a JSON object") : error.errorString();
        parseErrorOffset = error.error == QJsonParseError::NoError ? 0 : error.offset;
        return false;
    }
    const QJsonObject root = document.object();
    keys = root.keys();
    directory = indexPath.left(indexPath.size() - 6);
    translationCatalog = PackageFile::text(root.value(QStringLiteral("translationCatalog")));

    const QJsonArray fileArray = root.value(QStringLiteral("files")).toArray();
    int position = -1;
    for (const QJsonValue &value : fileArray) {
        ++position;
        const QJsonObject object = value.toObject();
        entryKeys.append(object.keys());
        if (object.isEmpty()) {
            skipped.append({ position, QString(), Skipped::NotAnObject });
            continue;
        }
        const QString fileName = PackageFile::text(object.value(QStringLiteral("fileName")));
        const QString path = PackageFile::regularFile(directory, fileName);
        if (path.isEmpty()) {
            skipped.append({ position, fileName,
                             PackageFile::isPlainName(fileName) ? Skipped::NoSuchFile : Skipped::NotAPlainName });
            continue;
        }

        Entry entry;
        entry.fileName = fileName;
        entry.path = path;
        entry.displayName = PackageFile::text(object.value(QStringLiteral("displayName")));
        entry.category = PackageFile::text(object.value(QStringLiteral("category")));
        const QJsonArray aliasArray = object.value(QStringLiteral("aliases")).toArray();
        for (const QJsonValue &alias : aliasArray) {
            const QString oldName = PackageFile::text(alias);
            if (!oldName.isEmpty())
                entry.aliases.append(oldName);
        }
        entries.append(entry);
    }
    return true;
}

QStringList IndexFile::knownKeys()
{
    return { QStringLiteral("translationCatalog"), QStringLiteral("files") };
}

QStringList IndexFile::knownEntryKeys()
{
    return { QStringLiteral("fileName"), QStringLiteral("displayName"), QStringLiteral("category"),
             QStringLiteral("aliases") };
}
