// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "abstractcontentmodel.h"

#include "themeletinterface.h"

#include <QCoreApplication>
#include <QJSEngine>
#include <QJSValueIterator>
#include <QQmlEngine>
#include <QThreadPool>

#include <algorithm>
#include <cstring>

QMutex AbstractContentModel::s_queryMutex;

namespace {

// Rows are waiting in m_pendingContent.
class ContentEvent : public QEvent
{
public:
    static const QEvent::Type s_type = QEvent::User;
    ContentEvent() : QEvent(s_type) {}
};

// The most rows the GUI thread is handed at once while a query runs: a
// merge of this many is well within a frame.
const int s_gatherLimit = 4096;

// Records freed together once a query has ended, or once this many have gathered.
const int s_releaseBatch = 10000;

class QueryCompleteEvent : public QEvent
{
public:
    static const QEvent::Type s_type = QEvent::Type(QEvent::User + 1);
    explicit QueryCompleteEvent(bool ok) : QEvent(s_type), ok(ok) {}
    const bool ok;
};

}

// Runs one query on a pool thread. The model may die meanwhile: it then clears
// m_model under the mutex and the batches still coming are dropped.
class AbstractContentModel::QueryRunner : public QRunnable, public QueryAgent::Recipient
{
public:
    QueryRunner(int contentType, AbstractContentModel *model, QueryAgent::Parameters *parameters)
        : m_parameters(parameters), m_model(model), m_contentType(contentType)
    {
    }

    void run() override
    {
        QueryAgent *agent = QueryAgent::agentFor(ThemeletContent::Type(m_contentType));
        const bool ok = agent && agent->query(this, *m_parameters);
        delete m_parameters;
        m_parameters = nullptr;

        QMutexLocker locker(&s_queryMutex);
        if (m_model) {
            m_model->m_queryRunner = nullptr;
            QCoreApplication::postEvent(m_model, new QueryCompleteEvent(ok));
            m_model = nullptr;
        }
    }

    ~QueryRunner() override { delete m_parameters; }

    void contentQueried(const QVector<Content> &content) override
    {
        // Under the lock, so that the model can't go between the test and the post.
        // One event stands for every batch that comes before the model takes them,
        // and after the first batch the rows gather to a quarter of those sent so
        // far (at most s_gatherLimit): a wake of the GUI thread costs more than
        // the rows of a batch. The rest goes with the end of the query.
        QMutexLocker locker(&s_queryMutex);
        if (!m_model || content.isEmpty())
            return;
        m_delivered += content.size();
        for (const Content &row : content) {
            m_model->m_pendingContent.append(row);
            m_model->m_pendingKeys.append(SynchronizedContent::key(row)); // while the record is at hand
        }
        const int gather = std::min(std::max<int>(QueryAgent::BatchSize, m_delivered / 4), s_gatherLimit);
        if (!m_model->m_contentPosted && m_model->m_pendingContent.size() >= gather) {
            m_model->m_contentPosted = true;
            QCoreApplication::postEvent(m_model, new ContentEvent);
        }
    }

    QueryAgent::Parameters *m_parameters;
    AbstractContentModel *m_model;
    int m_delivered = 0;
    const int m_contentType;
};

AbstractContentModel::AbstractContentModel(int contentType, QObject *parent)
    : QAbstractListModel(parent)
    , m_currentContent(&m_content)
    , m_contentType(contentType)
{
}

AbstractContentModel::~AbstractContentModel()
{
    QMutexLocker locker(&s_queryMutex);
    if (m_queryRunner)
        m_queryRunner->m_model = nullptr;
    // A request still queued is left as it is.
}

void AbstractContentModel::query(QueryAgent::Parameters *parameters)
{
    if (m_queuedQuery) {
        delete m_queuedQuery;
        m_queuedQuery = parameters;
        return;
    }
    m_queuedQuery = parameters;
    if (m_status == Querying)
        return; // the query in flight starts this one when it ends
    m_status = Querying;
    m_pendingStatus = Querying;
    m_queryRequested = true;
    postUpdate();
}

