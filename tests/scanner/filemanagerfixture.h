#ifndef FILEMANAGERFIXTURE_H
#define FILEMANAGERFIXTURE_H

#include <QDateTime>
#include <QStringList>
#include <QVariant>

class FileManager;

// Shared by the FileManager tests: rows written and read through the
// service's own connection (DbManager::instance()), files in the sandbox,
// and the event loop run until the manager is idle.
namespace FileManagerFixture {

// A fresh, empty directory under $THEMELET_SANDBOX.
QString makeTree();
void writeFile(const QString &path, const QByteArray &content = QByteArray());

void resetIndex();
qint64 addDirectoryRow(const QString &path, int scope, qint64 parentId = 0);
qint64 addFileRow(qint64 directoryId, const QString &name, const QDateTime &time);
// All rows of a statement, columns joined by '|', NULL as "NULL".
QStringList rows(const QString &statement, const QVariantList &values = QVariantList());
qint64 directoryId(const QString &path);
// "name|metadataCurrent" of the files of one directory, by name.
QStringList fileRows(const QString &directory);

// Bytes of inotify events that wait to be read.
int pendingBytes(const FileManager &manager);
// Runs the event loop until no event waits and no update is queued.
bool settle(FileManager &manager);

}

#endif
