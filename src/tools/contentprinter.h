// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef CONTENTPRINTER_H
#define CONTENTPRINTER_H

#include "content.h"

#include <QJsonObject>
#include <QJsonValue>
#include <QPair>
#include <QString>
#include <QStringList>
#include <QUrl>
#include <QVector>

// Index records as JSON and as text for a terminal, and the output streams.
class ContentPrinter
{
public:
    typedef QVector<QPair<QString, QVariant>> Fields;

    // "file", "themelet", ...; the number for unknown types.
    static QString typeName(int type);
    // -1 when the name is neither a type name nor a type number.
    static int typeFromName(const QString &name);

    // Every role of the record by its role name, in role order, plus its type
    // and whether it is the active themelet.
    static Fields fields(const Content &content, const QUrl &activeSource);
    static QJsonObject toJson(const Fields &fields);
    static QJsonValue toJson(const QVariant &value);
    // A value as a user reads it: local URLs as paths, colours as #AARRGGBB.
    static QString toText(const QVariant &value);

    // Control characters (new lines, escapes) as spaces: names and paths from
    // the index are anybody's, and must neither split a row nor steer a terminal.
    static QString oneLine(const QString &text);

    static void printJson(const QJsonValue &value, bool compact = false);
    // "name: value" lines, maps flattened to "name.key".
    static void printFields(const Fields &fields);
    // Left-aligned columns; the first row is the header.
    static void printTable(const QVector<QStringList> &rows);

    static void print(const QString &line);
    // To stderr, as "themeletctl: line".
    static void printError(const QString &line, const QString &hint = QString());
    // Errors as one JSON object a line, {"error": ..., "hint": ...}, for --json.
    static void setJsonErrors(bool json);
};

#endif
