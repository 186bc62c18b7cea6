// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// Turns the RESULT lines of the measures into one table or one JSON document.
//   bench_report [--json] RESULTS_FILE MEASURE...
// A measure without a line shows as "error", so a crashed program still has its row.
#include <QCoreApplication>
#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QMap>
#include <QTextStream>

#include <cstdio>

namespace {

QJsonValue typed(const QString &text)
{
    bool ok = false;
    const double number = text.toDouble(&ok);
    return ok ? QJsonValue(number) : QJsonValue(text);
}

QString cell(const QJsonObject &row, const QString &key)
{
    const QJsonValue v = row.value(key);
    if (v.isDouble()) {
        const double d = v.toDouble();
        if (d == qint64(d) && qAbs(d) < 1e12)
            return QString::number(qint64(d));
        return QString::number(d, 'g', 4);
    }
    return v.toString(QStringLiteral("-"));
}

}

int main(int argc, char **argv)
{
    QCoreApplication app(argc, argv);
    QStringList args = app.arguments().mid(1);
    const bool json = args.removeAll(QStringLiteral("--json")) > 0;
    if (args.isEmpty()) {
        std::fprintf(stderr, "usage: bench_report [--json] RESULTS MEASURE...\n");
        return 2;
    }
    QFile file(args.takeFirst());
    QMap<QString, QJsonObject> rows;
    if (file.open(QIODevice::ReadOnly)) {
        for (const QByteArray &raw : file.readAll().split('\n')) {
            const QStringList parts = QString::fromUtf8(raw).split(QLatin1Char(' '), Qt::SkipEmptyParts);
            if (parts.size() < 2 || parts.first() != QLatin1String("RESULT"))
                continue;
            QJsonObject row;
            row.insert(QStringLiteral("measure"), parts.at(1));
            for (const QString &p : parts.mid(2)) {
                const int eq = p.indexOf(QLatin1Char('='));
                if (eq > 0)
                    row.insert(p.left(eq), typed(QString(p.mid(eq + 1)).replace(QLatin1Char('_'), QLatin1Char(' '))));
            }
            rows.insert(parts.at(1), row);
        }
    }

    QJsonArray ordered;
    for (const QString &m : args) {
        QJsonObject row = rows.value(m);
        if (row.isEmpty()) {
            row.insert(QStringLiteral("measure"), m);
            row.insert(QStringLiteral("result"), QStringLiteral("error"));
            row.insert(QStringLiteral("note"), QStringLiteral("the measure printed no result"));
        }
        ordered.append(row);
    }

    QTextStream out(stdout);
    if (json) {
        QJsonObject doc;
        doc.insert(QStringLiteral("measures"), ordered);
        out << QJsonDocument(doc).toJson(QJsonDocument::Indented);
        return 0;
    }

    const QStringList columns = { QStringLiteral("measure"), QStringLiteral("ours"), QStringLiteral("baseline"),
                                  QStringLiteral("ratio"), QStringLiteral("target"), QStringLiteral("result") };
    QVector<int> widths(columns.size());
    QVector<QStringList> lines;
    lines.append(columns);
    for (const QJsonValue &v : ordered) {
        QStringList line;
        const QJsonObject row = v.toObject();
        for (const QString &c : columns) {
            QString text = cell(row, c);
            if ((c == QLatin1String("ours") || c == QLatin1String("baseline")) && row.contains(QStringLiteral("unit"))
                && text != QLatin1String("-"))
                text += QLatin1Char(' ') + row.value(QStringLiteral("unit")).toString();
            line.append(text);
        }
        lines.append(line);
    }
    for (const QStringList &line : lines)
        for (int i = 0; i < line.size(); ++i)
            widths[i] = qMax(widths[i], line.at(i).size());
    for (int l = 0; l < lines.size(); ++l) {
        QStringList padded;
        for (int i = 0; i < columns.size(); ++i)
            padded.append(lines.at(l).at(i).leftJustified(widths[i]));
        out << "| " << padded.join(QStringLiteral(" | ")) << " |\n";
        if (l == 0) {
            QStringList rule;
            for (int w : widths)
                rule.append(QString(w, QLatin1Char('-')));
            out << "|-" << rule.join(QStringLiteral("-|-")) << "-|\n";
        }
    }
    // Everything else a measure reported, one line each.
    out << "\n";
    for (const QJsonValue &v : ordered) {
        const QJsonObject row = v.toObject();
        QStringList extra;
        for (auto it = row.begin(); it != row.end(); ++it) {
            if (columns.contains(it.key()) || it.key() == QLatin1String("unit"))
                continue;
            extra.append(it.key() + QLatin1Char('=') + cell(row, it.key()));
        }
        if (!extra.isEmpty())
            out << row.value(QStringLiteral("measure")).toString() << ": " << extra.join(QStringLiteral(", ")) << "\n";
    }
    return 0;
}
