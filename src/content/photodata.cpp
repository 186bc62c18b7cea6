// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "photodata.h"

#include "themeletcontent.h"

PhotoData::PhotoData(qint64 id, const QUrl &url)
    : FileData(id, url, ThemeletContent::Photo)
{
}

ContentData *PhotoData::clone() const
{
    return new PhotoData(*this);
}

QVariant PhotoData::data(int role) const
{
    switch (role) {
    case DateTakenRole: return dateTaken();
    case WidthRole: return width;
    case HeightRole: return height;
    case OrientationRole: return orientation;
    default: return FileData::data(role);
    }
}

QHash<int, QByteArray> PhotoData::roleNames()
{
    QHash<int, QByteArray> names = FileData::roleNames();
    names.insert(DateTakenRole, "dateTaken");
    names.insert(WidthRole, "width");
    names.insert(HeightRole, "height");
    names.insert(OrientationRole, "orientation");
    return names;
}
