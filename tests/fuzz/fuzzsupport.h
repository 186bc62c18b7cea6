// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef FUZZSUPPORT_H
#define FUZZSUPPORT_H

#include "dbmanager.h"

#include <QCoreApplication>
#include <QDir>
#include <QFileInfo>
#include <QSqlError>
#include <QSqlQuery>
#include <QVariant>

#include <cstdio>
#include <cstdlib>

// Shared by the fuzz targets. They run inside tests/sandbox.sh (run-short does
// that), so the index, dconf and the session bus are throw-away ones.
namespace Fuzz {

[[noreturn]] inline void fail(const QString &what)
{
    std::fprintf(stderr, "fuzz invariant broken: %s\n", qPrintable(what));
    std::abort();
}

// The Qt application and the sandbox root; refuses to run outside a sandbox.
inline QString start()
{
    static int argc = 1;
    static char name[] = "fuzz";
    static char *argv[] = { name, nullptr };
    const QString sandbox = qEnvironmentVariable("THEMELET_SANDBOX");
    if (sandbox.isEmpty()) {
        std::fprintf(stderr, "run the fuzz targets through tests/sandbox.sh\n");
        std::exit(2);
    }
    new QCoreApplication(argc, argv);
    // Reports of bad input are expected by the thousand; failures still abort.
    qInstallMessageHandler([](QtMsgType type, const QMessageLogContext &, const QString &message) {
        if (type == QtFatalMsg)
            fail(message);
    });
    return sandbox;
}

inline void write(const QString &path, const QByteArray &content)
{
    QDir().mkpath(QFileInfo(path).absolutePath());
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly | QIODevice::Truncate) || file.write(content) != content.size())
        fail(QStringLiteral("cannot write ") + path);
}

// Runs a statement on the service's connection; the first column of the first row.
inline QVariant sql(const QString &statement)
{
    QSqlQuery query(DbManager::instance());
    if (!query.exec(statement))
        fail(statement + QStringLiteral(": ") + query.lastError().text());
    return query.next() ? query.value(0) : QVariant();
}

// Rows that no longer lead anywhere, and directories outside the fixture:
// the kinds of damage that a hostile file must never cause.
inline void checkIndex(const QString &root)
{
    if (sql(QStringLiteral("SELECT (SELECT count(*) FROM resource WHERE fileId NOT IN (SELECT id FROM file) "
                           "OR resourceId NOT IN (SELECT id FROM file)) + (SELECT count(*) FROM themelet WHERE fileId NOT IN "
                           "(SELECT id FROM file)) + (SELECT count(*) FROM file WHERE directoryId NOT IN (SELECT id FROM directory))"))
                .toInt() != 0)
        fail(QStringLiteral("resource, themelet or file row without what it refers to"));
    const QString outside = sql(QStringLiteral("SELECT path FROM directory WHERE substr(path, 1, %1) != '%2' LIMIT 1")
                                        .arg(root.size()).arg(root)).toString();
    if (!outside.isEmpty())
        fail(QStringLiteral("directory row outside the fixture: ") + outside);
}

}

#endif
