#include "indexfixture.h"

#include <QCryptographicHash>
#include <QDirIterator>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

using namespace Fixture;

// The sample content that scripts/run shows: generated twice into the sandbox's
// sysroot, then read by the engine as the service reads it. Every file the
// generator makes must be accounted for in the index.
class tst_SampleContent : public QObject
{
    Q_OBJECT

    const QString m_root = qEnvironmentVariable("THEMELET_SYSROOT");
    TestDatabase m_db { serviceIndex() };

    static bool generate(const QString &root)
    {
        QProcess process;
        process.setProcessChannelMode(QProcess::ForwardedErrorChannel);
        process.start(QStringLiteral(THEMELET_SOURCE_DIR "/scripts/make-sample-content"), { root });
        return process.waitForFinished(900000) && process.exitStatus() == QProcess::NormalExit && process.exitCode() == 0;
    }

    // Path, modification time and checksum of every file below root.
    static QStringList snapshot(const QString &root)
    {
        QStringList entries;
        QDirIterator it(root, QDir::Files | QDir::Hidden | QDir::System, QDirIterator::Subdirectories);
        while (it.hasNext()) {
            QFile file(it.next());
            if (!file.open(QIODevice::ReadOnly))
                return { "unreadable: " + file.fileName() };
            entries << QStringLiteral("%1 %2 %3").arg(file.fileName().mid(root.size()),
                                                       QString::number(QFileInfo(file).lastModified().toMSecsSinceEpoch()),
                                                       QString::fromLatin1(QCryptographicHash::hash(file.readAll(), QCryptographicHash::Md5).toHex()));
        }
        entries.sort();
        return entries;
    }

    QString value(const QString &statement, const QString &path)
    {
        const QFileInfo info(path);
        return m_db.rows(statement.arg(info.absolutePath(), info.fileName())).join(QLatin1Char(';'));
    }

    // Orientation and date as exiv2 reads them, by file name.
    static QHash<QString, QString> exifTags(const QString &directory)
    {
        QProcess process;
        process.setWorkingDirectory(directory);
        QStringList arguments { "-g", "Exif.Image.Orientation", "-g", "Exif.Photo.DateTimeOriginal", "-Pkv" };
        arguments << QDir(directory).entryList({ "*.jpg" }, QDir::Files);
        process.start(QStringLiteral("exiv2"), arguments);
        process.waitForFinished();
        QHash<QString, QString> tags;
        const QRegularExpression line(QStringLiteral("^(\\S+)\\s+Exif\\.\\S+\\.(\\S+)\\s+(.*)$"));
        for (const QString &text : QString::fromUtf8(process.readAllStandardOutput()).split(QLatin1Char('\n'))) {
            const QRegularExpressionMatch match = line.match(text);
            if (match.hasMatch())
                tags[match.captured(1)] += match.captured(2) + '=' + match.captured(3) + ' ';
        }
        return tags;
    }

private slots:
    void idempotent()
    {
        QVERIFY(!m_root.isEmpty());
        QVERIFY(generate(m_root));
        const QStringList first = snapshot(m_root);
        QVERIFY(first.size() > 60);
        QVERIFY(generate(m_root));
        QCOMPARE(snapshot(m_root), first);

        // A file that went missing comes back with the same bytes.
        const QString wallpaper = m_root + "/usr/share/themelet/ember/images/ember.jpg";
        const QString before = first.filter(QRegularExpression("^/usr/share/themelet/ember/images/ember.jpg ")).value(0).section(' ', 2);
        QVERIFY(QFile::remove(wallpaper) && generate(m_root));
        QCOMPARE(snapshot(m_root).filter("/usr/share/themelet/ember/images/ember.jpg ").value(0).section(' ', 2), before);
    }

