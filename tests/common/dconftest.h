// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef DCONFTEST_H
#define DCONFTEST_H

#include "mgconfitem.h"

#include <QDebug>
#include <QProcess>
#include <QSignalSpy>
#include <QTest>

// The dconf command line tool: another process that shares the sandbox's store and session bus.
namespace DConfTest {

inline QString run(const QStringList &arguments)
{
    QProcess process;
    process.start(QStringLiteral("dconf"), arguments);
    if (!process.waitForFinished() || process.exitCode() != 0)
        qWarning() << "dconf" << arguments << "failed:" << process.readAllStandardError();
    return QString::fromUtf8(process.readAllStandardOutput()).trimmed();
}

// value is in GVariant text form, e.g. "'text'", "42", "true".
inline void write(const QString &key, const QString &value) { run({ "write", key, value }); }
inline QString read(const QString &key) { return run({ "read", key }); }
// A key, or a whole directory when the path ends with '/'.
inline void reset(const QString &path)
{
    run(path.endsWith(QLatin1Char('/')) ? QStringList { "reset", "-f", path } : QStringList { "reset", path });
}

// Returns once every change notice sent before the call has been delivered:
// the store handles changes in order, so when another process's write of a
// barrier key has arrived, everything before it has too.
inline bool barrier()
{
    static MGConfItem item(QStringLiteral("/org/orbaline/test/barrier"));
    static int round = 0;
    QSignalSpy spy(&item, &MGConfItem::valueChanged);
    write(item.key(), QString::number(++round));
    return QTest::qWaitFor([&]() { return item.value().toInt() == round && !spy.isEmpty(); });
}

}

#endif
