#include "filemanagerfixture.h"

#include "dbmanager.h"
#include "filemanager.h"

#include <QCoreApplication>
#include <QDir>
#include <QElapsedTimer>
#include <QFile>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QUuid>

#include <sys/ioctl.h>

namespace FileManagerFixture {

QString makeTree()
{
    const QString path = qEnvironmentVariable("THEMELET_SANDBOX") + QStringLiteral("/tree-")
            + QUuid::createUuid().toString(QUuid::Id128);
    QDir().mkpath(path);
    return path;
}

void writeFile(const QString &path, const QByteArray &content)
{
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly | QIODevice::Append) || file.write(content) != content.size())
        qFatal("cannot write %s", qPrintable(path));
}

static QSqlQuery exec(const QString &statement, const QVariantList &values)
{
    QSqlQuery query(DbManager::instance());
    query.prepare(statement);
    for (const QVariant &value : values)
        query.addBindValue(value);
    if (!query.exec())
        qFatal("%s: %s", qPrintable(statement), qPrintable(query.lastError().text()));
    return query;
}

void resetIndex()
{
    exec(QStringLiteral("DELETE FROM file;"), {});
    exec(QStringLiteral("DELETE FROM directory;"), {});
}

qint64 addDirectoryRow(const QString &path, int scope, qint64 parentId)
{
    return exec(QStringLiteral("INSERT INTO directory (parentId, path, scope) VALUES (?, ?, ?);"),
                { parentId ? QVariant(parentId) : QVariant(QVariant::LongLong), path, scope })
            .lastInsertId()
            .toLongLong();
}

qint64 addFileRow(qint64 directoryId, const QString &name, const QDateTime &time)
{
    return exec(QStringLiteral("INSERT INTO file (directoryId, fileName, modificationTime, permissions, metadataCurrent) VALUES (?, ?, ?, 3, 1);"),
                { directoryId, name, time })
            .lastInsertId()
            .toLongLong();
}

QStringList rows(const QString &statement, const QVariantList &values)
{
    QSqlQuery query = exec(statement, values);
    QStringList result;
    while (query.next()) {
        QStringList columns;
        for (int i = 0; i < query.record().count(); ++i)
            columns << (query.isNull(i) ? QStringLiteral("NULL") : query.value(i).toString());
        result << columns.join(QLatin1Char('|'));
    }
    return result;
}

qint64 directoryId(const QString &path)
{
    return rows(QStringLiteral("SELECT id FROM directory WHERE path = ?;"), { path }).value(0).toLongLong();
}

QStringList fileRows(const QString &directory)
{
    return rows(QStringLiteral("SELECT file.fileName, file.metadataCurrent FROM file INNER JOIN directory ON directory.id = file.directoryId WHERE directory.path = ? ORDER BY file.fileName;"),
                { directory });
}

int pendingBytes(const FileManager &manager)
{
    int size = 0;
    ioctl(int(manager.socket()), FIONREAD, &size);
    return size;
}

bool settle(FileManager &manager)
{
    QElapsedTimer timer;
    timer.start();
    while (pendingBytes(manager) > 0 || manager.isUpdateQueued()) {
        if (timer.hasExpired(5000))
            return false;
        QCoreApplication::processEvents();
    }
    return true;
}

}
