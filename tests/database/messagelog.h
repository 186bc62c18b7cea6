#ifndef MESSAGELOG_H
#define MESSAGELOG_H

#include <QMutex>
#include <QStringList>
#include <QtGlobal>

// Collects the warnings written while it lives, from any thread, in order.
// QTest::ignoreMessage can't tell the order of records; this can.
class MessageLog
{
public:
    MessageLog() { s_previous = qInstallMessageHandler(handler); }
    ~MessageLog() { qInstallMessageHandler(s_previous); s_warnings.clear(); }

    QStringList warnings() const
    {
        QMutexLocker locker(&s_mutex);
        return s_warnings;
    }

private:
    static void handler(QtMsgType type, const QMessageLogContext &, const QString &message)
    {
        QMutexLocker locker(&s_mutex);
        if (type == QtWarningMsg)
            s_warnings << message;
    }

    static inline QMutex s_mutex;
    static inline QStringList s_warnings;
    static inline QtMessageHandler s_previous = nullptr;

    Q_DISABLE_COPY(MessageLog)
};

#endif
