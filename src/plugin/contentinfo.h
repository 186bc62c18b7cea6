// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CONTENTINFO_H
#define CONTENTINFO_H

#include <QHash>
#include <QObject>
#include <QQmlListProperty>
#include <QQmlParserStatus>
#include <QStringList>
#include <QUrl>
#include <QVariantMap>

// One item of the index, addressed by id or URL, bound to the properties that
// QML declares on the object: a property named like a role gets the role's
// value, and a read-only property holding an object stands for a map-valued
// role whose keys are that object's properties. Writes from QML are noted and
// sent by save() in one call.
class ContentInfo : public QObject, public QQmlParserStatus
{
    Q_OBJECT
    Q_INTERFACES(QQmlParserStatus)
    Q_CLASSINFO("DefaultProperty", "data")
    Q_PROPERTY(qlonglong contentId READ contentId WRITE setContentId NOTIFY contentIdChanged)
    Q_PROPERTY(QUrl url READ url WRITE setUrl NOTIFY urlChanged)
    Q_PROPERTY(ContentType contentType READ contentType WRITE setContentType NOTIFY contentTypeChanged)
    Q_PROPERTY(QQmlListProperty<QObject> data READ data)
public:
    enum ContentType { File, Themelet, Photo, Video, Download };
    Q_ENUM(ContentType)

    explicit ContentInfo(QObject *parent = nullptr);

    qlonglong contentId() const;
    void setContentId(qlonglong id);

    QUrl url() const;
    void setUrl(const QUrl &url);

    ContentType contentType() const;
    void setContentType(ContentType type);

    QQmlListProperty<QObject> data();

    void classBegin() override;
    void componentComplete() override;

    Q_INVOKABLE void save();
    Q_INVOKABLE void remove();

signals:
    void contentIdChanged();
    void urlChanged();
    void contentTypeChanged();
    // The properties were loaded anew.
    void changed();

private slots:
    void propertyChanged();
    void contentChanged(int type);

private:
    void refresh();
    void connectProperties(QObject *object, int firstProperty, const QStringList &path);
    void writeProperties(QObject *object, int firstProperty, const QVariantMap &map);
    // Writes one property during a load, so that its own change signal is not taken for the user's.
    void writeProperty(QObject *object, int index, const QVariant &value);
    static void storeChange(QObject *object, int signalIndex, const QStringList &path, QVariantMap *map);

    qlonglong m_contentId = 0;
    QUrl m_url;
    QList<QObject *> m_data;
    QHash<QObject *, QStringList> m_objects;
    QVariantMap m_changes;
    QObject *m_writingObject = nullptr;
    int m_writingSignal = -1;
    ContentType m_contentType = File;
    bool m_queried = false;
    bool m_complete = false;
};

#endif
