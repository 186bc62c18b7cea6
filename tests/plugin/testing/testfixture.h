#ifndef TESTFIXTURE_H
#define TESTFIXTURE_H

#include <QObject>
#include <QString>
#include <QStringList>

// What a QML test needs from outside its engine: the sandbox's paths, the
// dconf tool as another process, and the program that writes the index.
class TestFixture : public QObject
{
    Q_OBJECT
    Q_PROPERTY(QString sandbox READ sandbox CONSTANT)
public:
    QString sandbox() const;

    // The tool's output, trimmed; a failure is a warning, which fails the test.
    Q_INVOKABLE QString dconf(const QStringList &arguments) const;
    // Runs the index writer (qmlfixture) with these arguments to its end.
    Q_INVOKABLE bool index(const QStringList &arguments = QStringList()) const;

private:
    static QString run(const QString &program, const QStringList &arguments, bool *ok);
};

#endif
