#include "sysroot.h"

#include <QtGlobal>

namespace Sysroot {

QString prefix()
{
    QString root = qEnvironmentVariable("THEMELET_SYSROOT");
    while (root.endsWith(QLatin1Char('/')))
        root.chop(1);
    return root;
}

QString path(const QString &fixedPath)
{
    return prefix() + fixedPath;
}

}
