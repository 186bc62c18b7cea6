#include "testdatabase.h"

#include "queryagent.h"

#include <QDir>
#include <QFileInfo>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QTest>
#include <QUuid>

QString TestDatabase::indexPath()
{
    return QueryAgent::databaseUrl(0).toLocalFile();
}

QString TestDatabase::errorText(const char *code, const char *text, const char *driverText)
{
    return QStringLiteral("QSqlError(\"%1\", \"%2\", \"%3\")")
            .arg(QLatin1String(code), QLatin1String(driverText), QLatin1String(text));
}

TestDatabase::TestDatabase(const QString &path)
    : m_name(QUuid::createUuid().toString())
{
    QDir().mkpath(QFileInfo(path).absolutePath());
    QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), m_name);
    db.setDatabaseName(path);
    if (!db.open())
        qWarning() << "TestDatabase: cannot open" << path << db.lastError();
}

TestDatabase::~TestDatabase()
{
    {
        QSqlDatabase db = QSqlDatabase::database(m_name, false);
        db.close();
    }
    QSqlDatabase::removeDatabase(m_name);
}

bool TestDatabase::isOpen() const
{
    return QSqlDatabase::database(m_name, false).isOpen();
}

bool TestDatabase::exec(const QStringList &statements)
{
    QSqlQuery query(QSqlDatabase::database(m_name, false));
    for (const QString &statement : statements) {
        if (!query.exec(statement)) {
            QTest::qFail(qPrintable(QStringLiteral("SQL failed: %1: %2")
                                            .arg(statement, query.lastError().text())),
                         __FILE__, __LINE__);
            return false;
        }
    }
    return true;
}

QVariant TestDatabase::value(const QString &statement)
{
    QSqlQuery query(QSqlDatabase::database(m_name, false));
    if (!query.exec(statement) || !query.next())
        return QVariant();
    return query.value(0);
}

QStringList TestDatabase::rows(const QString &statement)
{
    QStringList result;
    QSqlQuery query(QSqlDatabase::database(m_name, false));
    if (!query.exec(statement)) {
        result << QStringLiteral("ERROR: ") + query.lastError().text();
        return result;
    }
    while (query.next()) {
        QStringList columns;
        for (int i = 0; i < query.record().count(); ++i)
            columns << (query.isNull(i) ? QStringLiteral("NULL") : query.value(i).toString());
        result << columns.join(QLatin1Char('|'));
    }
    return result;
}
