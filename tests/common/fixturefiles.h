#ifndef FIXTUREFILES_H
#define FIXTUREFILES_H

#include <QDateTime>
#include <QDir>
#include <QFile>
#include <QFileInfo>

// Files for package fixtures. Every write gets a modification time of its own,
// a second later than the one before, so a change is seen however fast the
// test runs.
namespace FixtureFiles {

inline QDateTime nextTime()
{
    static QDateTime s_time = QDateTime::currentDateTime().addDays(-1);
    s_time = s_time.addSecs(1);
    return s_time;
}

inline bool write(const QString &path, const QByteArray &content)
{
    QDir().mkpath(QFileInfo(path).absolutePath());
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly | QIODevice::Truncate) || file.write(content) != content.size())
        return false;
    return file.flush() && file.setFileTime(nextTime(), QFileDevice::FileModificationTime);
}

inline bool touch(const QString &path)
{
    QFile file(path);
    return file.open(QIODevice::ReadWrite) && file.setFileTime(nextTime(), QFileDevice::FileModificationTime);
}

}

#endif
