// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "indexfixture.h"

#include <QDirIterator>

using namespace Fixture;

// The sample content that scripts/run shows: generated into the sandbox's
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

    QString rows(const QString &statement) { return m_db.rows(statement).join(';'); }

private slots:
    void indexed()
    {
        QVERIFY(!m_root.isEmpty() && generate(m_root));
        // What the service does at its start with --watch on the Pictures.
        for (const QString &path : InstallManager::installPaths())
            installer()->appendDirectory(path);
        QVERIFY(FileManager::instance()->appendDirectory(m_root + "/Pictures", FileManager::UserScope, FileManager::ScanNew));
        QVERIFY(waitIdle());

        // Each file by where it lies: the type of its row, a wallpaper of a themelet, or not indexed.
        const QList<QPair<QString, QString>> kinds { { "^Pictures/[^/]+\\.jpg$", "image/jpeg" },
                                                     { "^usr/share/themelet/\\w+/\\w+\\.themelet$", "application/x-vorka-themelet" },
                                                     { "^usr/share/themelet/\\w+/images/\\w+\\.jpg$", "wallpaper" },
                                                     { "^usr/share/(themelet/\\w+/sounds|sounds/orbaline/tones)/[\\w-]+\\.\\w+$", "audio/" },
                                                     { "^usr/share/sounds/orbaline/tones\\.index$", "application/x-vorka-index" },
                                                     { "^usr/share/translations/[\\w-]+\\.qm$|^etc/themelet/profiles\\.ini$", "" } };
        const QStringList wallpapers = m_db.rows("SELECT homeWallpaper FROM themelet");
        for (QDirIterator it(m_root, QDir::Files | QDir::Hidden, QDirIterator::Subdirectories); it.hasNext();) {
            const QString path = it.next(), relative = path.mid(m_root.size() + 1);
            const auto kind = std::find_if(kinds.begin(), kinds.end(), [&](const QPair<QString, QString> &kind) {
                return QRegularExpression(kind.first).match(relative).hasMatch();
            });
            QVERIFY2(kind != kinds.end(), qPrintable("unaccounted for: " + relative));
            const QString type = rows(QStringLiteral("SELECT mimeType FROM file JOIN directory ON directory.id = directoryId WHERE path = '%1' "
                                                     "AND fileName = '%2'").arg(it.fileInfo().absolutePath(), it.fileName()));
            QVERIFY2(kind->second == "wallpaper" ? wallpapers.contains(path) : kind->second.isEmpty() || type.startsWith(kind->second), qPrintable(relative + ": " + type));
        }

        // Photos with four orientations and every date; themelets with their five tones; the tone pack's categories.
        QCOMPARE(rows("SELECT count(*), count(DISTINCT orientation), count(dateTaken), min(width * height), max(width * height) FROM image"
                      " JOIN file ON file.id = fileId JOIN directory ON directory.id = directoryId WHERE path = '" + m_root + "/Pictures'"),
                 QString("36|4|36|76800|76800"));
        QString themelets;
        for (const QString &name : { "aurora", "dusk", "ember", "lagoon" })
            themelets += QStringLiteral(";%1|%2/usr/share/themelet/%3/images/%3.jpg|5").arg(name.left(1).toUpper() + name.mid(1), m_root, name);
        // Aurora's display name comes from its catalogue.
        QCOMPARE(rows("SELECT displayName, homeWallpaper, (SELECT count(*) FROM resource WHERE resource.fileId = themelet.fileId) "
                      "FROM themelet JOIN file ON id = fileId ORDER BY displayName"), themelets.mid(1));
        QCOMPARE(rows("SELECT category, count(*) FROM file JOIN directory ON directory.id = directoryId WHERE path = '"
                      + m_root + "/usr/share/sounds/orbaline/tones' GROUP BY category"), QString("Alarm|2;Customer|2;Default|2;Ringtone|4"));
    }
};

QTEST_GUILESS_MAIN(tst_SampleContent)
#include "tst_samplecontent.moc"