void AbstractContentModel::classBegin()
{
}

void AbstractContentModel::componentComplete()
{
    m_complete = true;
    if (m_queryRequested) {
        m_queryRequested = false;
        startQuery();
    }
}

bool AbstractContentModel::acceptContent(const Content &) const
{
    return false;
}

void AbstractContentModel::startQuery()
{
    if (!m_queuedQuery) {
        m_pendingStatus = Null;
        return;
    }
    QMutexLocker locker(&s_queryMutex);
    m_queryRunner = new QueryRunner(m_contentType, this, m_queuedQuery);
    m_queuedQuery = nullptr;
    QThreadPool::globalInstance()->start(m_queryRunner, 0);
}

void AbstractContentModel::postUpdate()
{
    if (m_updatePosted)
        return;
    m_updatePosted = true;
    QCoreApplication::postEvent(this, new QEvent(QEvent::UpdateRequest));
}

bool AbstractContentModel::event(QEvent *event)
{
    switch (int(event->type())) {
    case ContentEvent::s_type:
        takePendingContent();
        return true;
    case QueryCompleteEvent::s_type:
        // Posted after the last batch, whose ContentEvent came first; taken here all the same.
        takePendingContent();
        m_pendingStatus = static_cast<QueryCompleteEvent *>(event)->ok ? Finished : Error;
        postUpdate();
        return true;
    case QEvent::UpdateRequest:
        update();
        return true;
    default:
        return QAbstractListModel::event(event);
    }
}

namespace {

// Moves every handle of `from` to the end of `to`, leaving `from` empty with its
// capacity. The handles are relocatable (QVector itself treats them so): copied
// as bytes, then nulled where they were; no record's count is touched.
void appendTaken(QVector<Content> &to, QVector<Content> &from)
{
    static_assert(sizeof(Content) == sizeof(ContentData *), "a handle is its record pointer");
    const int size = to.size();
    const int taken = from.size();
    if (taken == 0)
        return;
    to.resize(size + taken);
    std::memcpy(static_cast<void *>(to.data() + size), from.constData(), size_t(taken) * sizeof(Content));
    std::memset(static_cast<void *>(from.data()), 0, size_t(taken) * sizeof(Content));
    from.clear(); // keeps the capacity
}

}

void AbstractContentModel::takePendingContent()
{
    {
        QMutexLocker locker(&s_queryMutex);
        m_spareContent.swap(m_pendingContent);
        m_spareKeys.swap(m_pendingKeys);
        m_contentPosted = false;
    }
    if (m_spareContent.isEmpty())
        return;
    // A query usually brings about as many rows as are on show: room for them at once.
    if (m_receivedContent.isEmpty()) {
        const int rows = std::max(m_content.size() + QueryAgent::BatchSize, m_spareContent.size());
        m_receivedContent.reserve(rows);
        m_receivedKeys.reserve(rows);
    }
    appendTaken(m_receivedContent, m_spareContent);
    m_receivedKeys += m_spareKeys;
    m_spareKeys.clear(); // keeps the capacity
    m_contentReceived = true;
    postUpdate();
}

