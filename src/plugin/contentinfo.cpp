// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "contentinfo.h"

#include "queryagent.h"
#include "themeletinterface.h"

#include <QMetaProperty>

ContentInfo::ContentInfo(QObject *parent)
    : QObject(parent)
{
    if (ThemeletInterface *interface = ThemeletInterface::instance())
        connect(interface, &ThemeletInterface::contentChanged, this, &ContentInfo::contentChanged);
}

qlonglong ContentInfo::contentId() const
{
    return m_contentId;
}

void ContentInfo::setContentId(qlonglong id)
{
    if (id == m_contentId)
        return;
    const QUrl oldUrl = m_url;
    m_contentId = id;
    m_url = QUrl();
    m_queried = false;
    emit contentIdChanged();
    // A handler may have loaded already.
    if (m_queried)
        return;
    if (m_contentId != 0)
        refresh(); // tells of the new URL
    else if (oldUrl.isValid() && !m_url.isValid())
        emit urlChanged();
}

QUrl ContentInfo::url() const
{
    return m_url;
}

void ContentInfo::setUrl(const QUrl &url)
{
    if (url == m_url)
        return;
    m_url = url;
    m_queried = false;
    if (m_contentId != 0) {
        m_contentId = 0;
        emit contentIdChanged();
    }
    emit urlChanged();
    if (!m_queried && m_url.isValid())
        refresh();
}

ContentInfo::ContentType ContentInfo::contentType() const
{
    return m_contentType;
}

void ContentInfo::setContentType(ContentType type)
{
    if (type == m_contentType)
        return;
    m_contentType = type;
    m_queried = false;
    emit contentTypeChanged();
    // A URL alone waits for the next change notice of this type.
    if (!m_queried && m_contentId != 0)
        refresh();
}

QQmlListProperty<QObject> ContentInfo::data()
{
    return QQmlListProperty<QObject>(this, &m_data);
}

void ContentInfo::classBegin()
{
}

void ContentInfo::componentComplete()
{
    m_complete = true;
    // Skips this class's own properties: only those declared in QML are bound.
    connectProperties(this, staticMetaObject.propertyCount(), QStringList());
    if (m_queried)
        emit changed();
}

void ContentInfo::save()
{
    if (m_contentId != 0 && !m_changes.isEmpty()) {
        if (ThemeletInterface *interface = ThemeletInterface::instance())
            ThemeletInterface::warnOnError(interface->saveAttributes(m_contentType, m_contentId, m_changes), "saveAttributes",
                                           m_contentType, m_contentId);
    }
    m_changes.clear();
}

void ContentInfo::remove()
{
    if (m_contentId == 0)
        return;
    if (ThemeletInterface *interface = ThemeletInterface::instance())
        ThemeletInterface::warnOnError(interface->remove(m_contentType, m_contentId), "remove", m_contentType, m_contentId);
    // The URL stays, and with m_queried set a later change notice doesn't reload it.
    m_contentId = 0;
    m_changes.clear();
    emit contentIdChanged();
}

void ContentInfo::contentChanged(int type)
{
    if (type != m_contentType)
        return;
    if (m_contentId != 0 && m_queried)
        refresh();
    else if (m_url.isValid() && !m_queried)
        refresh(); // an item to be loaded by URL that was never tried
}

void ContentInfo::refresh()
{
    m_changes.clear();
    QueryAgent *agent = QueryAgent::agentFor(ThemeletContent::Type(m_contentType));
    if (!agent)
        return;

    Content content;
    if (m_contentId == 0) {
        if (!m_url.isValid())
            return;
        m_queried = true;
        content = agent->queryByUrl(m_url);
    } else {
        m_queried = true;
        content = agent->queryById(m_contentId);
    }
    if (!content.isValid()) {
        if (m_contentId != 0) {
            m_contentId = 0;
            emit contentIdChanged();
        }
        return;
    }

    const QMetaObject *meta = metaObject();
    const QHash<int, QByteArray> roles = agent->roleNames();
    for (auto role = roles.cbegin(); role != roles.cend(); ++role) {
        const int index = meta->indexOfProperty(role.value().constData());
        if (index < staticMetaObject.propertyCount())
            continue;
        const QMetaProperty property = meta->property(index);
        const QVariant value = content.data()->data(role.key());
        if (property.isWritable()) {
            writeProperty(this, index, value);
        } else if (QObject *group = qvariant_cast<QObject *>(property.read(this))) {
            writeProperties(group, QObject::staticMetaObject.propertyCount(), value.toMap());
        }
    }
    m_writingObject = nullptr;
    m_writingSignal = -1;

    const ContentData *data = content.data();
    if (data->id != m_contentId) {
        m_contentId = data->id;
        emit contentIdChanged();
    } else if (data->url != m_url) {
        m_url = data->url;
        emit urlChanged();
    }
    if (m_complete)
        emit changed();
}

void ContentInfo::writeProperties(QObject *object, int firstProperty, const QVariantMap &map)
{
    const QMetaObject *meta = object->metaObject();
    for (auto entry = map.cbegin(); entry != map.cend(); ++entry) {
        const int index = meta->indexOfProperty(entry.key().toUtf8().constData());
        if (index < firstProperty)
            continue;
        const QMetaProperty property = meta->property(index);
        if (property.isWritable()) {
            writeProperty(object, index, entry.value());
        } else if (QObject *group = qvariant_cast<QObject *>(property.read(object))) {
            writeProperties(group, QObject::staticMetaObject.propertyCount(), entry.value().toMap());
        }
    }
}

void ContentInfo::writeProperty(QObject *object, int index, const QVariant &value)
{
    const QMetaProperty property = object->metaObject()->property(index);
    m_writingObject = object;
    m_writingSignal = property.notifySignalIndex();
    property.write(object, value);
}

void ContentInfo::connectProperties(QObject *object, int firstProperty, const QStringList &path)
{
    static const int slot = staticMetaObject.indexOfSlot("propertyChanged()");
    m_objects.insert(object, path);
    const QMetaObject *meta = object->metaObject();
    for (int i = firstProperty; i < meta->propertyCount(); ++i) {
        const QMetaProperty property = meta->property(i);
        if (property.isWritable()) {
            if (property.hasNotifySignal())
                QMetaObject::connect(object, property.notifySignalIndex(), this, slot, Qt::UniqueConnection);
        } else if (QObject *group = qvariant_cast<QObject *>(property.read(object))) {
            connectProperties(group, QObject::staticMetaObject.propertyCount(), path + QStringList(QString::fromUtf8(property.name())));
        }
    }
}

void ContentInfo::propertyChanged()
{
    const int signalIndex = senderSignalIndex();
    QObject *object = sender();
    if (signalIndex == m_writingSignal && object == m_writingObject)
        return; // the load's own write
    if (!m_queried)
        return; // never loaded: nothing to save to
    storeChange(object, signalIndex, m_objects.value(object), &m_changes);
}

void ContentInfo::storeChange(QObject *object, int signalIndex, const QStringList &path, QVariantMap *map)
{
    if (!path.isEmpty()) {
        QVariantMap group = map->value(path.first()).toMap();
        storeChange(object, signalIndex, path.mid(1), &group);
        map->insert(path.first(), group);
        return;
    }
    // Properties that share the signal go together.
    const QMetaObject *meta = object->metaObject();
    for (int i = 0; i < meta->propertyCount(); ++i) {
        const QMetaProperty property = meta->property(i);
        if (property.notifySignalIndex() == signalIndex)
            map->insert(QString::fromUtf8(property.name()), ThemeletInterface::dbusValue(property.read(object)));
    }
}
