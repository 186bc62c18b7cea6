#!/usr/bin/env bash
# SPDX-FileCopyrightText: 2026 The themelet authors
# SPDX-License-Identifier: LGPL-2.1-or-later
# The gallery against the real service and generated sample content, under
# xvfb-run on the sandbox's private bus: the three lists fill and finish,
# tapping a themelet makes it current (in the configuration too), a themelet
# made from a photo shows up, the profile's switches are stored, and the
# screenshots are not blank.
# Usage (through sandbox.sh): gallery.sh SOURCE_DIR BIN_DIR
set -euo pipefail
src=$1 bin=$2
work=$THEMELET_SANDBOX
root=$THEMELET_SYSROOT

fail() { echo "FAIL: $*" >&2; exit 1; }

"$src/scripts/make-sample-content" "$root" >/dev/null

"$bin/themeletd" --watch "$root/Pictures" --no-default-watch >"$work/themeletd.log" 2>&1 &
service=$!
trap 'kill $service 2>/dev/null; wait $service 2>/dev/null || true' EXIT
gdbus wait --session --timeout 60 com.vorka.themeletd || { cat "$work/themeletd.log" >&2; fail "themeletd is not on the bus"; }

# Screenshots need a real X server and the default scene graph backend.
unset QT_QPA_PLATFORM QT_QUICK_BACKEND

# Help and usage errors need no display at all.
(unset DISPLAY; "$bin/themelet-gallery" --help | grep -- '--screenshot' >/dev/null) || fail "--help without a display"
(unset DISPLAY; "$bin/themelet-gallery" --size x >/dev/null 2>&1; [ $? = 2 ]) || fail "a usage error does not exit 2"

# gallery NAME ARGS...: runs the gallery, its output in $work/NAME.out.
gallery() {
  local name=$1; shift
  if ! xvfb-run -a -n $((100 + RANDOM % 800)) -s "-screen 0 1280x1024x24" "$bin/themelet-gallery" --timeout 300 "$@" >"$work/$name.out" 2>&1; then
    cat "$work/$name.out" >&2
    tail -20 "$work/themeletd.log" >&2
    fail "the gallery ($name) exited with an error"
  fi
  cat "$work/$name.out"
}

# not_blank PNG WIDTH HEIGHT: the size asked for, and a real picture in it.
not_blank() {
  local size colours
  size=$(convert "$1" -format '%wx%h' info:)
  [ "$size" = "$2x$3" ] || fail "$1 is $size, not $2x$3"
  colours=$(convert "$1" -format '%k' info:)
  [ "$colours" -gt 200 ] || fail "$1 has only $colours colours"
}

gallery wide --size 1280x800 --screenshot "$work/wide.png" --tap-themelet --create-themelet --switch-sounds
for list in themeletModel photoModel toneModel; do
  grep -Eq "^$list: Finished, [1-9][0-9]* rows$" "$work/wide.out" || fail "$list did not finish with rows"
done
grep -Eq '^photoModel: Finished, (3[6-9]|[4-9][0-9]) rows$' "$work/wide.out" || fail "not every photo is listed"
tapped=$(sed -n 's/^tapped \(.*\), Themelet.source follows$/\1/p' "$work/wide.out")
[ -n "$tapped" ] || fail "no themelet was tapped"
# The service wrote the configuration that Themelet.source reads.
[ "$(dconf read /desktop/lunda/background/portrait/picture_filename)" = "'${tapped#file://}'" ] ||
  fail "the configuration does not name $tapped"
grep -q '^created a themelet from ' "$work/wide.out" || fail "the new themelet did not show up"
# The Profile object's writes reach the profile's keys.
switched=$(sed -n 's/^switched: mail tone \(on\|off\), ringer tone \(.*\)$/\1 \2/p' "$work/wide.out")
[ "${switched%% *}" = off ] || fail "the mail tone was not switched off: $switched"
[ "$(dconf read /org/orbaline/themelet/profiles/general/email.alert.enabled)" = false ] || fail "email.alert.enabled is not false"
[ "$(dconf read /org/orbaline/themelet/profiles/general/ringing.alert.tone)" = "'${switched#* }'" ] || fail "the ringer tone is not stored"
not_blank "$work/wide.png" 1280 800

# Phone size: the current themelet is still the tapped one, and marked.
gallery phone --size 540x960 --screenshot "$work/phone.png"
not_blank "$work/phone.png" 540 960
echo "gallery: all checks passed"
