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
    Q_PROPERTY(QString key READ key CONSTANT)
    Q_PROPERTY(QVariant value READ value WRITE set NOTIFY valueChanged)
public:
    explicit MGConfItem(const QString &key, QObject *parent = nullptr);
    ~MGConfItem() override;

    QString key() const;
    // Invalid when the key is unset.
    QVariant value() const;
    QVariant value(const QVariant &def) const;

    // An invalid value unsets the key. The store has the value on return;
    // valueChanged() follows later.
    void set(const QVariant &val);
    void unset();

signals:
    void valueChanged();

private:
    QString m_key;
};

#endif
