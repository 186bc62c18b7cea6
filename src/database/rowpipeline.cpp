// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "rowpipeline.h"

#include <QQueue>

#include <condition_variable>
#include <mutex>
#include <optional>

#include <pthread.h>

namespace {

// The standard library's lock and condition rather than Qt's: the thread sanitizer
// sees through them, and so checks this hand-over as well.
typedef std::unique_lock<std::mutex> Lock;

// Copies waiting to be made records, at most this many, so that a slow
// converter holds the statement back instead of piling copies up.
const int s_queued = 8;

class Converter
{
public:
    // Without a thread (none could be made), started() is false and nothing may be put.
    explicit Converter(RowPipeline::ConvertCopy convert)
        : m_convert(convert)
    {
        m_started = pthread_create(&m_thread, nullptr, &Converter::start, this) == 0;
    }

    ~Converter()
    {
        if (m_started) {
            close();
            pthread_join(m_thread, nullptr);
        }
        qDeleteAll(m_spare);
    }

    bool started() const { return m_started; }

    // An emptied copy to fill, if the converter has one to give back.
    RowCopy *spare(int columns)
    {
        Lock lock(m_mutex);
        return m_spare.isEmpty() ? new RowCopy(columns) : m_spare.dequeue();
    }

    void put(RowCopy *copy)
    {
        Lock lock(m_mutex);
        while (m_copies.size() >= s_queued)
            m_changed.wait(lock);
        m_copies.enqueue(copy);
        ++m_outstanding;
        m_changed.notify_all();
    }

    void close()
    {
        Lock lock(m_mutex);
        m_closed = true;
        m_changed.notify_all();
    }

    // Delivers the batches made so far; with `all`, waits for every one put.
    void deliver(QueryAgent::Recipient *recipient, bool all)
    {
        for (;;) {
            QQueue<QVector<Content>> batches;
            {
                Lock lock(m_mutex);
                while (all && m_outstanding > 0 && m_batches.isEmpty())
                    m_changed.wait(lock);
                batches.swap(m_batches);
                m_outstanding -= batches.size();
            }
            // Outside the lock: the recipient takes its own.
            while (!batches.isEmpty())
                recipient->contentQueried(batches.dequeue());
            Lock lock(m_mutex);
            if (!all || m_outstanding == 0)
                return;
        }
    }

private:
    static void *start(void *converter)
    {
        static_cast<Converter *>(converter)->run();
        return nullptr;
    }

    void run()
    {
        RowCopy::Row row;
        for (;;) {
            RowCopy *copy = nullptr;
            {
                Lock lock(m_mutex);
                while (m_copies.isEmpty() && !m_closed)
                    m_changed.wait(lock);
                if (m_copies.isEmpty())
                    return;
                copy = m_copies.dequeue();
                m_changed.notify_all();
            }
            QVector<Content> batch;
            batch.reserve(copy->rows());
            for (int i = 0; i < copy->rows(); ++i) {
                row.set(copy, i);
                batch.append(m_convert(row));
            }
            copy->clear();
            Lock lock(m_mutex);
            m_spare.enqueue(copy);
            m_batches.enqueue(batch);
            m_changed.notify_all();
        }
    }

    const RowPipeline::ConvertCopy m_convert;
    std::mutex m_mutex;
    std::condition_variable m_changed;
    QQueue<RowCopy *> m_copies;
    QQueue<RowCopy *> m_spare;
    QQueue<QVector<Content>> m_batches;
    int m_outstanding = 0; // put, not yet delivered
    bool m_closed = false;
    bool m_started = false;
    pthread_t m_thread;
};

}

void RowPipeline::deliver(StatementReader &rows, QueryAgent::Recipient *recipient, ConvertRow convertRow,
                          ConvertCopy convertCopy)
{
    const int size = QueryAgent::BatchSize;
    QVector<Content> batch;
    batch.reserve(size);
    bool more = true;
    // One batch converted here, as QueryAgent::deliver() does; false once the rows ended.
    const auto deliverHere = [&]() {
        batch.clear();
        while (batch.size() < size && (more = rows.next()))
            batch.append(convertRow(rows));
        recipient->contentQueried(batch);
        return more;
    };
    // The first batch here: a short list isn't worth a thread.
    if (!deliverHere())
        return;
    // Copies need the statement itself, and a thread.
    const int columns = rows.isDirect() ? rows.columnCount() : 0;
    std::optional<Converter> converter;
    if (columns > 0)
        converter.emplace(convertCopy);
    if (!converter || !converter->started()) {
        while (deliverHere()) {}
        return;
    }

    for (;;) {
        RowCopy *copy = converter->spare(columns);
        while (copy->rows() < size && (more = rows.next()))
            rows.copyRow(copy);
        converter->put(copy);
        converter->deliver(recipient, false);
        if (!more)
            break;
    }
    converter->close();
    converter->deliver(recipient, true);
}
