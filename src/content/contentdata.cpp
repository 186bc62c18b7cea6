#include "contentdata.h"

ContentData::ContentData(qint64 id, const QUrl &url, int type)
    : id(id)
    , url(url)
    , type(type)
{
}

ContentData::~ContentData() = default;

bool ContentData::setData(int, const QVariant &)
{
    return false;
}
