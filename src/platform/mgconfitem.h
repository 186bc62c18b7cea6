// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef MGCONFITEM_H
#define MGCONFITEM_H

#include <QObject>
#include <QString>
#include <QVariant>

// One key of the desktop's key-value store (dconf). Every change of the key,
// made by any process including this one, arrives as valueChanged() through
// the event loop of the thread that made the first item of the process.
// Values keep their type: strings, integers, booleans, doubles and string
// lists come back as they were set.
class MGConfItem : public QObject
{
    Q_OBJECT
public:
    explicit MGConfItem(const QString &key, QObject *parent = nullptr);
    ~MGConfItem() override;

    QString key() const;
    // Invalid when the key is unset.
    QVariant value() const;

    // An invalid value unsets the key. The store has the value on return;
    // valueChanged() follows later.
    void set(const QVariant &val);

signals:
    void valueChanged();

private:
    QString m_key;
};

#endif
