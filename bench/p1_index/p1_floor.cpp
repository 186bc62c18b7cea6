// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The floor of a first index: walk the tree with readdir and stat, type files
// by their extension, and write every row with one batched insert in one
// transaction, through the same SQLite driver as the engine.
//   bench_p1_floor ROOT DATABASE
#include <QCoreApplication>
#include <QDateTime>
#include <QFile>
#include <QHash>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QVariantList>

#include <cstdio>
#include <cstring>
#include <dirent.h>
#include <sys/stat.h>

int main(int argc, char **argv)
{
    QCoreApplication app(argc, argv);
    if (argc < 3) {
        std::fprintf(stderr, "usage: bench_p1_floor ROOT DATABASE\n");
        return 2;
    }
    const QHash<QByteArray, QString> types = {
        { "jpg", QStringLiteral("image/jpeg") }, { "jpeg", QStringLiteral("image/jpeg") },
        { "png", QStringLiteral("image/png") },  { "mp3", QStringLiteral("audio/mpeg") },
        { "ogg", QStringLiteral("audio/ogg") },  { "wav", QStringLiteral("audio/x-wav") },
        { "txt", QStringLiteral("text/plain") }, { "pdf", QStringLiteral("application/pdf") },
    };
    const QString octet = QStringLiteral("application/octet-stream");

    QVariantList dirIds, dirParents, dirPaths;
    QVariantList fileDirs, fileTypes, fileNames, fileTimes;
    QList<QByteArray> queue { QByteArray(argv[1]) };
    QList<qint64> queueIds { 1 };
    dirIds << 1;
    dirParents << QVariant(QVariant::LongLong);
    dirPaths << QFile::decodeName(argv[1]);
    qint64 nextId = 2;
    while (!queue.isEmpty()) {
        const QByteArray dir = queue.takeFirst();
        const qint64 dirId = queueIds.takeFirst();
        DIR *d = opendir(dir.constData());
        if (!d)
            continue;
        while (dirent *e = readdir(d)) {
            if (e->d_name[0] == '.')
                continue;
            const QByteArray path = dir + '/' + e->d_name;
            struct stat st;
            if (stat(path.constData(), &st) != 0)
                continue;
            if (S_ISDIR(st.st_mode)) {
                if (e->d_type == DT_LNK)
                    continue;
                dirIds << nextId;
                dirParents << dirId;
                dirPaths << QFile::decodeName(path);
                queue << path;
                queueIds << nextId++;
                continue;
            }
            const char *dot = std::strrchr(e->d_name, '.');
            fileDirs << dirId;
            fileTypes << (dot ? types.value(QByteArray(dot + 1).toLower(), octet) : octet);
            fileNames << QFile::decodeName(e->d_name);
            fileTimes << QDateTime::fromMSecsSinceEpoch(qint64(st.st_mtim.tv_sec) * 1000 + st.st_mtim.tv_nsec / 1000000);
        }
        closedir(d);
    }

    QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"));
    db.setDatabaseName(QFile::decodeName(argv[2]));
    if (!db.open())
        return 1;
    QSqlQuery q(db);
    q.exec(QStringLiteral("PRAGMA journal_mode = WAL"));
    q.exec(QStringLiteral("CREATE TABLE directory ( id INTEGER PRIMARY KEY AUTOINCREMENT, parentId INTEGER, path TEXT UNIQUE, scope INTEGER NOT NULL)"));
    q.exec(QStringLiteral("CREATE TABLE file ( id INTEGER PRIMARY KEY AUTOINCREMENT, directoryId INTEGER NOT NULL, mimeType TEXT, fileName TEXT, displayName TEXT, modificationTime DATETIME, permissions INTEGER NOT NULL, metadataCurrent BOOL, category TEXT)"));
    q.exec(QStringLiteral("CREATE UNIQUE INDEX file_directory ON file (directoryId, fileName)"));
    db.transaction();
    bool ok = q.prepare(QStringLiteral("INSERT INTO directory ( id, parentId, path, scope) VALUES (?, ?, ?, 0)"));
    q.addBindValue(dirIds);
    q.addBindValue(dirParents);
    q.addBindValue(dirPaths);
    ok = ok && q.execBatch();
    ok = ok && q.prepare(QStringLiteral("INSERT INTO file ( directoryId, mimeType, fileName, modificationTime, permissions, metadataCurrent) VALUES (?, ?, ?, ?, 3, 0)"));
    q.addBindValue(fileDirs);
    q.addBindValue(fileTypes);
    q.addBindValue(fileNames);
    q.addBindValue(fileTimes);
    ok = ok && q.execBatch();
    if (!ok) {
        std::fprintf(stderr, "floor: %s\n", qPrintable(q.lastError().text()));
        return 1;
    }
    db.commit();
    std::printf("floor files=%d dirs=%d\n", fileNames.size(), dirPaths.size());
    return 0;
}
