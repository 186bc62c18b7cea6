// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETCOLOR_H
#define THEMELETCOLOR_H

#include <QColor>
#include <QString>

// The text form of colours in the index. Colours written by the engine are
// "#AARRGGBB"; colours taken from a .themelet file are stored as the file has them.
QColor colorFromString(const QString &text);
QString colorToString(const QColor &color);

#endif
