#include "changenotifier.h"
#include "content.h"

// The engine calls this after each commit that changed rows of a type; every
// client hears of it through the coalesced "contentChanged" signal.
void Content::signalChanged(int type)
{
    if (ChangeNotifier *notifier = ChangeNotifier::instance())
        notifier->notify(type);
}
