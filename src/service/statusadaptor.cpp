// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "statusadaptor.h"

#include "filemanager.h"
#include "installmanager.h"
#include "themeletservice.h"

StatusAdaptor::StatusAdaptor(ThemeletService *service)
    : QDBusAbstractAdaptor(service)
{
}

qlonglong StatusAdaptor::queued() const
{
    const FileManager *files = FileManager::instance();
    const auto *installer = static_cast<const InstallManager *>(ContentManager::managerFromType(6));
    return (files ? files->pendingDirectoryCount() : 0) + (installer ? installer->pendingCount() : 0);
}
