// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// The picture-tag adapter over exiv2 on arbitrary bytes: tags are absent or
// of their type, never an exception or a crash.
#include "fuzzsupport.h"
#include "quillmetadata.h"

#include <QDateTime>

namespace {
QString s_path;
}

extern "C" int LLVMFuzzerInitialize(int *, char ***)
{
    s_path = Fuzz::start() + QStringLiteral("/fuzz/picture");
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    Fuzz::write(s_path, QByteArray::fromRawData(reinterpret_cast<const char *>(data), int(size)));
    const QuillMetadata metadata(s_path);
    const QVariant date = metadata.entry(QuillMetadata::DateTaken);
    const QVariant orientation = metadata.entry(QuillMetadata::Orientation);
    if (date.isValid() && (date.userType() != QMetaType::QDateTime || !date.toDateTime().isValid()))
        Fuzz::fail(QStringLiteral("date tag of another type"));
    if (orientation.isValid() && orientation.userType() != QMetaType::Int)
        Fuzz::fail(QStringLiteral("orientation tag of another type"));
    if (metadata.entry(0).isValid())
        Fuzz::fail(QStringLiteral("a tag that the adapter doesn't know"));
    return 0;
}
