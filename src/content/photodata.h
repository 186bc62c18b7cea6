// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PHOTODATA_H
#define PHOTODATA_H

#include "filedata.h"

#include <QDateTime>

class PhotoData : public FileData
{
public:
    enum Role {
        DateTakenRole = 8,
        WidthRole,
        HeightRole,
        OrientationRole
    };

    PhotoData(qint64 id, const QUrl &url);

    ContentData *clone() const override;
    QVariant data(int role) const override;

    static QHash<int, QByteArray> roleNames();

    // Read as the index holds it; made a QDateTime (a local-time lookup) only
    // when asked, which a list of thousands mostly never is.
    QDateTime dateTaken() const { return dateTakenValue.toDateTime(); }

    QVariant dateTakenValue;
    int width = 0;
    int height = 0;
    int orientation = 0;
};

#endif
