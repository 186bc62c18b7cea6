// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "content.h"
#include "controltool.h"

#include <QCoreApplication>

// The engine's managers call this after their writes; a client runs none.
void Content::signalChanged(int)
{
}

int main(int argc, char **argv)
{
    QCoreApplication app(argc, argv);
    QCoreApplication::setApplicationName(QStringLiteral("themeletctl"));
    ControlTool tool;
    return tool.run(QCoreApplication::arguments());
}
