// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// Writes the content that the QML tests list, and its index, as the service would,
// in another process than the client: themelets, tones and photos.
#include "indexfixture.h"
#include "sysroot.h"

#include <QGuiApplication>

using namespace Fixture;

namespace {

QByteArray themelet(const QString &name, int day, const QString &tone = QString())
{
    return QStringLiteral(R"({"wallpaper": "%1.jpg", "displayName": "%2", "timestamp": "2014-05-0%3T12:00:00",)"
                          R"( "highlightColor": "#ffcc66", "version": 2%4})")
            .arg(name.toLower(), name, QString::number(day),
                 tone.isEmpty() ? QString() : QStringLiteral(R"(, "ringerToneFile": {"file": "%1", "enabled": 1})").arg(tone))
            .toUtf8();
}

bool writeContent(const QString &pictures)
{
    // Favourites come first, each group by time; Ocean, the earlier, is made a non-favourite below.
    const QString package = Sysroot::path(QStringLiteral("/usr/share/themelet/nature"));
    if (!writeTree(package, { "images/aurora.jpg", "images/ocean.jpg", "sounds/dusk.ogg" }, "x")
            || !write(package + "/aurora.themelet", themelet("Aurora", 2, "dusk.ogg"))
            || !write(package + "/ocean.themelet", themelet("Ocean", 1)))
        return false;

    // An index describes the directory of its own name.
    const QString tones = Sysroot::path(QStringLiteral("/usr/share/sounds/pack/tones"));
    const QByteArray index = R"({"files": [{"fileName": "alarm.ogg", "displayName": "Alarm", "category": "Default"},)"
                             R"( {"fileName": "custom.ogg", "displayName": "Custom", "category": "Customer"},)"
                             R"( {"fileName": "ring.ogg", "displayName": "Ring", "category": "Ringtone"}]})";
    if (!writeTree(tones, { "alarm.ogg", "custom.ogg", "ring.ogg" }, "x") || !write(tones + ".index", index))
        return false;

    // Photos by the time taken, which their names don't follow.
    int day = 0;
    QDir().mkpath(pictures);
    for (const char *name : { "b.jpg", "ab.jpg", "a.jpg", "abc.jpg" }) {
        if (!writeJpeg(pictures + '/' + name, { QString("set Exif.Photo.DateTimeOriginal 2014:05:0%1 12:00:00").arg(++day) }))
            return false;
    }
    return true;
}

}

int main(int argc, char **argv)
{
    QGuiApplication app(argc, argv);
    DbManager::instance();
    FileManager *files = FileManager::instance();
    const QString pictures = qEnvironmentVariable("THEMELET_SANDBOX") + QStringLiteral("/pictures");
    if (!files || !writeContent(pictures))
        return 1;
    for (const QString &path : InstallManager::installPaths())
        installer()->appendDirectory(path);
    files->appendDirectory(pictures, FileManager::UserScope, FileManager::ScanAlways);
    if (!waitIdle())
        return 1;
    TestDatabase db;
    return db.exec(QStringLiteral("UPDATE themelet SET favorite = 0 WHERE fileId = "
                                   "(SELECT id FROM file WHERE fileName = 'ocean.themelet')")) ? 0 : 1;
}
