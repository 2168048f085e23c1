#!/usr/bin/env bash
# Golden frames of the sample effect, held by the player's own comparison
# (--compare): in fixed steps at 180 x 320, each of timelines/ against
# golden/<timeline>/, at most 8 apart in a channel except for 115 pixels
# (0.2 %: edges moved by a pixel after a rasteriser update). "run" is a ripple,
# a trail and a grade change, 10 frames a second; "unlock" the gem faded after
# an unlock, back after a clear and moved right in landscape, 5 a second.
# Three controls must fail against "run", frame 11 named and its diff picture
# written: no touches, another grade, no gem model.
# VI_UPDATE_GOLDENS=1 makes this build's frames the goldens (after an intended
# change of the sample's look) and runs no control.
# usage: GoldenFrames.sh PLAYER PLUGIN JAVA WALLPAPER_TOOL TIMELINES_DIR GOLDEN_DIR OUTPUT_DIR
set -uo pipefail
player="$1" plugin="$2" timelines="$5" golden="$6" out="$7"
rm -rf "$out" && mkdir -p "$out/empty-assets" && "$3" "$4" "$out/wallpaper.png" 180 320 || exit 1
failures=0
fail() { echo "FAIL ($timeline): $*"; cat "$out/stderr.txt"; failures=$((failures + 1)); }

while read -r status fps timeline against options; do
  [ -z "${VI_UPDATE_GOLDENS:-}" ] || [ "$status" -eq 0 ] || continue
  actual=0
  # shellcheck disable=SC2086  # options are words
  "$player" --quiet --size 180x320 --fps "$fps" --image wallpaper="$out/wallpaper.png" --out "$out/$timeline" \
    --timeline "$timelines/$timeline.timeline" --compare "$golden/$against" --allow-pixels 115 \
    ${VI_UPDATE_GOLDENS:+--update} $options "$plugin" > "$out/stdout.txt" 2> "$out/stderr.txt" || actual=$?
  [ "$actual" -eq "$status" ] || fail "status $actual, expected $status"
  if [ "$status" -ne 0 ]; then
    grep -qF "error: frame-00011.png differs from its reference in" "$out/stderr.txt" || fail "frame 11 not named"
    [ -f "$out/$timeline/diff-00011.png" ] || fail "no diff picture of frame 11"
  fi
done <<ROWS
0 10 run run
0 5 unlock unlock
1 10 no-touch run
1 10 other-grade run
1 10 no-gem run --assets $out/empty-assets
ROWS
[ $failures -eq 0 ]
