// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef WALTRIMMER_H
#define WALTRIMMER_H

#include <QBasicTimer>
#include <QObject>
#include <QSqlDatabase>

// Truncates the write-ahead log of the index once the readers let it. While
// clients keep reading, each automatic checkpoint stops at the oldest reader's
// snapshot and the log never starts over, so it grows with every write. When
// the writes pause, the readers reach the newest snapshot within one query and
// the log can go. A try never waits for a reader: if one still reads from the
// log, the next tick tries again.
class WalTrimmer : public QObject
{
public:
    // Tries every `interval` ms while the log is bigger than `limit` bytes.
    WalTrimmer(const QSqlDatabase &database, qint64 limit, int interval, QObject *parent = nullptr);
    ~WalTrimmer() override;

    // One try; true if the log is now within the limit.
    bool trim();

protected:
    void timerEvent(QTimerEvent *event) override;

private:
    QSqlDatabase m_database;
    QString m_walPath;
    QBasicTimer m_timer;
    qint64 m_limit;
    bool m_warned = false;
};

#endif
