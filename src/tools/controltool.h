// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CONTROLTOOL_H
#define CONTROLTOOL_H

#include "contentprinter.h"
#include "indexreader.h"
#include "serviceclient.h"

#include <QDBusPendingCall>
#include <QStringList>
#include <QUrl>

// The commands of themeletctl: parses the command line, runs one command and
// gives the exit code.
class ControlTool
{
public:
    enum ExitCode { Success = 0, Failure = 1, UsageError = 2 };

    int run(const QStringList &arguments);

    static QString helpText();

private:
    struct Command;
    static const Command s_commands[];

    int list(const QStringList &arguments);
    int show(const QStringList &arguments);
    int set(const QStringList &arguments);
    int create(const QStringList &arguments);
    int favorite(const QStringList &arguments);
    int install(const QStringList &arguments);
    int index(const QStringList &arguments);
    int refresh(const QStringList &arguments);
    int remove(const QStringList &arguments);
    int monitor(const QStringList &arguments);
    int status(const QStringList &arguments);
    int check(const QStringList &arguments);

    int usageError(const QString &message);
    int failure(const QString &message);
    // Prints why when themeletd isn't there; writes ask before they look anything up.
    bool serviceMissing();
    // The exit code of a call of themeletd; prints its error.
    int finish(const QDBusPendingCall &call);

    // An id or a URL, a path standing for its file URL.
    static bool isId(const QString &argument, qint64 *id);
    static QUrl urlFromArgument(const QString &argument);
    // Finds the item an argument names; prints why not and gives null.
    Content lookUp(const QString &argument);
    // The URL an argument names: a given URL or path as it is, an id through the index.
    bool urlOf(const QString &argument, QUrl *url);
    // The record of a themelet the service just answered with, or its id alone.
    void printThemelet(const QString &verb, qint64 id);
    QUrl activeSource() const;

    IndexReader m_index;
    ServiceClient m_service;
    bool m_json = false;
};

#endif
