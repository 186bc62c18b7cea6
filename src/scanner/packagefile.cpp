#include "packagefile.h"

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
