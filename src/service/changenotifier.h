// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CHANGENOTIFIER_H
#define CHANGENOTIFIER_H

#include <QElapsedTimer>
#include <QHash>
#include <QObject>

// Coalesces change notices per content type: a notice goes out at once when
// the type's last signal is at least an interval old; otherwise one signal is
// due at the end of that interval, and later notices fold into it. So a type
// sees at most one signal per interval, the last notice of a burst is never
// lost, and a quiet notifier has no timer running.
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
        QElapsedTimer sent; // since the type's last signal
        int timerId = 0; // of the signal that is due, if one is
    };
    void send(int type, Window &window);
    static ChangeNotifier *s_instance;
    QHash<int, Window> m_windows; // by type
    int m_interval;
};

#endif
