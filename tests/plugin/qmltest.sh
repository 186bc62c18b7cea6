#!/usr/bin/env bash
# SPDX-FileCopyrightText: 2026 The themelet authors
# SPDX-License-Identifier: LGPL-2.1-or-later
# Runs one QML test file in the sandbox that sandbox.sh made: the index is
# written first by another process (the fixture), then qmltestrunner runs the
# file. Every QML warning counts as a failure.
#   qmltest.sh <fixture> <qmltestrunner> <tst_file.qml>
set -u
"$1" || { echo "FAIL: the fixture could not write the index"; exit 1; }
log="$THEMELET_SANDBOX/qmltest.txt"
"$2" -input "$3" -o "$log,txt" -o -,txt
status=$?
if grep -q '^QWARN' "$log"; then
    echo "FAIL: QML warnings (the QWARN lines above) count as failures"
    [ "$status" -ne 0 ] || status=1
fi
exit "$status"
