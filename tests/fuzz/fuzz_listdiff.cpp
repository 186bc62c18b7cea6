// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The list difference on arbitrary pairs of lists. Byte 0 is the length of
// the old list, byte 1 the batch size (bit 7: the pure difference instead of
// the incremental merge), then the ids of the old rows and of the new ones,
// from a small alphabet so that rows recur. The new list arrives batch by
// batch; at the end the old list must equal it, and no edit may reach past
// either list or refresh a row with another item.
#include "fuzzsupport.h"
#include "recordinglist.h"

#include <QUrl>

#include <algorithm>

namespace {

// Stops at the first bad edit, before it is applied.
struct Checker : RecordingList
{
    bool note(const QString &operation, bool inRange) override
    {
        if (!inRange)
            Fuzz::fail(QStringLiteral("an edit out of bounds or over another item: ") + operation);
        return true;
    }
};

}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    if (size < 2 || size > 4096)
        return 0;
    const size_t oldSize = qMin<size_t>(data[0], size - 2);
    Checker checker;
    SynchronizedContent &list = checker.list;
    QVector<Content> source;
    for (size_t i = 2; i < size; ++i)
        (i < 2 + oldSize ? static_cast<QVector<Content> &>(list) : source).append(Content(new FileData(data[i] & 0x1f, QUrl())));

    if (data[1] & 0x80) {
        int index = 0, sourceIndex = 0;
        SynchronizedContent::walk(list, source, index, sourceIndex, &checker, false);
        SynchronizedContent::finish(list, source, index, sourceIndex, &checker);
    } else {
        QVector<Content> received;
        while (received.size() < source.size()) {
            received += source.mid(received.size(), (data[1] & 0x3f) + 1);
            list.merge(received, &checker);
            // Rows behind the cursors are settled.
            if (list.index() > list.size() || list.index() != list.sourceIndex() || list.sourceIndex() > received.size()
                || !std::equal(list.begin(), list.begin() + list.index(), received.begin()))
                Fuzz::fail(QStringLiteral("rows behind the cursors differ from the source"));
        }
        list.finish(source, &checker);
        if (list.index() != 0 || list.sourceIndex() != 0)
            Fuzz::fail(QStringLiteral("cursors not reset by finish"));
    }
    if (static_cast<const QVector<Content> &>(list) != source)
        Fuzz::fail(QStringLiteral("the result differs from the source"));
    return 0;
}
