#ifndef QMLRECORDINGSERVICE_H
#define QMLRECORDINGSERVICE_H

#include "recordingservice.h"

#include <QObject>
#include <QVariantList>

// The recording stand-in for themeletd, for QML tests: it starts when asked,
// and its calls read as a list of { method, arguments }.
class QmlRecordingService : public QObject
{
    Q_OBJECT
public:
    Q_INVOKABLE bool start() { return m_service.start(); }
    Q_INVOKABLE bool emitContentChanged(int type) { return m_service.emitContentChanged(type); }
    Q_INVOKABLE void clear() { m_service.calls.clear(); }
    Q_INVOKABLE QVariantList calls() const
    {
        QVariantList calls;
        for (const RecordingService::Call &call : m_service.calls)
            calls << QVariantMap { { QStringLiteral("method"), call.method }, { QStringLiteral("arguments"), call.arguments } };
        return calls;
    }

private:
    RecordingService m_service;
};

#endif
