// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "waltrimmer.h"

#include <QDebug>
#include <QFileInfo>
#include <QSqlError>
#include <QSqlQuery>
#include <QTimerEvent>
#include <QUrl>

WalTrimmer::WalTrimmer(const QSqlDatabase &database, qint64 limit, int interval, QObject *parent)
    : QObject(parent)
    , m_database(database)
    , m_walPath(QUrl(database.databaseName()).toLocalFile() + QLatin1String("-wal"))
    , m_limit(limit)
{
    m_timer.start(interval, this);
}

WalTrimmer::~WalTrimmer() = default;

bool WalTrimmer::trim()
{
    if (QFileInfo(m_walPath).size() <= m_limit)
        return true;
    QSqlQuery query(m_database);
    const int timeout = query.exec(QStringLiteral("PRAGMA busy_timeout;")) && query.next() ? query.value(0).toInt() : 5000;
    query.exec(QStringLiteral("PRAGMA busy_timeout = 0;"));
    // The row is (busy, frames in the log, frames checkpointed).
    const bool done = query.exec(QStringLiteral("PRAGMA wal_checkpoint(TRUNCATE);")) && query.next()
            && query.value(0).toInt() == 0;
    if (!query.isActive() && !m_warned) {
        m_warned = true;
        qWarning() << "themeletd: the write-ahead log could not be checkpointed:" << query.lastError();
    }
    query.exec(QStringLiteral("PRAGMA busy_timeout = %1;").arg(timeout));
    return done;
}

void WalTrimmer::timerEvent(QTimerEvent *event)
{
    if (event->timerId() == m_timer.timerId() && m_database.isOpen())
        trim();
}
