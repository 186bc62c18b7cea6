// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef TONEMODEL_H
#define TONEMODEL_H

#include "contentmodel.h"
#include "filequeryagent.h"

#include <QStringList>

// The sounds of the install directories, ringtones first.
class ToneModel : public ContentModel<FileData>
{
    Q_OBJECT
public:
    explicit ToneModel(QObject *parent = nullptr);

    void componentComplete() override;

    // The list's query, shared with readers outside QML (themeletctl).
    static QStringList toneCategories();
    static FileQueryAgent::FileParameters toneParameters(const QStringList &categories = toneCategories());

private slots:
    void contentChanged(int type);

private:
    QueryAgent::Parameters *parameters() const;

    const QStringList m_categories;
};

#endif
