// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PHOTOMODEL_H
#define PHOTOMODEL_H

#include "contentmodel.h"

// All photos of the index, newest first, with a file name filter that works
// on the rows already held, without a query.
class PhotoModel : public ContentModel<PhotoData>
{
    Q_OBJECT
    // nameFilterChanged is never emitted: bindings see the value at creation only.
    Q_PROPERTY(QString nameFilter READ nameFilter WRITE setNameFilter NOTIFY nameFilterChanged)
public:
    explicit PhotoModel(QObject *parent = nullptr);

    QString nameFilter() const;
    void setNameFilter(const QString &filter);

    void componentComplete() override;
    bool acceptContent(const Content &content) const override;

signals:
    void nameFilterChanged();

private slots:
    void contentChanged(int type);

private:
    QString m_nameFilter;
};

#endif
