// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef RECORDINGLIST_H
#define RECORDINGLIST_H

#include "synchronizedcontent.h"

#include <QStringList>

// A list brought into line by the list difference: each edit is applied to `list`
// and written down; an edit out of range, or a refresh of rows that aren't the
// same items, makes it invalid and is not applied.
struct RecordingList : SynchronizationInterface
{
    SynchronizedContent list;
    QStringList operations;
    bool valid = true;

    virtual bool note(const QString &operation, bool inRange)
    {
        operations << operation;
        return valid = valid && inRange;
    }
    void insertRange(int index, int count, const QVector<Content> &source, int sourceIndex) override
    {
        if (note(QStringLiteral("insert %1 %2 from %3").arg(index).arg(count).arg(sourceIndex),
                 count > 0 && index >= 0 && index <= list.size() && sourceIndex >= 0 && sourceIndex + count <= source.size()))
            list.insertRange(index, count, source, sourceIndex);
    }
    void removeRange(int index, int count) override
    {
        if (note(QStringLiteral("remove %1 %2").arg(index).arg(count), count > 0 && index >= 0 && index + count <= list.size()))
            list.removeRange(index, count);
    }
    void updateRange(int index, int count, const QVector<Content> &source, int sourceIndex) override
    {
        bool same = count > 0 && index >= 0 && index + count <= list.size() && sourceIndex >= 0 && sourceIndex + count <= source.size();
        for (int i = 0; same && i < count; ++i)
            same = list.at(index + i) == source.at(sourceIndex + i);
        if (note(QStringLiteral("update %1 %2 from %3").arg(index).arg(count).arg(sourceIndex), same))
            list.updateRange(index, count, source, sourceIndex);
    }
};

#endif
