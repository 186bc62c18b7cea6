#ifndef THEMELETFIXTURE_H
#define THEMELETFIXTURE_H

#include <QByteArray>
#include <QString>
#include <QStringList>

class TestDatabase;
class ThemeletManager;

// Packages of .themelet files on disk under the sandbox's sysroot, and their rows.
namespace ThemeletFixture {

// The fallback tone of the "fallback" profile for the ringer, as the defaults give it.
QString fallbackRingerTone();

// Catalogues, profile defaults: what must be in place before the manager is made.
void prepareSysroot();
// The process's manager, made on first call (after prepareSysroot).
ThemeletManager *manager();

QString packagePath(const QString &name);
// A package directory with empty picture and sound files under images/ and sounds/.
QString makePackage(const QString &name, const QStringList &images = { QStringLiteral("w.jpg") },
                    const QStringList &sounds = {});
void writeFile(const QString &path, const QByteArray &content);

QString sqlText(const QString &text);
// A directory row (scope 2, as installs make them) unless the path has one; its id.
qint64 addDirectory(TestDatabase &db, const QString &path);
// A .themelet file row waiting to be read, as an install makes it; its id.
qint64 addThemeletFile(TestDatabase &db, const QString &directory, const QString &fileName);
// Writes <package>/<name>.themelet and registers it; the file id.
qint64 addThemelet(TestDatabase &db, const QString &package, const QByteArray &json);
void markUnread(TestDatabase &db);
void clearIndex(TestDatabase &db);

}

#endif