void AbstractContentModel::update()
{
    for (;;) {
        // While filtering, the full list changes silently and the filter brings the view along.
        const bool filtered = m_currentContent == &m_filteredContent;
        SynchronizationInterface *agent = filtered ? static_cast<SynchronizationInterface *>(&m_content) : this;

        if (m_contentReceived) {
            m_contentReceived = false;
            // Not emptied: it grows over the query, and m_content's cursors say how far it
            // was merged. Out of its member while merged: a handler that runs the event
            // loop may take more rows in, which then follow.
            QVector<Content> received;
            received.swap(m_receivedContent);
            QVector<SynchronizedContent::Key> keys;
            keys.swap(m_receivedKeys);
            beginEdit();
            m_ownedSource = &received;
            m_content.merge(received, agent, keys);
            m_ownedSource = nullptr;
            appendTaken(received, m_receivedContent);
            m_receivedContent.swap(received);
            keys += m_receivedKeys;
            m_receivedKeys.swap(keys);
            endEdit();
            if (filtered)
                refilter();
            continue;
        }

        if (m_status == m_pendingStatus) {
            if (!m_queryRequested) {
                m_updatePosted = false;
                return;
            }
            m_queryRequested = false;
            startQuery();
            continue;
        }

        QVector<Content> received;
        received.swap(m_receivedContent);
        QVector<SynchronizedContent::Key> keys;
        keys.swap(m_receivedKeys);

        m_status = m_pendingStatus;
        if (m_queuedQuery) {
            m_status = Querying;
            m_pendingStatus = Querying;
            m_queryRequested = true;
        }

        beginEdit();
        if (m_pendingStatus != Null) {
            m_ownedSource = &received;
            m_content.finish(received, agent, &keys);
            m_ownedSource = nullptr;
        } else {
            if (!m_content.isEmpty())
                agent->removeRange(0, m_content.size());
            m_content.resetCursors();
        }
        // What is left of the received rows: nulls, or records a filter keeps out.
        if (m_releasedSource.isEmpty())
            m_releasedSource.swap(received);
        else
            m_releasedSource += received;
        endEdit();
        if (filtered)
            refilter();
        if (m_status != Querying)
            emit statusChanged();
    }
}

QModelIndex AbstractContentModel::index(int row, int column, const QModelIndex &parent) const
{
    if (parent.isValid() || row < 0 || row >= m_currentContent->size() || column != 0)
        return QModelIndex();
    return createIndex(row, column, m_currentContent->at(row).data());
}

int AbstractContentModel::rowCount(const QModelIndex &parent) const
{
    return parent.isValid() ? 0 : m_currentContent->size();
}

QVariant AbstractContentModel::data(const QModelIndex &index, int role) const
{
    const ContentData *data = index.isValid() ? static_cast<const ContentData *>(index.internalPointer()) : nullptr;
    return data ? data->data(role) : QVariant();
}

Content AbstractContentModel::contentAt(int index) const
{
    return index >= 0 && index < m_currentContent->size() ? m_currentContent->at(index) : Content();
}

void AbstractContentModel::setContent(int index, const Content &content)
{
    if (index < 0 || index >= m_currentContent->size())
        return;
    (*m_currentContent)[index] = content;
    const QModelIndex changed = this->index(index);
    emit dataChanged(changed, changed);
}

int AbstractContentModel::roleFromName(const QString &name) const
{
    const QByteArray utf8 = name.toUtf8();
    const QHash<int, QByteArray> roles = roleNames();
    for (auto it = roles.cbegin(); it != roles.cend(); ++it) {
        if (it.value() == utf8)
            return it.key();
    }
    return -1;
}

Content &AbstractContentModel::detachedRow(int index)
{
    m_currentContent->detach();
    Content &row = (*m_currentContent)[index];
    // A record shared with another holder is cloned, so that only this row sees the edit.
    if (row.isValid() && row.data()->ref.loadRelaxed() > 1)
        row = Content(row.data()->clone());
    return row;
}

void AbstractContentModel::saveAttributes(const Content &row, const QVariantMap &attributes)
{
    // The row keeps its value until the next query replaces it; a refusal is only logged.
    if (ThemeletInterface *interface = ThemeletInterface::instance())
        ThemeletInterface::warnOnError(interface->saveAttributes(m_contentType, row.data()->id, attributes), "saveAttributes",
                                       m_contentType, row.data()->id);
}

bool AbstractContentModel::setData(const QModelIndex &index, const QVariant &value, int role)
{
    if (index.row() < 0 || index.column() < 0 || !index.model())
        return false;
    // Out of range or an empty row: nothing to write to.
    if (index.row() >= m_currentContent->size() || !m_currentContent->at(index.row()).isValid())
        return false;
    Content &row = detachedRow(index.row());
    if (!row.data()->setData(role, value))
        return false;
    saveAttributes(row, { { QString::fromUtf8(roleNames().value(role)), ThemeletInterface::dbusValue(value) } });
    const QModelIndex changed = this->index(index.row());
    emit dataChanged(changed, changed, { role });
    return true;
}

