#ifndef MANAGERTESTCASE_H
#define MANAGERTESTCASE_H

#include "dbmanager.h"
#include "signalrecorder.h"
#include "testdatabase.h"

#include <QFile>
#include <QRegularExpression>
#include <QTest>

#include <memory>

// A fresh index file for each test function, written through a local
// DbManager and read back through TestDatabase.
class ManagerTestCase
{
protected:
    void openFreshIndex()
    {
        closeIndex();
        for (const char *suffix : { "", "-wal", "-shm" })
            QFile::remove(TestDatabase::indexPath() + QLatin1String(suffix));
        m_db.reset(new DbManager);
        m_sql.reset(new TestDatabase);
        SignalRecorder::clear();
    }

    void closeIndex()
    {
        m_sql.reset();
        m_db.reset();
    }

    // The four records of QueryActor::warn and QueryActor::rollback.
    static void expectQueryWarning(const char *function, const char *message, const QString &statement)
    {
        QTest::ignoreMessage(QtWarningMsg, function);
        QTest::ignoreMessage(QtWarningMsg, message);
        QTest::ignoreMessage(QtWarningMsg, QRegularExpression(QStringLiteral("^QSqlError\\(")));
        QTest::ignoreMessage(QtWarningMsg, qPrintable(QLatin1Char('"') + statement + QLatin1Char('"')));
    }

    std::unique_ptr<DbManager> m_db;
    std::unique_ptr<TestDatabase> m_sql;
};

#endif
