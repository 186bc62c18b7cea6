// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef MESSAGELOG_H
#define MESSAGELOG_H

#include <QMutex>
#include <QRegularExpression>
#include <QStringList>
#include <QTest>

// Collects the records written while it lives, from any thread, in order, as
// "<level>: <text>" with level one of debug, warning, critical, fatal, info.
// QTest::ignoreMessage can't tell the order of records; this can. Records are
// passed on when `forward`, so ignoreMessage still applies.
class MessageLog
{
public:
    explicit MessageLog(bool forward = true)
    {
        QMutexLocker locker(&s_mutex);
        s_records.clear();
        s_forward = forward;
        s_previous = qInstallMessageHandler(handler);
    }
    // Expects these records: each goes to QTest::ignoreMessage, so one that doesn't come fails the test.
    explicit MessageLog(const QStringList &expected) : MessageLog(true)
    {
        for (const QString &record : expected) {
            const QString level = record.section(QLatin1String(": "), 0, 0);
            QTest::ignoreMessage(level == QLatin1String("debug") ? QtDebugMsg : level == QLatin1String("critical") ? QtCriticalMsg : QtWarningMsg,
                                 qPrintable(record.section(QLatin1String(": "), 1)));
        }
    }
    MessageLog(const char *) = delete; // {"text"} would otherwise pick the bool constructor
    ~MessageLog() { qInstallMessageHandler(s_previous); }

    QStringList records() const
    {
        QMutexLocker locker(&s_mutex);
        return s_records;
    }
    // The texts of the warning records only.
    QStringList warnings() const { return records().filter(s_warning).replaceInStrings(s_warning, QString()); }
    // Texts as the records of warnings.
    static QStringList warningRecords(QStringList texts) { return texts.replaceInStrings(QRegularExpression("^"), "warning: "); }

private:
    static void handler(QtMsgType type, const QMessageLogContext &context, const QString &text)
    {
        static const char *const levels[] = { "debug", "warning", "critical", "fatal", "info" };
        {
            QMutexLocker locker(&s_mutex);
            s_records.append(QLatin1String(levels[type]) + QLatin1String(": ") + text);
        }
        if (s_forward && s_previous)
            s_previous(type, context, text);
    }

    static inline const QRegularExpression s_warning { QStringLiteral("^warning: ") };
    static inline QMutex s_mutex;
    static inline QStringList s_records;
    static inline QtMessageHandler s_previous = nullptr;
    static inline bool s_forward = true;

    Q_DISABLE_COPY(MessageLog)
};

#endif
