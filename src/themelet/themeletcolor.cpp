// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "themeletcolor.h"

QColor colorFromString(const QString &text)
{
    QColor color;
    color.setNamedColor(text);
    return color;
}

QString colorToString(const QColor &color)
{
    return color.name(QColor::HexArgb);
}
