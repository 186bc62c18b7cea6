// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef STATUSADAPTOR_H
#define STATUSADAPTOR_H

#include <QDBusAbstractAdaptor>

class ThemeletService;

// com.vorka.themeletd.Status beside the service's own interface: what the
// loops have yet to do, which the index can't tell before the first scan.
class StatusAdaptor : public QDBusAbstractAdaptor
{
    Q_OBJECT
    Q_CLASSINFO("D-Bus Interface", "com.vorka.themeletd.Status")
public:
    explicit StatusAdaptor(ThemeletService *service);

public slots:
    // Directories and packages queued for reading; the unread files are in the index.
    qlonglong queued() const;
};

#endif
