// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef SYNCHRONIZEDCONTENT_H
#define SYNCHRONIZEDCONTENT_H

#include "content.h"

#include <QVector>

// Receives the edits that bring one list of rows into line with another.
// There is no move: a row that changed its place is a removal and an insertion.
class SynchronizationInterface
{
public:
    // Rows source[sourceIndex .. sourceIndex+count) are to stand at index .. index+count).
    virtual void insertRange(int index, int count, const QVector<Content> &source, int sourceIndex) = 0;
    virtual void removeRange(int index, int count) = 0;
    // The rows at index .. index+count) are the same items as source[sourceIndex ..)
    // and may take their newer data.
    virtual void updateRange(int index, int count, const QVector<Content> &source, int sourceIndex) = 0;
    virtual ~SynchronizationInterface();
};

// A list that can be the target of the edits, silently, and that keeps the
// cursors of a merge running batch by batch over a growing source.
class SynchronizedContent : public QVector<Content>, public SynchronizationInterface
{
public:
    SynchronizedContent() = default;
    SynchronizedContent(const QVector<Content> &content) : QVector<Content>(content) {}

    void insertRange(int index, int count, const QVector<Content> &source, int sourceIndex) override;
    void removeRange(int index, int count) override;
    void updateRange(int index, int count, const QVector<Content> &source, int sourceIndex) override;
    // The same edits for the owner of `source`: the rows are taken out of it
    // (left null there) instead of copied, and the handles the list drops are
    // moved to the end of `dropped`. No record's count is touched.
    void takeInsert(int index, int count, QVector<Content> &source, int sourceIndex);
    void takeUpdate(int index, int count, QVector<Content> &source, int sourceIndex, QVector<Content> *dropped);
    void removeRange(int index, int count, QVector<Content> *dropped);

    // A row's identity in one word, so that a merge can compare rows without
    // reaching for their records, which lie all over the heap: the type in the
    // top byte, the id below. A null row, or one whose type or id doesn't fit,
    // gets NoKey and is compared through its record.
    typedef quint64 Key;
    static const Key NoKey = ~Key(0);
    static Key key(const Content &row);

    // One step of the incremental merge: brings this list into line with as much
    // of `source` as can be decided, editing it through `agent`, which changes this
    // list. Rows in front of the cursors stay until a later batch or finish().
    // `sourceKeys`, if it has one key a source row, spares reading the records.
    void merge(const QVector<Content> &source, SynchronizationInterface *agent,
               const QVector<Key> &sourceKeys = QVector<Key>());
    // The end of a query: undecided rows go, unconsumed ones come, cursors return
    // to 0. The list is then the source, row for row, and takes its keys.
    void finish(const QVector<Content> &source, SynchronizationInterface *agent,
                QVector<Key> *sourceKeys = nullptr);
    void resetCursors()
    {
        m_index = m_sourceIndex = 0;
        m_keys.clear();
    }

    int index() const { return m_index; }
    int sourceIndex() const { return m_sourceIndex; }

    // The walk over `list` from `index` and over `source` from `sourceIndex`; `agent`
    // edits `list`. Stretches of matched rows are refreshed through updateRange
    // only if `refresh`. Returns false if it stopped for want of an anchor, with
    // the cursors on the rows that disagree.
    static bool walk(const QVector<Content> &list, const QVector<Content> &source, int &index, int &sourceIndex,
                     SynchronizationInterface *agent, bool refresh = true);
    static void finish(const QVector<Content> &list, const QVector<Content> &source, int &index, int &sourceIndex,
                       SynchronizationInterface *agent);

private:
    template <typename Same>
    static bool walk(const QVector<Content> &list, const QVector<Content> &source, int &index, int &sourceIndex,
                     SynchronizationInterface *agent, bool refresh, Same same);
    static bool findAnchor(const QVector<Content> &list, const QVector<Content> &source, int index, int sourceIndex,
                           SynchronizationInterface *agent, int *matchedIndex, int *matchedSourceIndex);

    int m_index = 0;
    int m_sourceIndex = 0;
    // The keys of the rows as the last finish() left them. The edits of a merge
    // all fall at its cursor, so the rows from the cursor on are those rows
    // still, moved by as many places as the list has grown since.
    QVector<Key> m_keys;
};

#endif