void AbstractContentModel::setProperty(int index, const QString &property, const QVariant &value)
{
    const int role = roleFromName(property);
    if (role >= 0)
        setData(createIndex(index, 0), value, role);
}

void AbstractContentModel::set(int index, const QJSValue &properties)
{
    if (index < 0 || index >= m_currentContent->size() || !m_currentContent->at(index).isValid())
        return;
    m_currentContent->detach();

    QVariantMap changed;
    QVector<int> roles;
    QJSValueIterator it(properties);
    while (it.hasNext()) {
        it.next();
        const QString name = it.name();
        const int role = roleFromName(name);
        if (role < 0)
            continue;
        const QVariant value = it.value().toVariant();
        Content &row = detachedRow(index);
        if (value.canConvert<QVariantMap>()) {
            const QVariantMap given = value.toMap();
            // The row keeps the merged whole; the bus gets only the keys given.
            if (row.data()->setData(role, mergeMaps(row.data()->data(role).toMap(), given))) {
                changed[name] = mergeMaps(changed.value(name).toMap(), given, true);
                roles.append(role);
            }
        } else if (row.data()->setData(role, value)) {
            changed[name] = ThemeletInterface::dbusValue(value);
            roles.append(role);
        }
    }
    if (changed.isEmpty())
        return;
    saveAttributes(m_currentContent->at(index), changed);
    const QModelIndex changedIndex = this->index(index);
    emit dataChanged(changedIndex, changedIndex, roles);
}

void AbstractContentModel::remove(int index)
{
    const Content row = contentAt(index);
    if (!row.isValid())
        return;
    // The row stays until the service's change notice has brought a new query.
    if (ThemeletInterface *interface = ThemeletInterface::instance())
        ThemeletInterface::warnOnError(interface->remove(m_contentType, row.data()->id), "remove", m_contentType, row.data()->id);
}

QJSValue AbstractContentModel::get(int index) const
{
    const Content row = contentAt(index);
    QJSEngine *engine = qmlEngine(this);
    if (!row.isValid() || !engine)
        return QJSValue(QJSValue::UndefinedValue);
    QJSValue object = engine->newObject();
    const QHash<int, QByteArray> roles = roleNames();
    for (auto it = roles.cbegin(); it != roles.cend(); ++it)
        object.setProperty(QString::fromUtf8(it.value()), engine->toScriptValue(row.data()->data(it.key())));
    return object;
}

int AbstractContentModel::indexOf(const QString &property, const QVariant &value) const
{
    const int role = roleFromName(property);
    if (role < 0)
        return -1;
    for (int i = 0; i < m_currentContent->size(); ++i) {
        const Content &row = m_currentContent->at(i);
        if (row.isValid() && row.data()->data(role) == value)
            return i;
    }
    return -1;
}

QVariantMap AbstractContentModel::mergeMaps(QVariantMap base, const QVariantMap &overlay, bool convert)
{
    for (auto it = overlay.cbegin(); it != overlay.cend(); ++it) {
        if (it.value().canConvert<QVariantMap>())
            base[it.key()] = mergeMaps(base.value(it.key()).toMap(), it.value().toMap(), convert);
        else
            base[it.key()] = convert ? ThemeletInterface::dbusValue(it.value()) : it.value();
    }
    return base;
}

void AbstractContentModel::insertRange(int index, int count, const QVector<Content> &source, int sourceIndex)
{
    if (count < 1)
        return;
    beginInsertRows(QModelIndex(), index, index + count - 1);
    if (&source == m_ownedSource)
        m_currentContent->takeInsert(index, count, *m_ownedSource, sourceIndex);
    else
        m_currentContent->insertRange(index, count, source, sourceIndex);
    endInsertRows();
    emit countChanged();
}

