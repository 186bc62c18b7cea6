#ifndef TESTDATABASE_H
#define TESTDATABASE_H

#include <QSqlDatabase>
#include <QStringList>
#include <QVariant>

// A connection of the test's own to the index file (or any file), for filling
// tables by SQL and reading them back without going through the engine.
class TestDatabase
{
public:
    // The index file of the sandbox, as QueryAgent::databaseUrl(0) names it.
    static QString indexPath();

    // A QSqlError in its debug form, as log records show it.
    static QString errorText(const char *code, const char *text,
                             const char *driverText = "Unable to execute statement");

    explicit TestDatabase(const QString &path = indexPath());
    ~TestDatabase();

    bool isOpen() const;
    // Runs each statement; fails the current test on the first error.
    bool exec(const QStringList &statements);
    bool exec(const QString &statement) { return exec(QStringList { statement }); }
    // First column of the first row, or an invalid QVariant.
    QVariant value(const QString &statement);
    // All rows, columns joined by '|', NULL as "NULL".
    QStringList rows(const QString &statement);

private:
    QString m_name;
};

#endif
