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
