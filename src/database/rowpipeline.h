// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef ROWPIPELINE_H
#define ROWPIPELINE_H

#include "queryagent.h"
#include "statementreader.h"

// Delivers the rows of a list in the batches of QueryAgent::deliver(). Past
// the first batch the records are made on a second thread while this one
// steps the statement: making them (texts, URLs, allocations) costs about as
// much as SQLite's own work. The rows go over as copies, and the batches come
// back and are delivered, in order, on the thread that runs the query.
class RowPipeline
{
public:
    typedef Content (*ConvertRow)(const StatementReader &row);
    typedef Content (*ConvertCopy)(const RowCopy::Row &row);

    static void deliver(StatementReader &rows, QueryAgent::Recipient *recipient, ConvertRow convertRow,
                        ConvertCopy convertCopy);
};

#endif
