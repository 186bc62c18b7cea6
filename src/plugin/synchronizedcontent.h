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

    // One step of the incremental merge: brings this list into line with as much
    // of `source` as can be decided, editing it through `agent`, which changes this
    // list. Rows in front of the cursors stay until a later batch or finish().
    void merge(const QVector<Content> &source, SynchronizationInterface *agent);
    // The end of a query: undecided rows go, unconsumed ones come, cursors return to 0.
    void finish(const QVector<Content> &source, SynchronizationInterface *agent);
    void resetCursors() { m_index = m_sourceIndex = 0; }

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
    static bool findAnchor(const QVector<Content> &list, const QVector<Content> &source, int index, int sourceIndex,
                           SynchronizationInterface *agent, int *matchedIndex, int *matchedSourceIndex);

    int m_index = 0;
    int m_sourceIndex = 0;
};

#endif
