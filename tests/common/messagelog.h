#ifndef MESSAGELOG_H
#define MESSAGELOG_H

#include <QMutex>
#include <QStringList>
#include <QTest>
#include <QtGlobal>

// Collects the records written while it lives, from any thread, in order.
// QTest::ignoreMessage can't tell the order of records; this can. Records are
// passed on unless told otherwise, so ignoreMessage still applies.
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
    // Expects `expected`, records as records() gives them: each is handed to
    // QTest::ignoreMessage, so that one that doesn't come fails the test.
    explicit MessageLog(const QStringList &expected) : MessageLog(true) { expect(expected); }
    // {"text"} would otherwise pick the bool constructor.
    MessageLog(const char *) = delete;
    ~MessageLog()
    {
        qInstallMessageHandler(s_previous);
        QMutexLocker locker(&s_mutex);
        s_records.clear();
    }

    // Every record as "<level>: <text>", level one of debug, warning, critical, fatal, info.
    QStringList records() const
    {
        QMutexLocker locker(&s_mutex);
        return s_records;
    }

    // The texts of the warning records only.
    QStringList warnings() const
    {
        const QString prefix = QStringLiteral("warning: ");
        QStringList result;
        for (const QString &record : records()) {
            if (record.startsWith(prefix))
                result << record.mid(prefix.size());
        }
        return result;
    }

    static void expect(const QStringList &records)
    {
        for (const QString &record : records) {
            const int colon = record.indexOf(QLatin1String(": "));
            const QString level = record.left(colon);
            const QtMsgType type = level == QLatin1String("debug") ? QtDebugMsg
                    : level == QLatin1String("critical") ? QtCriticalMsg : QtWarningMsg;
            QTest::ignoreMessage(type, qPrintable(record.mid(colon + 2)));
        }
    }

    // Texts as the records of warnings.
    static QStringList warningRecords(const QStringList &texts)
    {
        QStringList result;
        for (const QString &text : texts)
            result << QLatin1String("warning: ") + text;
        return result;
    }

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

    static inline QMutex s_mutex;
    static inline QStringList s_records;
    static inline QtMessageHandler s_previous = nullptr;
    static inline bool s_forward = true;

    Q_DISABLE_COPY(MessageLog)
};

#endif
