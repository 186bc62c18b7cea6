// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

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
