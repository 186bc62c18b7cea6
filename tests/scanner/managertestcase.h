#ifndef MANAGERTESTCASE_H
#define MANAGERTESTCASE_H

#include "dbmanager.h"
#include "messagelog.h"
#include "signalrecorder.h"
#include "testdatabase.h"

#include <QImage>
#include <QProcess>
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
        m_sql.reset();
        m_db.reset();
        for (const char *suffix : { "", "-wal", "-shm" })
            QFile::remove(TestDatabase::indexPath() + QLatin1String(suffix));
        m_db.reset(new DbManager);
        m_sql.reset(new TestDatabase);
        SignalRecorder::clear();
    }

    // The records of a failed statement, as patterns: function, message, error, statement.
    static QStringList failure(const char *function, const char *message, const QString &statement)
    {
        return { '^' + QRegularExpression::escape(function) + '$', '^' + QRegularExpression::escape(message) + '$',
                 QStringLiteral("^QSqlError\\("), "^\"" + QRegularExpression::escape(statement) };
    }

    // The warnings match these patterns, in this order, and there are no others.
    static void compareWarnings(const MessageLog &log, const QStringList &patterns)
    {
        QStringList warnings = log.warnings();
        for (int i = 0; i < qMin(warnings.size(), patterns.size()); ++i) {
            if (QRegularExpression(patterns.at(i)).match(warnings.at(i)).hasMatch())
                warnings[i] = patterns.at(i);
        }
        QCOMPARE(warnings, patterns);
    }

    // A 64x48 JPEG; tags are exiv2 modify commands.
    static bool writeJpeg(const QString &path, const QStringList &tags = {})
    {
        QImage image(64, 48, QImage::Format_RGB32);
        image.fill(Qt::darkCyan);
        QStringList arguments;
        for (const QString &tag : tags)
            arguments << QStringLiteral("-M") << tag;
        return image.save(path, "JPG") && (tags.isEmpty() || QProcess::execute("exiv2", arguments << path) == 0);
    }

    std::unique_ptr<DbManager> m_db;
    std::unique_ptr<TestDatabase> m_sql;
};

#endif
