// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "contentmodel.h"

template <typename T>
ContentModel<T>::ContentModel(int contentType, QObject *parent)
    : AbstractContentModel(contentType, parent)
{
}

template <typename T>
QHash<int, QByteArray> ContentModel<T>::roleNames() const
{
    return T::roleNames();
}

template class ContentModel<ThemeletData>;
template class ContentModel<PhotoData>;
template class ContentModel<FileData>;
