#ifndef SIGNALRECORDER_H
#define SIGNALRECORDER_H

#include <QList>

// The test-side definition of Content::signalChanged records every call here.
namespace SignalRecorder {
QList<int> calls();
void clear();
}

#endif
