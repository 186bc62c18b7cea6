#ifndef FILEMANAGERLOOP_H
#define FILEMANAGERLOOP_H

#include "filemanager.h"

#include <QCoreApplication>
#include <QElapsedTimer>

#include <sys/ioctl.h>

// Bytes of inotify events that the manager hasn't read yet.
inline int pendingBytes(const FileManager &manager)
{
    int size = 0;
    ioctl(int(manager.socket()), FIONREAD, &size);
    return size;
}

// Runs the event loop until the manager has read every event and its update
// loop is idle; false after five seconds.
inline bool settle(FileManager &manager)
{
    QElapsedTimer timer;
    timer.start();
    while (pendingBytes(manager) > 0 || manager.isUpdateQueued()) {
        if (timer.hasExpired(5000))
            return false;
        QCoreApplication::processEvents();
    }
    return true;
}

#endif
