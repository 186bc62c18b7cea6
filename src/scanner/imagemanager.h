// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef IMAGEMANAGER_H
#define IMAGEMANAGER_H

#include "contentmanager.h"
#include "queryactor.h"

#include <QSqlQuery>

// Fills table image for stale picture rows, at most 100 of them a step.
class ImageManager : public ContentManager, public QueryActor
{
public:
    explicit ImageManager(QueryAgentDatabase &database);
    ~ImageManager() override;

    QString mimeType() const override;
    bool updateMetaData() override;

private:
    QSqlQuery m_imageUpdate;
    QSqlQuery m_modifiedQuery;
    QSqlQuery m_modifiedReset;
};

#endif
