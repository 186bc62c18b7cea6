// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CHANGENOTIFIER_H
#define CHANGENOTIFIER_H

#include <QHash>
#include <QObject>

// Coalesces change notices per content type: the first notice of a quiet type
// goes out at once and opens a window; notices inside the window are folded
// into one that goes out when it closes, which opens the next window. So a
// type sees at most one signal per interval, and the last notice of a burst
// is never lost.
class ChangeNotifier : public QObject
{
    Q_OBJECT
public:
    explicit ChangeNotifier(int interval = 100, QObject *parent = nullptr);
    ~ChangeNotifier() override;

    // The notifier that Content::signalChanged reaches; the latest one made.
    static ChangeNotifier *instance();

    void notify(int type);

signals:
    void contentChanged(int type);

protected:
    void timerEvent(QTimerEvent *event) override;

private:
    struct Window
    {
        int type;
        bool pending;
    };

    static ChangeNotifier *s_instance;

    QHash<int, int> m_timerOfType;
    QHash<int, Window> m_windows; // by timer id
    int m_interval;
};

#endif
