// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef ABSTRACTCONTENTMODEL_H
#define ABSTRACTCONTENTMODEL_H

#include "queryagent.h"
#include "synchronizedcontent.h"

#include <QAbstractListModel>
#include <QJSValue>
#include <QMutex>
#include <QQmlParserStatus>
#include <QRunnable>

// The base of every list of the content index that QML shows. Queries run on
// a pool thread; their batches come back as posted events and are merged into
// the rows on show with as few row signals as possible. Writes change the row
// at once and go to themeletd over D-Bus.
class AbstractContentModel : public QAbstractListModel, public QQmlParserStatus, public SynchronizationInterface
{
    Q_OBJECT
    Q_INTERFACES(QQmlParserStatus)
    Q_PROPERTY(Status status READ status NOTIFY statusChanged)
    Q_PROPERTY(int count READ count NOTIFY countChanged)
public:
    enum Status {
        Null,
        Querying,
        Finished,
        Error
    };
    Q_ENUM(Status)

    explicit AbstractContentModel(int contentType, QObject *parent = nullptr);
    ~AbstractContentModel() override;

    Status status() const { return m_status; }
    int count() const { return rowCount(QModelIndex()); }
    int contentType() const { return m_contentType; }

    bool event(QEvent *event) override;
    QModelIndex index(int row, int column = 0, const QModelIndex &parent = QModelIndex()) const override;
    int rowCount(const QModelIndex &parent = QModelIndex()) const override;
    QVariant data(const QModelIndex &index, int role) const override;
    bool setData(const QModelIndex &index, const QVariant &value, int role) override;

    void classBegin() override;
    void componentComplete() override;
    // The local filter, consulted while filtering is on.
    virtual bool acceptContent(const Content &content) const;

    void insertRange(int index, int count, const QVector<Content> &source, int sourceIndex) override;
    void removeRange(int index, int count) override;
    void updateRange(int index, int count, const QVector<Content> &source, int sourceIndex) override;

    Q_INVOKABLE QJSValue get(int index) const;
    Q_INVOKABLE void set(int index, const QJSValue &properties);
    Q_INVOKABLE void setProperty(int index, const QString &property, const QVariant &value);
    using QObject::setProperty; // not hidden by the row writer above
    Q_INVOKABLE void remove(int index);
    Q_INVOKABLE int indexOf(const QString &property, const QVariant &value) const;

    // `overlay` laid over `base`, maps merged key by key to any depth; with
    // `convert`, the values taken from `overlay` are in their D-Bus form.
    static QVariantMap mergeMaps(QVariantMap base, const QVariantMap &overlay, bool convert = false);

signals:
    void statusChanged();
    void countChanged();

protected:
    // Takes ownership. The latest request wins over one still queued.
    void query(QueryAgent::Parameters *parameters);
    Content contentAt(int index) const;
    void setContent(int index, const Content &content);
    void setFiltered(bool filtered);
    void refilter();

private:
    class QueryRunner;

    void startQuery();
    void postUpdate();
    void update();
    int roleFromName(const QString &name) const;
    // The row on show, private to this list and its record to this row.
    Content &detachedRow(int index);
    void saveAttributes(const Content &row, const QVariantMap &attributes);
    void takePendingContent();
    void beginEdit();
    void releaseRecords();
    void endEdit();

    SynchronizedContent m_content;
    SynchronizedContent m_filteredContent;
    QVector<Content> m_receivedContent;
    // Rows the query thread has handed over since the last ContentEvent was
    // taken, and whether that event is on its way; both under s_queryMutex.
    QVector<Content> m_pendingContent;
    QVector<SynchronizedContent::Key> m_pendingKeys;
    bool m_contentPosted = false;
    // The buffer m_pendingContent is swapped with, kept empty with its capacity:
    // the GUI thread never frees a buffer the query thread made, which in
    // glibc means sorting out that thread's whole heap arena.
    QVector<Content> m_spareContent;
    QVector<SynchronizedContent::Key> m_spareKeys;
    // The keys of m_receivedContent, row for row.
    QVector<SynchronizedContent::Key> m_receivedKeys;
    // The received rows while they are merged into the view: the rows taken
    // from it need no copy.
    QVector<Content> *m_ownedSource = nullptr;
    // Records the view no longer holds, and the rows of ended queries, to be
    // let go off the GUI thread.
    QVector<Content> m_released;
    QVector<Content> m_releasedSource;
    SynchronizedContent *m_currentContent;
    QueryAgent::Parameters *m_queuedQuery = nullptr;
    QueryRunner *m_queryRunner = nullptr;
    const int m_contentType;
    Status m_status = Null;
    Status m_pendingStatus = Null;
    bool m_complete = false;
    bool m_updatePosted = false;
    bool m_queryRequested = false;
    bool m_contentReceived = false;
    bool m_synchronizing = false;
    // Row signals run script handlers; a filter change made from one of them
    // waits until the walk that emitted the signal has ended. Applied at once,
    // it would swap m_currentContent under the walk, whose remaining inserts
    // and removes would then land in the other list at the walk's indexes:
    // rows out of range, a crash. So `count` read in such a handler is the
    // one before the filter; countChanged follows when the filter is applied.
    int m_editDepth = 0;
    int m_deferredFilter = -1;
    bool m_deferredRefilter = false;

    static QMutex s_queryMutex;
};

#endif