void AbstractContentModel::removeRange(int index, int count)
{
    if (count < 1)
        return;
    beginRemoveRows(QModelIndex(), index, index + count - 1);
    m_currentContent->removeRange(index, count, &m_released);
    endRemoveRows();
    emit countChanged();
}

void AbstractContentModel::updateRange(int index, int count, const QVector<Content> &source, int sourceIndex)
{
    // Dead during filter passes: rows that stay under a filter keep the record they had.
    if (m_synchronizing || count < 1)
        return;
    if (&source == m_ownedSource) {
        m_currentContent->takeUpdate(index, count, *m_ownedSource, sourceIndex, &m_released);
    } else {
        m_released += m_currentContent->mid(index, count);
        m_currentContent->updateRange(index, count, source, sourceIndex);
    }
    emit dataChanged(this->index(index), this->index(index + count - 1));
}

// Replaced and removed records are freed on a pool thread: on a re-query of
// 100,000 rows, freeing them was most of the GUI thread's work. The handles'
// counts are atomic, and nothing else holds these records any more. They go
// in a few large lots: starting a pool thread per batch of 50 cost a third
// of a merge.
void AbstractContentModel::releaseRecords()
{
    if (m_released.size() + m_releasedSource.size() == 0)
        return;
    if (m_status == Querying && m_released.size() < s_releaseBatch && m_releasedSource.isEmpty())
        return;
    auto *released = new QVector<Content>[2];
    released[0].swap(m_released);
    released[1].swap(m_releasedSource);
    QThreadPool::globalInstance()->start([released]() { delete[] released; });
}

void AbstractContentModel::beginEdit()
{
    ++m_editDepth;
}

void AbstractContentModel::endEdit()
{
    if (--m_editDepth > 0)
        return;
    releaseRecords();
    while (m_deferredFilter >= 0 || m_deferredRefilter) {
        if (m_deferredFilter >= 0) {
            const bool filtered = m_deferredFilter;
            m_deferredFilter = -1;
            setFiltered(filtered);
        } else {
            m_deferredRefilter = false;
            refilter();
        }
    }
}

void AbstractContentModel::refilter()
{
    if (m_editDepth > 0) {
        m_deferredRefilter = true;
        return;
    }
    if (m_currentContent != &m_filteredContent)
        return;
    QVector<Content> accepted;
    accepted.reserve(m_content.size());
    for (const Content &row : qAsConst(m_content)) {
        if (acceptContent(row))
            accepted.append(row);
    }
    beginEdit();
    m_synchronizing = true;
    int index = 0;
    int sourceIndex = 0;
    SynchronizedContent::walk(m_filteredContent, accepted, index, sourceIndex, this);
    SynchronizedContent::finish(m_filteredContent, accepted, index, sourceIndex, this);
    m_synchronizing = false;
    endEdit();
}

void AbstractContentModel::setFiltered(bool filtered)
{
    if (m_editDepth > 0) {
        m_deferredFilter = filtered;
        return;
    }
    if (filtered) {
        if (m_currentContent == &m_filteredContent)
            return;
        if (!m_filteredContent.isSharedWith(m_content))
            static_cast<QVector<Content> &>(m_filteredContent) = m_content;
        m_filteredContent.resetCursors();
        m_currentContent = &m_filteredContent;
        refilter();
        return;
    }
    if (m_currentContent != &m_filteredContent)
        return;
    // A pure difference: the rows left on show read m_content's newer data once
    // the pointer moves, without a dataChanged.
    beginEdit();
    m_synchronizing = true;
    int index = 0;
    int sourceIndex = 0;
    SynchronizedContent::walk(m_filteredContent, m_content, index, sourceIndex, this, false);
    SynchronizedContent::finish(m_filteredContent, m_content, index, sourceIndex, this);
    m_synchronizing = false;
    m_currentContent = &m_content;
    endEdit();
}
