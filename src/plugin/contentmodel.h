// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CONTENTMODEL_H
#define CONTENTMODEL_H

#include "abstractcontentmodel.h"

// A content list with the roles of one record class.
template <typename T>
class ContentModel : public AbstractContentModel
{
public:
    explicit ContentModel(int contentType, QObject *parent = nullptr);

    QHash<int, QByteArray> roleNames() const override;
};

extern template class ContentModel<ThemeletData>;
extern template class ContentModel<PhotoData>;
extern template class ContentModel<FileData>;

#endif
