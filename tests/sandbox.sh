#!/usr/bin/env bash
# SPDX-FileCopyrightText: 2026 The themelet authors
# SPDX-License-Identifier: LGPL-2.1-or-later
# Runs one test in a throw-away environment: nothing touches the real home,
# /usr/share or the user's session bus.
set -u
SANDBOX=$(mktemp -d "${TMPDIR:-/tmp}/themelet-test.XXXXXX")
chmod 755 "$SANDBOX"
trap 'rm -rf "$SANDBOX"' EXIT
mkdir -p "$SANDBOX"/{home,config,data,cache,runtime,sysroot}
chmod 700 "$SANDBOX/runtime"
export HOME="$SANDBOX/home"
export XDG_CONFIG_HOME="$SANDBOX/config" XDG_DATA_HOME="$SANDBOX/data"
export XDG_CACHE_HOME="$SANDBOX/cache" XDG_RUNTIME_DIR="$SANDBOX/runtime"
export XDG_DATA_DIRS="${XDG_DATA_DIRS:-/usr/local/share:/usr/share}"
export THEMELET_SYSROOT="$SANDBOX/sysroot"
export THEMELET_SANDBOX="$SANDBOX"
export LANG=C.UTF-8 LC_ALL=C.UTF-8
# Not UTC, and with clock changes: times must not depend on the zone.
export TZ=Europe/Helsinki
export QT_QPA_PLATFORM=offscreen QT_QUICK_BACKEND=software
unset DBUS_SESSION_BUS_ADDRESS DISPLAY QT_NO_GLIB
dbus-run-session -- "$@" </dev/null
