// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// Seeded data sets for the benchmarks:
//   bench_gen tree DIR FILES DIRS SEED     a two-level tree of tones and documents
//   bench_gen jpegs DIR FILES SEED         pictures with EXIF date and orientation
//   bench_gen photodb DIR PHOTOS SEED      an index holding that many photo rows
//                                          (under $XDG_DATA_HOME, made by the engine)
#include "benchcommon.h"
#include "content.h"
#include "dbmanager.h"

#include <QBuffer>
#include <QCoreApplication>
#include <QDateTime>
#include <QDir>
#include <QFile>
#include <QImage>
#include <QPainter>
#include <QRandomGenerator>
#include <QSqlError>
#include <QSqlQuery>

#include <exiv2/exiv2.hpp>

#include <cstdio>

void Content::signalChanged(int)
{
}

namespace {

const char *const Words[] = { "ring", "alarm", "beep", "chime", "note", "song", "voice",
                              "memo", "track", "demo", "mix", "take", "call", "bell" };

struct Kind
{
    const char *suffix;
    QByteArray header;
    int weight;
};

QString wordName(QRandomGenerator &rng, int index)
{
    const int words = int(sizeof(Words) / sizeof(*Words));
    return QStringLiteral("%1_%2_%3")
            .arg(QLatin1String(Words[rng.bounded(words)]))
            .arg(QLatin1String(Words[rng.bounded(words)]))
            .arg(index, 5, 10, QLatin1Char('0'));
}

bool writeFile(const QString &path, const QByteArray &bytes)
{
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly) || file.write(bytes) != bytes.size()) {
        std::fprintf(stderr, "cannot write %s\n", qPrintable(path));
        return false;
    }
    return true;
}

// Leaves of two levels: about 50 leaves under each first-level directory.
int tree(const QString &root, int files, int dirs, quint32 seed)
{
    QRandomGenerator rng(seed);
    const QVector<Kind> kinds = {
        { ".mp3", QByteArray("ID3\x03\x00\x00\x00\x00\x00\x00", 10), 40 },
        { ".ogg", QByteArray("OggS\x00\x02", 6), 25 },
        { ".wav", QByteArray("RIFF\x24\x00\x00\x00WAVEfmt ", 16), 10 },
        { ".txt", QByteArray("notes\n"), 15 },
        { ".pdf", QByteArray("%PDF-1.4\n"), 10 },
    };
    const int groups = qMax(1, dirs / 50);
    int made = 0;
    for (int d = 0; d < dirs; ++d) {
        const QString dir = QStringLiteral("%1/g%2/d%3").arg(root).arg(d % groups, 3, 10, QLatin1Char('0'))
                                    .arg(d, 4, 10, QLatin1Char('0'));
        if (!QDir().mkpath(dir))
            return 1;
        const int count = files / dirs + (d < files % dirs ? 1 : 0);
        for (int f = 0; f < count; ++f) {
            int pick = rng.bounded(100);
            const Kind *kind = &kinds.first();
            for (const Kind &k : kinds) {
                if (pick < k.weight) {
                    kind = &k;
                    break;
                }
                pick -= k.weight;
            }
            QByteArray bytes = kind->header;
            const int size = 64 + rng.bounded(448);
            while (bytes.size() < size)
                bytes.append(char(rng.bounded(256)));
            if (!writeFile(dir + QLatin1Char('/') + wordName(rng, made) + QLatin1String(kind->suffix), bytes))
                return 1;
            ++made;
        }
    }
    std::printf("tree files=%d dirs=%d\n", made, dirs);
    return 0;
}

QByteArray templateJpeg(QRandomGenerator &rng, int width, int height)
{
    QImage image(width, height, QImage::Format_RGB32);
    QPainter painter(&image);
    QLinearGradient gradient(0, 0, width, height);
    gradient.setColorAt(0, QColor::fromRgb(rng.generate() | 0xff000000));
    gradient.setColorAt(1, QColor::fromRgb(rng.generate() | 0xff000000));
    painter.fillRect(image.rect(), gradient);
    painter.end();
    QByteArray bytes;
    QBuffer buffer(&bytes);
    buffer.open(QIODevice::WriteOnly);
    image.save(&buffer, "JPEG", 80);
    return bytes;
}

// The picture with an APP1 EXIF segment put right after its SOI marker.
QByteArray withExif(const QByteArray &jpeg, const QDateTime &taken, int orientation)
{
    Exiv2::ExifData exif;
    exif["Exif.Image.Make"] = "Orbaline";
    exif["Exif.Image.Model"] = "Bench";
    exif["Exif.Image.Orientation"] = uint16_t(orientation);
    exif["Exif.Photo.DateTimeOriginal"] =
            taken.toString(QStringLiteral("yyyy:MM:dd HH:mm:ss")).toStdString();
    Exiv2::Blob blob;
    Exiv2::ExifParser::encode(blob, Exiv2::littleEndian, exif);

    QByteArray segment("\xff\xe1", 2);
    const int length = int(blob.size()) + 6 + 2;
    segment.append(char(length >> 8)).append(char(length & 0xff));
    segment.append("Exif\0\0", 6);
    segment.append(reinterpret_cast<const char *>(blob.data()), int(blob.size()));
    return jpeg.left(2) + segment + jpeg.mid(2);
}

