// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// .index files through IndexManager::updateMetaData: parsing, aliases and the
// merge against the rows of the described directory, which keep what earlier
// inputs made of them.
#include "contentmanager.h"
#include "fuzzsupport.h"

namespace {
QString s_root, s_tones;
ContentManager *s_manager = nullptr;
qint64 s_indexId = 0;
}

extern "C" int LLVMFuzzerInitialize(int *, char ***)
{
    s_root = Fuzz::start() + QStringLiteral("/fuzz");
    s_tones = s_root + QStringLiteral("/pack/tones");
    for (const char *name : { "a.ogg", "b.ogg", "c.ogg", "d e.ogg", "\xc3\xa4.ogg" })
        Fuzz::write(s_tones + QLatin1Char('/') + QString::fromUtf8(name), "ogg");
    Fuzz::write(s_tones + QStringLiteral(".index"), "{}");
    if (!ContentManager::managerFromType(0) || !(s_manager = ContentManager::managerFromType(7)))
        Fuzz::fail(QStringLiteral("no index manager"));
    Fuzz::sql(QStringLiteral("INSERT INTO directory (path, scope) VALUES ('%1/pack', 2)").arg(s_root));
    Fuzz::sql(QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, permissions, metadataCurrent) "
                             "SELECT MAX(id), 'application/x-vorka-index', 'tones.index', 1, 1 FROM directory"));
    s_indexId = Fuzz::sql(QStringLiteral("SELECT MAX(id) FROM file")).toLongLong();
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    Fuzz::write(s_tones + QStringLiteral(".index"), QByteArray(reinterpret_cast<const char *>(data), int(size)));
    Fuzz::sql(QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE id = %1").arg(s_indexId));
    for (int step = 0; s_manager->updateMetaData(); ++step) {
        if (step > 1)
            Fuzz::fail(QStringLiteral("the index is read more than once"));
    }
    // Rows name files that are there, by their own name.
    QSqlQuery rows(DbManager::instance());
    rows.exec(QStringLiteral("SELECT fileName FROM file JOIN directory ON directoryId = directory.id WHERE path = '%1'").arg(s_tones));
    while (rows.next()) {
        const QString name = rows.value(0).toString();
        if (name.isEmpty() || name.contains(QLatin1Char('/')) || !QFileInfo(s_tones + QLatin1Char('/') + name).isFile())
            Fuzz::fail(QStringLiteral("a row for no file: ") + name);
    }
    Fuzz::checkIndex(s_root);
    return 0;
}
