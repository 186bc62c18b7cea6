// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The list difference on arbitrary pairs of lists. Byte 0 is the length of
// the old list, byte 1 the batch size (bit 7: the pure difference instead of
// the incremental merge), then the ids of the old rows and of the new ones,
// from a small alphabet so that rows recur (bit 5: an id too large for a key).
// On odd old lengths the merge is keyed, as a model's is. The new list arrives batch by
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
    QVector<Content> old;
    QVector<Content> source;
    for (size_t i = 2; i < size; ++i)
        (i < 2 + oldSize ? old : source).append(Content(new FileData(qint64(data[i] & 0x1f) << (data[i] & 0x20 ? 57 : 0), QUrl())));
    const bool keyed = oldSize & 1;
    const auto keysOf = [keyed](const QVector<Content> &rows) {
        QVector<SynchronizedContent::Key> keys;
        for (int i = 0; keyed && i < rows.size(); ++i)
            keys << SynchronizedContent::key(rows.at(i));
        return keys;
    };
    QVector<SynchronizedContent::Key> keys = keysOf(old);
    if (!old.isEmpty())
        list.merge(old, &checker, keys); // the list as an earlier query left it
    list.finish(old, &checker, &keys);

    if (data[1] & 0x80) {
        int index = 0, sourceIndex = 0;
        SynchronizedContent::walk(list, source, index, sourceIndex, &checker, false);
        SynchronizedContent::finish(list, source, index, sourceIndex, &checker);
    } else {
        QVector<Content> received;
        while (received.size() < source.size()) {
            received += source.mid(received.size(), (data[1] & 0x3f) + 1);
            list.merge(received, &checker, keysOf(received));
            // Rows behind the cursors are settled.
            if (list.index() > list.size() || list.index() != list.sourceIndex() || list.sourceIndex() > received.size()
                || !std::equal(list.begin(), list.begin() + list.index(), received.begin()))
                Fuzz::fail(QStringLiteral("rows behind the cursors differ from the source"));
        }
        keys = keysOf(source);
        list.finish(source, &checker, &keys);
        if (list.index() != 0 || list.sourceIndex() != 0)
            Fuzz::fail(QStringLiteral("cursors not reset by finish"));
    }
    if (static_cast<const QVector<Content> &>(list) != source)
        Fuzz::fail(QStringLiteral("the result differs from the source"));
    return 0;
}
