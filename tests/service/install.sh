#!/usr/bin/env bash
# SPDX-FileCopyrightText: 2026 The themelet authors
# SPDX-License-Identifier: LGPL-2.1-or-later
# Installs the build into a temporary prefix and uses it from there: themeletd
# started by D-Bus activation on a private bus whose only service directory is
# the prefix's, the installed themeletctl talking to it, the QML module loaded,
# and a small consumer built with pkg-config and with find_package(Themelet).
# Usage (through sandbox.sh): install.sh BUILD_DIR
set -euo pipefail
build=$1 work=$THEMELET_SANDBOX/install
prefix=$work/prefix
fail() { echo "FAIL: $*" >&2; exit 1; }
mkdir -p "$work/consumer"

DESTDIR= cmake --install "$build" --prefix "$prefix" >"$work/install.log" || { cat "$work/install.log"; fail "cmake --install"; }
! grep -v "^$prefix/" "$build/install_manifest.txt" || fail "installed outside the prefix"
libdir=$(dirname "$(find "$prefix" -name 'libthemelet.so.1' -path '*/lib*')")
ldd "$prefix/bin/themeletd" >"$work/ldd"
grep -q "libthemelet.so.1 => $prefix/" "$work/ldd" || fail "themeletd does not find its library: $(cat "$work/ldd")"
qml=$(find "$prefix" -name qmldir -path '*/qt5/qml/Orbaline/Themelet/*')
[ "${qml#"$prefix"/lib/*/qt5/qml/}" = Orbaline/Themelet/qmldir ] || fail "QML module at $qml"
echo 'import Orbaline.Themelet 1.0; import QtQuick 2.0; Item { Component.onCompleted: Qt.quit() }' >"$work/module.qml"
QML2_IMPORT_PATH=${qml%/Orbaline/*} qmlscene --quit "$work/module.qml" 2>"$work/qml.log" || { cat "$work/qml.log"; fail "the QML module does not load"; }
! grep -q 'Themelet' "$work/qml.log" || { cat "$work/qml.log"; fail "the QML module does not load"; }

cat >"$work/bus.conf" <<CONF
<busconfig>
  <type>session</type>
  <listen>unix:dir=$work</listen>
  <auth>EXTERNAL</auth>
  <servicedir>$prefix/share/dbus-1/services</servicedir>
  <policy context="default"><allow send_destination="*" eavesdrop="true"/><allow eavesdrop="true"/><allow own="*"/></policy>
</busconfig>
CONF
read -r DBUS_SESSION_BUS_ADDRESS bus < <(dbus-daemon --config-file="$work/bus.conf" --fork --print-address=1 --print-pid=1 | paste -s -d ' ')
export DBUS_SESSION_BUS_ADDRESS
trap 'kill "$bus"; [ -z "${service:-}" ] || kill "$service" 2>/dev/null || true' EXIT
# A command that needs the service starts it by activation.
"$prefix/bin/themeletctl" refresh || fail "themeletctl refresh did not activate themeletd"
service=$(gdbus call --session --dest org.freedesktop.DBus --object-path /org/freedesktop/DBus \
  --method org.freedesktop.DBus.GetConnectionUnixProcessID com.vorka.themeletd | sed 's/.* \([0-9]*\),)/\1/')
[ "$(readlink "/proc/$service/exe")" = "$prefix/bin/themeletd" ] || fail "the bus started $(readlink "/proc/$service/exe")"
"$prefix/bin/themeletctl" status >"$work/status" || { cat "$work/status"; fail "themeletctl status"; }
grep -q '^service: *running' "$work/status" || { cat "$work/status"; fail "themeletctl status does not see the service"; }

# The consumer includes every installed header and calls into the library.
cd "$work/consumer"
for header in "$prefix"/include/themelet/*.h; do echo "#include <themelet/${header##*/}>"; done >all.h
cat >main.cpp <<'CPP'
#include "all.h"
#include <cstdio>
void Content::signalChanged(int) {}
int main() { std::puts(qPrintable(colorToString(colorFromString(QStringLiteral("red"))))); }
CPP
cat >CMakeLists.txt <<'CMAKE'
cmake_minimum_required(VERSION 3.16)
project(consumer CXX)
find_package(Themelet 1.0 REQUIRED)
add_executable(consumer main.cpp)
target_link_libraries(consumer PRIVATE Themelet::themelet)
CMAKE
cmake -S . -B build -G Ninja -DCMAKE_PREFIX_PATH="$prefix" >cmake.log && cmake --build build >>cmake.log || { cat cmake.log; fail "the CMake consumer does not build"; }
export PKG_CONFIG_PATH=$libdir/pkgconfig
# shellcheck disable=SC2046
g++ -std=c++17 -fPIC main.cpp $(pkg-config --cflags --libs themelet) -Wl,-rpath,"$libdir" -o consumer-pc || fail "the pkg-config consumer does not build"
for program in build/consumer ./consumer-pc; do
  [ "$("$program")" = '#ffff0000' ] || fail "$program printed $("$program")"
done
echo "install: all checks passed"
