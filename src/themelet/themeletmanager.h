// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef THEMELETMANAGER_H
#define THEMELETMANAGER_H

#include "content.h"
#include "contentmanager.h"
#include "queryactor.h"
#include "themeletqueryagent.h"
#include "themeletsettings.h"

#include <QObject>
#include <QSqlQuery>
#include <QStringList>
#include <QUrl>
#include <QVariantMap>


Q_DECLARE_METATYPE(Themelet)

// The content manager of .themelet files: reads them into the index, stores
// themelets made at run time, saves edits, and follows the active themelet.
class ThemeletManager : public QObject, public ContentManager, public QueryActor
{
    Q_OBJECT
public:
    ThemeletManager(QueryAgentDatabase &database, QObject *parent);
    ~ThemeletManager() override;

    bool save(qint64 id, const QVariantMap &values) override;
    bool remove(qint64 id) override;
    QString mimeType() const override;
    bool updateMetaData() override;

    qint64 create(const Themelet &themelet);

    Themelet themeletFromZefId(const QString &zefId);
    Themelet themeletFromUrl(const QUrl &url);

    static QString wallpapersPath();
    QString themeletInstallDirName(const QString &path);

    // Re-reads the themelet that the settings name as active; emits nothing.
    void updateActiveThemelet();

signals:
    void activeThemeletUpdated(const Themelet &themelet);

private:
    bool prepareStatements();
    Themelet parseThemelet(QSqlQuery *query);

    ThemeletQueryAgent m_agent;
    QSqlQuery m_queryThemelet;
    QSqlQuery m_queryThemeletByZefId;
    QSqlQuery m_insertThemelet;
    QSqlQuery m_updateFile;
    QSqlQuery m_updateThemelet;
    QSqlQuery m_deleteThemelet;
    QSqlQuery m_queryResource;
    QSqlQuery m_insertResource;
    QSqlQuery m_deleteResource;
    QSqlQuery m_clearResources;
    QSqlQuery m_modifiedQuery;
    QSqlQuery m_modifiedThemeletQuery;
    QSqlQuery m_modifiedResourceQuery;
    QSqlQuery m_modifiedReset;
    QStringList m_toneKeys;
    QStringList m_fallbackTones;
    ThemeletSettings m_settings;
    Themelet m_activeThemelet;
};

#endif
