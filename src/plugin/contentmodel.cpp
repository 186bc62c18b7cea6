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
