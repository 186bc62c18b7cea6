// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

import QtQuick 2.15

// A model's status at a glance: grey Null, amber Querying, green Finished, red Error.
Rectangle {
    property int status
    width: 10
    height: 10
    radius: 5
    color: ["#78909c", "#ffb300", "#43a047", "#e53935"][status] || "#78909c"
}