    void indexed()
    {
        // What the service does at its start with --watch on the Pictures.
        for (const QString &path : InstallManager::installPaths())
            installer()->appendDirectory(path);
        QVERIFY(FileManager::instance()->appendDirectory(m_root + "/Pictures", FileManager::UserScope, FileManager::ScanNew));
        QVERIFY(waitIdle());

        const QString fileRow = QStringLiteral("SELECT mimeType, ifnull(category, '') FROM file JOIN directory ON directory.id = directoryId "
                                               "WHERE path = '%1' AND fileName = '%2'");
        const QString themeletRow = QStringLiteral("SELECT file.displayName, homeWallpaper, (SELECT group_concat(resourceType) FROM "
                                                   "resource WHERE resource.fileId = file.id) FROM file JOIN directory ON "
                                                   "directory.id = directoryId JOIN themelet ON themelet.fileId = file.id "
                                                   "WHERE path = '%1' AND fileName = '%2'");
        const QString imageRow = QStringLiteral("SELECT width * height, orientation, dateTaken FROM image JOIN file ON file.id = image.fileId "
                                                "JOIN directory ON directory.id = directoryId WHERE path = '%1' AND fileName = '%2'");
        const QString resourceUse = QStringLiteral("SELECT count(*) FROM resource JOIN file ON file.id = resourceId JOIN directory ON "
                                                   "directory.id = directoryId WHERE path = '%1' AND fileName = '%2'");
        const QStringList wallpapers = m_db.rows("SELECT homeWallpaper FROM themelet");
        const QHash<QString, QString> tags = exifTags(m_root + "/Pictures");

        // The categories the tone pack's index gives, by file name.
        QHash<QString, QString> categories;
        QFile index(m_root + "/usr/share/sounds/orbaline/tones.index");
        QVERIFY(index.open(QIODevice::ReadOnly));
        for (const QJsonValue entry : QJsonDocument::fromJson(index.readAll()).object().value("files").toArray())
            categories[entry["fileName"].toString()] = entry["category"].toString();
        QCOMPARE(categories.size(), 10);

        int photos = 0, themelets = 0, tones = 0;
        QDirIterator it(m_root, QDir::Files | QDir::Hidden, QDirIterator::Subdirectories);
        while (it.hasNext()) {
            const QString path = it.next(), relative = path.mid(m_root.size() + 1), name = it.fileName();
            const QString kind = relative.section('/', 0, -2);
            if (relative.startsWith("Pictures/")) {
                QCOMPARE(value(fileRow, path), QStringLiteral("image/jpeg|"));
                const QString image = value(imageRow, path);
                const QString tag = tags.value(name);
                QVERIFY2(image.startsWith("76800|"), qPrintable(relative + ": " + image));
                QCOMPARE(image.section('|', 1, 1), tag.section("Orientation=", 1).section(' ', 0, 0));
                QCOMPARE(image.section('|', 2).left(19), QDateTime::fromString(tag.section("DateTimeOriginal=", 1).trimmed(),
                                                                               "yyyy:MM:dd HH:mm:ss").toString(Qt::ISODate));
                ++photos;
            } else if (relative.startsWith("usr/share/themelet/") && name.endsWith(".themelet")) {
                QCOMPARE(value(fileRow, path), QStringLiteral("application/x-vorka-themelet|"));
                QStringList row = value(themeletRow, path).split('|');
                QStringList resources = row.takeLast().split(',');
                resources.sort();
                const QString base = QFileInfo(path).completeBaseName();
                // Aurora's display name comes from its catalogue.
                const QString display = base == "aurora" ? QStringLiteral("Aurora") : base.left(1).toUpper() + base.mid(1);
                QCOMPARE(row.join('|'), QStringLiteral("%1|%2/images/%3.jpg").arg(display, it.fileInfo().absolutePath(), base));
                QCOMPARE(resources.join(','), QStringLiteral("chatToneFile,clockAlarmToneFile,mailToneFile,messageToneFile,ringerToneFile"));
                ++themelets;
            } else if (relative.startsWith("usr/share/themelet/") && kind.endsWith("/images")) {
                QVERIFY2(wallpapers.contains(path), qPrintable(relative));
            } else if (relative.startsWith("usr/share/themelet/") && kind.endsWith("/sounds")) {
                QVERIFY2(value(fileRow, path).startsWith("audio/"), qPrintable(relative));
                QVERIFY2(value(resourceUse, path).toInt() > 0, qPrintable(relative));
            } else if (relative == "usr/share/sounds/orbaline/tones.index") {
                QCOMPARE(value(fileRow, path), QStringLiteral("application/x-vorka-index|"));
            } else if (kind == "usr/share/sounds/orbaline/tones") {
                const QString row = value(fileRow, path);
                QVERIFY2(row.startsWith("audio/"), qPrintable(relative + ": " + row));
                QCOMPARE(row.section('|', 1), categories.value(name));
                ++tones;
            } else if (kind == "usr/share/translations" && name.endsWith(".qm")) {
                // Catalogues are read for names, not indexed; Aurora's name above proves the use.
                QVERIFY(QFileInfo(path).size() > 0);
            } else {
                QCOMPARE(relative, QStringLiteral("etc/themelet/profiles.ini"));
            }
        }
        QVERIFY2(photos >= 30, qPrintable(QString::number(photos)));
        QVERIFY(themelets >= 3);
        QCOMPARE(tones, categories.size());
    }
};

QTEST_GUILESS_MAIN(tst_SampleContent)
#include "tst_samplecontent.moc"
