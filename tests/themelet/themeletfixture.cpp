#include "themeletfixture.h"

#include "contentmanager.h"
#include "profiledefaults.h"
#include "sysroot.h"
#include "testdatabase.h"
#include "themeletmanager.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QTest>

namespace ThemeletFixture {

QString fallbackRingerTone()
{
    return Sysroot::path(QStringLiteral("/usr/share/sounds/ringtones/fallback-ringer.ogg"));
}

void prepareSysroot()
{
    const QString translations = Sysroot::path(QStringLiteral("/usr/share/translations/"));
    QDir().mkpath(translations);
    // The locale catalogue is looked up without a suffix, the engineering one with ".qm".
    QFile::copy(QStringLiteral(THEMELET_TEST_CATALOGS "/themelet-sunset-fi.qm"),
                translations + QLatin1String("themelet-sunset-fi"));
    QFile::copy(QStringLiteral(THEMELET_TEST_CATALOGS "/themelet-sunset_eng_en.qm"),
                translations + QLatin1String("themelet-sunset_eng_en.qm"));

    // Only the ringer has a fallback tone that exists.
    writeFile(fallbackRingerTone(), QByteArray("ogg"));
    writeFile(ProfileDefaults::path(),
              QByteArray("[fallback]\nringing.alert.tone=") + fallbackRingerTone().toUtf8()
                      + QByteArray("\nsms.alert.tone=/nowhere/sms.ogg\n"));
}

ThemeletManager *manager()
{
    return static_cast<ThemeletManager *>(ContentManager::managerFromType(1));
}

QString packagePath(const QString &name)
{
    return Sysroot::path(QStringLiteral("/usr/share/themelet/")) + name;
}

QString makePackage(const QString &name, const QStringList &images, const QStringList &sounds)
{
    const QString path = packagePath(name);
    QDir().mkpath(path + QLatin1String("/images"));
    QDir().mkpath(path + QLatin1String("/sounds"));
    for (const QString &image : images)
        writeFile(path + QLatin1String("/images/") + image, QByteArray("jpeg"));
    for (const QString &sound : sounds)
        writeFile(path + QLatin1String("/sounds/") + sound, QByteArray("ogg"));
    return path;
}

void writeFile(const QString &path, const QByteArray &content)
{
    QDir().mkpath(QFileInfo(path).absolutePath());
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly | QIODevice::Truncate) || file.write(content) != content.size())
        QTest::qFail(qPrintable(QLatin1String("cannot write ") + path), __FILE__, __LINE__);
}

QString sqlText(const QString &text)
{
    QString quoted = text;
    quoted.replace(QLatin1Char('\''), QLatin1String("''"));
    return QLatin1Char('\'') + quoted + QLatin1Char('\'');
}

qint64 addDirectory(TestDatabase &db, const QString &path)
{
    const QString select = QStringLiteral("SELECT id FROM directory WHERE path = %1").arg(sqlText(path));
    if (!db.value(select).isValid())
        db.exec(QStringLiteral("INSERT INTO directory (path, scope) VALUES (%1, 2)").arg(sqlText(path)));
    return db.value(select).toLongLong();
}

qint64 addThemeletFile(TestDatabase &db, const QString &directory, const QString &fileName)
{
    const qint64 directoryId = addDirectory(db, directory);
    db.exec(QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, permissions, metadataCurrent) "
                           "VALUES (%1, 'application/x-vorka-themelet', %2, 1, 0)")
                    .arg(directoryId).arg(sqlText(fileName)));
    return db.value(QStringLiteral("SELECT id FROM file WHERE directoryId = %1 AND fileName = %2")
                            .arg(directoryId).arg(sqlText(fileName))).toLongLong();
}

qint64 addThemelet(TestDatabase &db, const QString &package, const QByteArray &json)
{
    const QString fileName = QFileInfo(package).fileName() + QLatin1String(".themelet");
    writeFile(package + QLatin1Char('/') + fileName, json);
    return addThemeletFile(db, package, fileName);
}

void markUnread(TestDatabase &db)
{
    db.exec(QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE mimeType = 'application/x-vorka-themelet'"));
}

void clearIndex(TestDatabase &db)
{
    db.exec(QStringList { QStringLiteral("DELETE FROM resource"), QStringLiteral("DELETE FROM themelet"),
                          QStringLiteral("DELETE FROM zefid"), QStringLiteral("DELETE FROM file"),
                          QStringLiteral("DELETE FROM directory") });
    QDir(Sysroot::path(QStringLiteral("/usr/share/themelet"))).removeRecursively();
}

}
