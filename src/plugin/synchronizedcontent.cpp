// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "synchronizedcontent.h"

SynchronizationInterface::~SynchronizationInterface() = default;

SynchronizedContent::Key SynchronizedContent::key(const Content &row)
{
    const ContentData *data = row.data();
    if (!data || data->type < 0 || data->type >= 0xff || data->id < 0 || data->id >= (qint64(1) << 56))
        return NoKey;
    return (Key(data->type) << 56) | Key(data->id);
}

void SynchronizedContent::insertRange(int index, int count, const QVector<Content> &source, int sourceIndex)
{
    if (count < 1)
        return;
    insert(begin() + index, count, Content()); // detaches, moves the tail once
    Content *rows = data() + index;
    const Content *from = source.constData() + sourceIndex;
    for (int i = 0; i < count; ++i)
        rows[i] = from[i];
}

void SynchronizedContent::takeInsert(int index, int count, QVector<Content> &source, int sourceIndex)
{
    if (count < 1)
        return;
    insert(begin() + index, count, Content());
    Content *rows = data() + index;
    Content *from = source.data() + sourceIndex;
    for (int i = 0; i < count; ++i)
        rows[i] = std::move(from[i]);
}

void SynchronizedContent::removeRange(int index, int count)
{
    removeRange(index, count, nullptr);
}

void SynchronizedContent::removeRange(int index, int count, QVector<Content> *dropped)
{
    if (count < 1)
        return;
    detach();
    if (dropped) {
        Content *rows = data() + index;
        for (int i = 0; i < count; ++i)
            dropped->append(std::move(rows[i]));
    }
    erase(begin() + index, begin() + index + count);
}

void SynchronizedContent::updateRange(int index, int count, const QVector<Content> &source, int sourceIndex)
{
    if (count < 1)
        return;
    Content *rows = data() + index; // detaches once
    const Content *from = source.constData() + sourceIndex;
    for (int i = 0; i < count; ++i)
        rows[i] = from[i];
}

void SynchronizedContent::takeUpdate(int index, int count, QVector<Content> &source, int sourceIndex,
                                     QVector<Content> *dropped)
{
    if (count < 1)
        return;
    Content *rows = data() + index;
    Content *from = source.data() + sourceIndex;
    for (int i = 0; i < count; ++i) {
        dropped->append(std::move(rows[i]));
        rows[i] = std::move(from[i]);
    }
}

void SynchronizedContent::merge(const QVector<Content> &source, SynchronizationInterface *agent,
                                const QVector<Key> &sourceKeys)
{
    if (m_index == size()) {
        // Nothing old left to compare with: the rest arrives as one insertion.
        agent->insertRange(m_index, source.size() - m_sourceIndex, source, m_sourceIndex);
        m_index = size();
        m_sourceIndex = source.size();
        return;
    }
    if (sourceKeys.size() != source.size() || m_keys.isEmpty()) {
        walk(*this, source, m_index, m_sourceIndex, agent);
        return;
    }
    const QVector<Key> &keys = m_keys;
    walk(*this, source, m_index, m_sourceIndex, agent, true, [&](int index, int sourceIndex) {
        const int k = index - (size() - keys.size());
        if (k >= 0 && k < keys.size()) {
            const Key a = keys.at(k);
            const Key b = sourceKeys.at(sourceIndex);
            if (a != NoKey && b != NoKey)
                return a == b;
        }
        return at(index) == source.at(sourceIndex);
    });
}

void SynchronizedContent::finish(const QVector<Content> &source, SynchronizationInterface *agent,
                                 QVector<Key> *sourceKeys)
{
    finish(*this, source, m_index, m_sourceIndex, agent);
    m_keys.clear();
    if (sourceKeys && sourceKeys->size() == source.size() && size() == source.size())
        m_keys.swap(*sourceKeys);
}

bool SynchronizedContent::walk(const QVector<Content> &list, const QVector<Content> &source, int &index,
                               int &sourceIndex, SynchronizationInterface *agent, bool refresh)
{
    return walk(list, source, index, sourceIndex, agent, refresh,
                [&](int i, int j) { return list.at(i) == source.at(j); });
}

template <typename Same>
bool SynchronizedContent::walk(const QVector<Content> &list, const QVector<Content> &source, int &index,
                               int &sourceIndex, SynchronizationInterface *agent, bool refresh, Same same)
{
    int run = index;
    int runSource = sourceIndex;
    const auto flush = [&]() {
        if (refresh && index > run)
            agent->updateRange(run, index - run, source, runSource);
    };

    while (index < list.size() && sourceIndex < source.size()) {
        if (same(index, sourceIndex)) {
            ++index;
            ++sourceIndex;
            continue;
        }
        flush();
        int matched = 0;
        int matchedSource = 0;
        if (!findAnchor(list, source, index, sourceIndex, agent, &matched, &matchedSource))
            return false;
        run = matched;
        runSource = matchedSource;
        index = matched + 1;
        sourceIndex = matchedSource + 1;
    }
    flush();
    return true;
}

bool SynchronizedContent::findAnchor(const QVector<Content> &list, const QVector<Content> &source, int index,
                                     int sourceIndex, SynchronizationInterface *agent, int *matchedIndex,
                                     int *matchedSourceIndex)
{
    const auto match = [&](int listIndex, int sourceMatch) {
        *matchedIndex = listIndex;
        *matchedSourceIndex = sourceMatch;
        return true;
    };

    for (int k = 1;; ++k) {
        if (index + k >= list.size()) {
            // The old list ends within k: look for any of its remaining rows further on in the source.
            for (int j = sourceIndex + k; j < source.size(); ++j) {
                for (int m = 0; m < k; ++m) {
                    if (list.at(index + m) == source.at(j)) {
                        if (m > 0)
                            agent->removeRange(index, m);
                        agent->insertRange(index, j - sourceIndex, source, sourceIndex);
                        return match(index + j - sourceIndex, j);
                    }
                }
            }
            return false;
        }
        if (sourceIndex + k >= source.size()) {
            // The source ends within k: look for any of its remaining rows further on in the old list.
            for (int i = index + k; i < list.size(); ++i) {
                for (int m = 0; m < k; ++m) {
                    if (source.at(sourceIndex + m) == list.at(i)) {
                        agent->removeRange(index, i - index);
                        if (m > 0)
                            agent->insertRange(index, m, source, sourceIndex);
                        return match(index + m, sourceIndex + m);
                    }
                }
            }
            return false;
        }
        for (int m = 0; m <= k; ++m) {
            if (list.at(index + m) == source.at(sourceIndex + k)) {
                if (m > 0)
                    agent->removeRange(index, m);
                agent->insertRange(index, k, source, sourceIndex);
                return match(index + k, sourceIndex + k);
            }
            if (source.at(sourceIndex + m) == list.at(index + k)) {
                agent->removeRange(index, k);
                if (m > 0)
                    agent->insertRange(index, m, source, sourceIndex);
                return match(index + m, sourceIndex + m);
            }
        }
    }
}

void SynchronizedContent::finish(const QVector<Content> &list, const QVector<Content> &source, int &index,
                                 int &sourceIndex, SynchronizationInterface *agent)
{
    if (index < list.size())
        agent->removeRange(index, list.size() - index);
    if (sourceIndex < source.size())
        agent->insertRange(list.size(), source.size() - sourceIndex, source, sourceIndex);
    index = 0;
    sourceIndex = 0;
}