int jpegs(const QString &dir, int files, quint32 seed)
{
    QRandomGenerator rng(seed);
    if (!QDir().mkpath(dir))
        return 1;
    QVector<QByteArray> templates;
    const QSize sizes[] = { { 160, 120 }, { 120, 160 }, { 320, 240 }, { 240, 320 }, { 200, 150 } };
    for (const QSize &s : sizes)
        templates.append(templateJpeg(rng, s.width(), s.height()));
    const int orientations[] = { 1, 1, 1, 6, 8, 3 };
    const QDateTime epoch(QDate(2012, 1, 1), QTime(0, 0));
    for (int i = 0; i < files; ++i) {
        const QDateTime taken = epoch.addSecs(rng.bounded(12 * 365 * 86400));
        const QByteArray bytes = withExif(templates.at(rng.bounded(templates.size())), taken,
                                          orientations[rng.bounded(6)]);
        if (!writeFile(QStringLiteral("%1/IMG_%2.jpg").arg(dir).arg(i, 6, 10, QLatin1Char('0')), bytes))
            return 1;
    }
    std::printf("jpegs files=%d\n", files);
    return 0;
}

// The index as themeletd leaves it after reading that many pictures, 100 a directory.
int photodb(const QString &root, int photos, quint32 seed)
{
    QRandomGenerator rng(seed);
    DbManager &db = DbManager::instance();
    if (!db.isOpen())
        return 1;
    QSqlQuery q(db);
    db.transaction();
    const int perDir = 100;
    const QDateTime epoch(QDate(2012, 1, 1), QTime(0, 0));
    QVariantList dirIds, dirParents, dirPaths;
    QVariantList fileIds, fileDirs, fileNames, fileTimes, imageDates, widths, heights, orientations;
    const int dirs = (photos + perDir - 1) / perDir;
    dirIds << 1;
    dirParents << QVariant(QVariant::LongLong);
    dirPaths << root;
    for (int d = 0; d < dirs; ++d) {
        dirIds << d + 2;
        dirParents << 1;
        dirPaths << QStringLiteral("%1/d%2").arg(root).arg(d, 4, 10, QLatin1Char('0'));
    }
    for (int i = 0; i < photos; ++i) {
        fileIds << i + 1;
        fileDirs << i / perDir + 2;
        fileNames << QStringLiteral("IMG_%1.jpg").arg(i, 6, 10, QLatin1Char('0'));
        const QDateTime taken = epoch.addSecs(rng.bounded(12 * 365 * 86400));
        fileTimes << taken;
        imageDates << taken;
        const bool portrait = rng.bounded(4) == 0;
        widths << (portrait ? 3024 : 4032);
        heights << (portrait ? 4032 : 3024);
        orientations << (portrait ? 6 : 1);
    }
    bool ok = q.prepare(QStringLiteral("INSERT INTO directory (id, parentId, path, scope) VALUES (?, ?, ?, 0)"));
    q.addBindValue(dirIds);
    q.addBindValue(dirParents);
    q.addBindValue(dirPaths);
    ok = ok && q.execBatch();
    ok = ok && q.prepare(QStringLiteral(
            "INSERT INTO file (id, directoryId, mimeType, fileName, modificationTime, permissions, metadataCurrent)"
            " VALUES (?, ?, 'image/jpeg', ?, ?, 3, 1)"));
    q.addBindValue(fileIds);
    q.addBindValue(fileDirs);
    q.addBindValue(fileNames);
    q.addBindValue(fileTimes);
    ok = ok && q.execBatch();
    ok = ok && q.prepare(QStringLiteral(
            "INSERT INTO image (fileId, dateTaken, width, height, orientation) VALUES (?, ?, ?, ?, ?)"));
    q.addBindValue(fileIds);
    q.addBindValue(imageDates);
    q.addBindValue(widths);
    q.addBindValue(heights);
    q.addBindValue(orientations);
    ok = ok && q.execBatch();
    if (!ok) {
        std::fprintf(stderr, "photodb: %s\n", qPrintable(q.lastError().text()));
        db.rollback();
        return 1;
    }
    db.commit();
    q.exec(QStringLiteral("PRAGMA wal_checkpoint(TRUNCATE)"));
    std::printf("photodb photos=%d\n", photos);
    return 0;
}

}

int main(int argc, char **argv)
{
    QCoreApplication app(argc, argv);
    const QStringList args = app.arguments();
    if (args.size() >= 6 && args.at(1) == QLatin1String("tree"))
        return tree(args.at(2), args.at(3).toInt(), args.at(4).toInt(), args.at(5).toUInt());
    if (args.size() >= 5 && args.at(1) == QLatin1String("jpegs"))
        return jpegs(args.at(2), args.at(3).toInt(), args.at(4).toUInt());
    if (args.size() >= 5 && args.at(1) == QLatin1String("photodb"))
        return photodb(args.at(2), args.at(3).toInt(), args.at(4).toUInt());
    std::fprintf(stderr, "usage: bench_gen tree DIR FILES DIRS SEED | jpegs DIR FILES SEED | photodb DIR PHOTOS SEED\n");
    return 2;
}
