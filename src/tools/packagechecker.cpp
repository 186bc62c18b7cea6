// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "packagechecker.h"

#include "indexfile.h"
#include "packagefile.h"
#include "sysroot.h"
#include "themeletfile.h"
#include "themelettones.h"
#include "themelettranslator.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>

void PackageChecker::check(const QString &path)
{
    const QFileInfo info(path);
    if (info.isDir())
        checkPackage(QDir::cleanPath(info.absoluteFilePath()));
    else if (!info.exists())
        add(path, QString(), QStringLiteral("no such file or directory"));
    else if (path.endsWith(QLatin1String(".themelet")))
        checkThemelet(info.absoluteFilePath());
    else if (path.endsWith(QLatin1String(".index")))
        checkIndex(info.absoluteFilePath());
    else
        add(path, QString(), QStringLiteral("not a package directory, a .themelet or an .index file"));
}

void PackageChecker::checkPackage(const QString &directory)
{
    // What an install reads: the .themelet and .index files directly in the package.
    const QStringList names = QDir(directory).entryList({ QStringLiteral("*.themelet"), QStringLiteral("*.index") },
                                                        QDir::Files | QDir::Hidden, QDir::Name);
    int found = 0;
    for (const QString &name : names) {
        if (name.endsWith(QLatin1String(".themelet"))) {
            checkThemelet(directory + QLatin1Char('/') + name);
            ++found;
        } else if (name.endsWith(QLatin1String(".index"))) {
            checkIndex(directory + QLatin1Char('/') + name);
            ++found;
        }
    }
    if (found == 0)
        add(directory, QString(), QStringLiteral("nothing installable: no .themelet or .index file in it"));
}

void PackageChecker::checkThemelet(const QString &path)
{
    if (!checkReadable(path))
        return;
    const QFileInfo info(path);
    const QString directory = info.absolutePath();
    ThemeletFile file;
    const ThemeletFile::Status status = file.read(directory, info.fileName(), QString());
    if (status == ThemeletFile::Malformed) {
        checkJson(path, file.parseError, file.parseErrorOffset);
        return;
    }
    checkKeys(path, QString(), file.keys, ThemeletFile::knownKeys());
    if (status == ThemeletFile::Invalid)
        checkName(path, QStringLiteral("wallpaper"), directory, QStringLiteral("images"), file.wallpaper);
    const QStringList tones = ThemeletTones::keys();
    for (int i = 0; i < ThemeletTones::Count; ++i) {
        const ThemeletFile::Tone &tone = file.tones[i];
        if (tone.present && !tone.file.isEmpty() && file.tonePath(i, QString()).isEmpty())
            checkName(path, tones.at(i) + QLatin1String("File.file"), directory, QStringLiteral("sounds"), tone.file);
    }
    // As the themelet reader loads catalogues.
    ThemeletTranslator translator;
    if (!file.translationCatalog.isEmpty()) {
        translator.selectCatalog(file.translationCatalog);
        if (!translator.isLoaded())
            checkCatalogue(path, file.translationCatalog, QStringLiteral("-<locale>"));
    }
}

void PackageChecker::checkIndex(const QString &path)
{
    if (!checkReadable(path))
        return;
    IndexFile index;
    if (!index.read(path)) {
        checkJson(path, index.parseError, index.parseErrorOffset);
        return;
    }
    checkKeys(path, QString(), index.keys, IndexFile::knownKeys());
    if (!QFileInfo(index.directory).isDir())
        add(path, QString(), QStringLiteral("the directory it describes, ") + index.directory + QStringLiteral(", is not there"));
    for (int i = 0; i < index.entryKeys.size(); ++i) {
        checkKeys(path, QStringLiteral("files[%1].").arg(i), index.entryKeys.at(i), IndexFile::knownEntryKeys());
    }
    for (const IndexFile::Skipped &skipped : qAsConst(index.skipped)) {
        const QString field = QStringLiteral("files[%1]").arg(skipped.position);
        if (skipped.reason == IndexFile::Skipped::NotAnObject)
            add(path, field, QStringLiteral("not an object with at least one key; ignored"));
        else if (skipped.reason == IndexFile::Skipped::NotAPlainName)
            add(path, field + QLatin1String(".fileName"),
                QStringLiteral("'%1' is not a plain file name in %2; ignored").arg(skipped.fileName, index.directory));
        else
            add(path, field + QLatin1String(".fileName"),
                QStringLiteral("no file '%1' in %2; ignored").arg(skipped.fileName, index.directory));
    }
    ThemeletTranslator translator { QString() };
    if (!index.translationCatalog.isEmpty()) {
        translator.selectCatalog(index.translationCatalog);
        if (!translator.isLoaded())
            checkCatalogue(path, index.translationCatalog, QStringLiteral("-<locale>.qm"));
    }
}

bool PackageChecker::checkReadable(const QString &path)
{
    const qint64 size = QFileInfo(path).size();
    if (size > PackageFile::MaximumSize) {
        add(path, QString(), QStringLiteral("%1 bytes: larger than the %2 bytes a package file may have; not read")
                                     .arg(size).arg(PackageFile::MaximumSize));
        return false;
    }
    QByteArray content;
    if (!PackageFile::read(path, &content)) {
        add(path, QString(), QStringLiteral("cannot be read"));
        return false;
    }
    return true;
}

void PackageChecker::checkJson(const QString &path, const QString &error, int offset)
{
    QByteArray content;
    PackageFile::read(path, &content);
    const QByteArray before = content.left(qMax(0, offset));
    const int line = before.count('\n') + 1;
    const int column = QString::fromUtf8(before.mid(before.lastIndexOf('\n') + 1)).size() + 1;
    add(path, QString(), QStringLiteral("invalid JSON at line %1, column %2: %3; the file is not read")
                                 .arg(line).arg(column).arg(error));
}

void PackageChecker::checkKeys(const QString &path, const QString &prefix, const QStringList &keys,
                               const QStringList &known)
{
    for (const QString &key : keys) {
        if (!known.contains(key))
            add(path, prefix + key, QStringLiteral("unknown key; ignored"));
    }
}

void PackageChecker::checkCatalogue(const QString &path, const QString &catalogue, const QString &localeSuffix)
{
    const QString directory = Sysroot::path(QStringLiteral("/usr/share/translations/"));
    add(path, QStringLiteral("translationCatalog"),
        QStringLiteral("no catalogue %1_eng_en.qm or %1%2 in %3; names stay untranslated")
                .arg(catalogue, localeSuffix, directory));
}

void PackageChecker::checkName(const QString &path, const QString &field, const QString &root,
                               const QString &subdirectory, const QString &name)
{
    const QString place = root + QLatin1Char('/') + subdirectory;
    QString message;
    if (name.isEmpty())
        message = QStringLiteral("missing: it names a file in ") + place;
    else if (!PackageFile::isPlainName(name))
        message = QStringLiteral("'%1' leaves %2: only a plain file name is allowed").arg(name, place);
    else if (PackageFile::regularFile(place, name).isEmpty())
        message = QStringLiteral("no file '%1' in %2").arg(name, place);
    else
        message = QStringLiteral("'%1' in %2 leads out of the package").arg(name, place);
    add(path, field, message);
}

void PackageChecker::add(const QString &file, const QString &field, const QString &message)
{
    m_problems.append({ file, field, message });
}
