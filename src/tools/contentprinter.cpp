// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "contentprinter.h"

#include "themeletcolor.h"

#include <QColor>
#include <QDateTime>
#include <QJsonArray>
#include <QJsonDocument>

#include <algorithm>
#include <cstdio>

namespace {

const char *const s_typeNames[] = { "file", "themelet", "photo", "video", "download" };
const int s_typeCount = int(sizeof(s_typeNames) / sizeof(s_typeNames[0]));
bool s_jsonErrors = false;

void write(FILE *stream, const QString &text)
{
    const QByteArray bytes = text.toUtf8();
    std::fwrite(bytes.constData(), 1, size_t(bytes.size()), stream);
    std::fflush(stream);
}

void flatten(const QString &name, const QVariant &value, QStringList *lines)
{
    if (value.userType() != QMetaType::QVariantMap) {
        lines->append(name + QStringLiteral(": ") + ContentPrinter::toText(value));
        return;
    }
    const QVariantMap map = value.toMap();
    for (auto it = map.cbegin(); it != map.cend(); ++it)
        flatten(name + QLatin1Char('.') + it.key(), it.value(), lines);
}

}

QString ContentPrinter::typeName(int type)
{
    return type >= 0 && type < s_typeCount ? QString::fromLatin1(s_typeNames[type]) : QString::number(type);
}

int ContentPrinter::typeFromName(const QString &name)
{
    for (int type = 0; type < s_typeCount; ++type) {
        if (name == QLatin1String(s_typeNames[type]))
            return type;
    }
    bool ok = false;
    const int type = name.toInt(&ok);
    return ok && type >= 0 ? type : -1;
}

ContentPrinter::Fields ContentPrinter::fields(const Content &content, const QUrl &activeSource)
{
    const auto *data = static_cast<const FileData *>(content.data());
    QHash<int, QByteArray> names;
    switch (content.type()) {
    case ThemeletContent::Themelet: names = ThemeletData::roleNames(); break;
    case ThemeletContent::Photo: names = PhotoData::roleNames(); break;
    default: names = FileData::roleNames(); break;
    }
    QList<int> roles = names.keys();
    std::sort(roles.begin(), roles.end());

    Fields result;
    result.append({ QStringLiteral("type"), typeName(content.type()) });
    for (int role : qAsConst(roles)) {
        const QString name = QString::fromLatin1(names.value(role));
        // The themelet role table answers "readOnly" with the path, a quirk kept for
        // QML; here it means what its name says.
        const QVariant value = name == QLatin1String("readOnly") ? QVariant(!(data->permissions & 2))
                                                                  : data->data(role);
        result.append({ name, value });
    }
    if (content.type() == ThemeletContent::Themelet) {
        result.append({ QStringLiteral("filePath"), data->url.toLocalFile() });
        result.append({ QStringLiteral("active"), !activeSource.isEmpty() && activeSource == data->url });
    }
    return result;
}

QJsonObject ContentPrinter::toJson(const Fields &fields)
{
    QJsonObject object;
    for (const auto &field : fields)
        object.insert(field.first, toJson(field.second));
    return object;
}

QJsonValue ContentPrinter::toJson(const QVariant &value)
{
    switch (value.userType()) {
    case QMetaType::QUrl: {
        const QUrl url = value.toUrl();
        return url.isEmpty() ? QJsonValue() : QJsonValue(url.toString());
    }
    case QMetaType::QColor: {
        const QColor color = value.value<QColor>();
        return color.isValid() ? QJsonValue(colorToString(color)) : QJsonValue();
    }
    case QMetaType::QDateTime: {
        const QDateTime time = value.toDateTime();
        return time.isValid() ? QJsonValue(time.toString(Qt::ISODate)) : QJsonValue();
    }
    case QMetaType::QVariantMap: {
        QJsonObject object;
        const QVariantMap map = value.toMap();
        for (auto it = map.cbegin(); it != map.cend(); ++it)
            object.insert(it.key(), toJson(it.value()));
        return object;
    }
    default:
        return QJsonValue::fromVariant(value);
    }
}

QString ContentPrinter::toText(const QVariant &value)
{
    switch (value.userType()) {
    case QMetaType::QUrl: {
        const QUrl url = value.toUrl();
        return url.isLocalFile() ? url.toLocalFile() : url.toString();
    }
    case QMetaType::QColor:
    case QMetaType::QDateTime:
        return toJson(value).toString();
    case QMetaType::Bool:
        return value.toBool() ? QStringLiteral("true") : QStringLiteral("false");
    default:
        return value.toString();
    }
}

QString ContentPrinter::oneLine(const QString &text)
{
    QString line = text;
    for (QChar &c : line) {
        if (c.category() == QChar::Other_Control)
            c = QLatin1Char(' ');
    }
    return line;
}

void ContentPrinter::printJson(const QJsonValue &value, bool compact)
{
    const QJsonDocument::JsonFormat format = compact ? QJsonDocument::Compact : QJsonDocument::Indented;
    QByteArray text;
    if (value.isArray())
        text = QJsonDocument(value.toArray()).toJson(format);
    else
        text = QJsonDocument(value.toObject()).toJson(format);
    if (!text.endsWith('\n'))
        text.append('\n');
    write(stdout, QString::fromUtf8(text));
}

void ContentPrinter::printFields(const Fields &fields)
{
    QStringList lines;
    for (const auto &field : fields)
        flatten(field.first, field.second, &lines);
    for (const QString &line : qAsConst(lines))
        print(oneLine(line));
}

void ContentPrinter::printTable(const QVector<QStringList> &table)
{
    QVector<QStringList> rows;
    for (const QStringList &row : table) {
        QStringList cells;
        for (const QString &cell : row)
            cells.append(oneLine(cell));
        rows.append(cells);
    }
    QVector<int> widths;
    for (const QStringList &row : qAsConst(rows)) {
        widths.resize(std::max(widths.size(), row.size()));
        for (int i = 0; i < row.size(); ++i)
            widths[i] = std::max(widths.at(i), row.at(i).size());
    }
    for (const QStringList &row : qAsConst(rows)) {
        QString line;
        for (int i = 0; i < row.size(); ++i)
            line += i + 1 < row.size() ? row.at(i).leftJustified(widths.at(i) + 2) : row.at(i);
        print(line);
    }
}

void ContentPrinter::print(const QString &line)
{
    write(stdout, line + QLatin1Char('\n'));
}

void ContentPrinter::printError(const QString &line, const QString &hint)
{
    if (s_jsonErrors) {
        QJsonObject error { { QStringLiteral("error"), line } };
        if (!hint.isEmpty())
            error.insert(QStringLiteral("hint"), hint);
        write(stderr, QString::fromUtf8(QJsonDocument(error).toJson(QJsonDocument::Compact)) + QLatin1Char('\n'));
        return;
    }
    write(stderr, QStringLiteral("themeletctl: ") + line + QLatin1Char('\n'));
    if (!hint.isEmpty())
        write(stderr, QStringLiteral("themeletctl: ") + hint + QLatin1Char('\n'));
}

void ContentPrinter::setJsonErrors(bool json)
{
    s_jsonErrors = json;
}
