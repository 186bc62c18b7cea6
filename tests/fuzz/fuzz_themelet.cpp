// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// .themelet files through ThemeletManager::updateMetaData: parsing, the merge
// with existing rows and the write phase. The input is split at byte 0x1e into
// up to three files of one package; only the files given are rewritten and
// marked unread, so later inputs re-read rows that earlier ones made.
#include "contentmanager.h"
#include "fuzzsupport.h"

#include <QJsonDocument>

namespace {
QString s_root, s_package;
ContentManager *s_manager = nullptr;
qint64 s_ids[3] = {};
}

extern "C" int LLVMFuzzerInitialize(int *, char ***)
{
    s_root = Fuzz::start() + QStringLiteral("/fuzz");
    s_package = s_root + QStringLiteral("/pack");
    Fuzz::write(s_package + QStringLiteral("/images/w.jpg"), "jpeg");
    Fuzz::write(s_package + QStringLiteral("/sounds/a.ogg"), "ogg");
    if (!(s_manager = ContentManager::managerFromType(1)))
        Fuzz::fail(QStringLiteral("no themelet manager"));
    Fuzz::sql(QStringLiteral("INSERT INTO directory (path, scope) VALUES ('%1', 2)").arg(s_package));
    for (int i = 0; i < 3; ++i) {
        Fuzz::write(s_package + QStringLiteral("/t%1.themelet").arg(i), "{}");
        Fuzz::sql(QStringLiteral("INSERT INTO file (directoryId, mimeType, fileName, permissions, metadataCurrent) "
                                 "SELECT MAX(id), 'application/x-vorka-themelet', 't%1.themelet', 1, 1 FROM directory").arg(i));
        s_ids[i] = Fuzz::sql(QStringLiteral("SELECT MAX(id) FROM file")).toLongLong();
    }
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    const QList<QByteArray> parts = QByteArray::fromRawData(reinterpret_cast<const char *>(data), int(size)).split('\x1e').mid(0, 3);
    for (int i = 0; i < parts.size(); ++i) {
        Fuzz::write(s_package + QStringLiteral("/t%1.themelet").arg(i), parts.at(i));
        Fuzz::sql(QStringLiteral("UPDATE file SET metadataCurrent = 0 WHERE id = %1").arg(s_ids[i]));
    }
    for (int step = 0; s_manager->updateMetaData(); ++step) {
        if (step > 3)
            Fuzz::fail(QStringLiteral("the update doesn't come to an end"));
    }
    if (Fuzz::sql(QStringLiteral("SELECT count(*) FROM file WHERE metadataCurrent = 0 AND fileName LIKE '%.themelet'")).toInt())
        Fuzz::fail(QStringLiteral("a themelet file stays unread"));
    // A file that isn't a JSON object has no themelet row.
    for (int i = 0; i < parts.size(); ++i) {
        if (!QJsonDocument::fromJson(parts.at(i)).isObject()
            && Fuzz::sql(QStringLiteral("SELECT count(*) FROM themelet WHERE fileId = %1").arg(s_ids[i])).toInt())
            Fuzz::fail(QStringLiteral("a malformed file keeps its themelet row"));
    }
    Fuzz::checkIndex(s_root);
    return 0;
}
