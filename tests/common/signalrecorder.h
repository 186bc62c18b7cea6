// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef SIGNALRECORDER_H
#define SIGNALRECORDER_H

#include <QList>

// The test-side definition of Content::signalChanged records every call here.
namespace SignalRecorder {
QList<int> calls();
void clear();
}

#endif
