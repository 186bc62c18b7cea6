// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "changenotifier.h"
#include "content.h"

// The engine calls this after each commit that changed rows of a type; every
// client hears of it through the coalesced "contentChanged" signal.
void Content::signalChanged(int type)
{
    if (ChangeNotifier *notifier = ChangeNotifier::instance())
        notifier->notify(type);
}
