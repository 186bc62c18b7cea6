// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "signalrecorder.h"

#include "content.h"

namespace {
QList<int> s_calls;
}

void Content::signalChanged(int type)
{
    s_calls.append(type);
}

namespace SignalRecorder {

QList<int> calls()
{
    return s_calls;
}

void clear()
{
    s_calls.clear();
}

}
