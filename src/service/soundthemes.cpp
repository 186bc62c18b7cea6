// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "soundthemes.h"

#include "contentmanager.h"
#include "filemanager.h"
#include "installmanager.h"
#include "mimetyper.h"

#include <QDebug>
#include <QDir>
#include <QDirIterator>
#include <QFileInfo>
#include <QSet>
#include <QSqlError>
#include <QSqlQuery>

namespace {

// Themes nest their sounds a level or two deep ("stereo/", "stereo/x/").
const int MaximumDepth = 3;

MimeTyper &typer()
{
    static MimeTyper s_typer;
    return s_typer;
}

}

int SoundThemes::update(QSqlDatabase &database)
{
    int changed = 0;
    for (const QString &installPath : InstallManager::installPaths()) {
        const QFileInfoList themes = QDir(installPath).entryInfoList(QDir::Dirs | QDir::NoDotAndDotDot);
        for (const QFileInfo &theme : themes) {
            if (theme.isSymLink() || !QFileInfo(theme.filePath() + QLatin1String("/index.theme")).isFile())
                continue;
            QStringList directories { theme.filePath() };
            for (int i = 0; i < directories.size(); ++i) {
                const QString directory = directories.at(i);
                const int depth = directory.mid(theme.filePath().size()).count(QLatin1Char('/'));
                if (depth < MaximumDepth) {
                    for (const QFileInfo &child : QDir(directory).entryInfoList(QDir::Dirs | QDir::NoDotAndDotDot)) {
                        if (!child.isSymLink())
                            directories << child.filePath();
                    }
                }
                if (i > 0) // the theme itself is a package: its own files are the install's
                    changed += updateDirectory(database, directory);
            }
        }
    }
    return changed;
}

int SoundThemes::updateDirectory(QSqlDatabase &database, const QString &directory)
{
    QStringList sounds;
    for (const QFileInfo &file : QDir(directory).entryInfoList(QDir::Files, QDir::Name)) {
        if (!file.isSymLink() && typer().typeOfFile(file.filePath(), true).startsWith(QLatin1String("audio/")))
            sounds << file.fileName();
    }
    FileManager *files = FileManager::instance();
    // Index scope: its files' changes are followed, nobody adds or removes its rows but us.
    const qint64 directoryId = sounds.isEmpty() || !files
            ? 0 : files->appendDirectory(directory, FileManager::IndexScope, FileManager::NoScan);
    if (directoryId == 0)
        return 0;

    QSqlQuery rows(database);
    rows.prepare(QStringLiteral("SELECT id, fileName FROM file WHERE directoryId = ?;"));
    rows.bindValue(0, directoryId);
    if (!rows.exec()) {
        qWarning() << "themeletd: cannot read the sound theme" << directory << rows.lastError();
        return 0;
    }
    QSet<QString> known;
    QVariantList gone;
    while (rows.next()) {
        const QString name = rows.value(1).toString();
        if (sounds.contains(name))
            known.insert(name);
        else
            gone << rows.value(0);
    }
    rows.finish();

    int changed = 0;
    database.transaction();
    QSqlQuery remove(database);
    remove.prepare(QStringLiteral("DELETE FROM file WHERE id = ?;"));
    for (const QVariant &id : qAsConst(gone)) {
        remove.bindValue(0, id);
        changed += remove.exec() ? 1 : 0;
    }
    QSqlQuery insert(database);
    insert.prepare(QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, displayName, modificationTime, "
                                  "permissions, metadataCurrent) VALUES (?, ?, ?, ?, ?, 1, 1);"));
    for (const QString &name : qAsConst(sounds)) {
        if (known.contains(name))
            continue;
        const QString path = directory + QLatin1Char('/') + name;
        insert.bindValue(0, directoryId);
        insert.bindValue(1, typer().typeOfFile(path, true));
        insert.bindValue(2, QueryActor::text(name));
        insert.bindValue(3, QFileInfo(name).completeBaseName());
        insert.bindValue(4, ContentManager::storedModificationTime(path));
        if (insert.exec())
            ++changed;
        else
            qWarning() << "themeletd: cannot list the sound" << path << insert.lastError();
    }
    database.commit();
    return changed;
}
