#!/usr/bin/env bash
# Renders the sample effect for the golden-image test, in fixed steps at
# 180 x 320, 10 frames a second, along each of timelines/: the golden one
# ("run"); three controls the comparison must tell apart from it: no touches,
# another grade and no gem model; and an unlock, a clear and a turn to landscape.
# usage: RenderGoldens.sh PLAYER PLUGIN JAVA WALLPAPER_TOOL TIMELINES_DIR OUTPUT_DIR
set -euo pipefail
player="$1" plugin="$2" timelines="$5" out="$6"
rm -rf "$out" && mkdir -p "$out/empty-assets"
"$3" "$4" "$out/wallpaper.png" 180 320
for run in run no-touch other-grade unlock "no-gem --assets $out/empty-assets"; do
  # shellcheck disable=SC2086  # the name, then options
  set -- $run
  "$player" --fixed-step --quiet --size 180x320 --fps 10 --image wallpaper="$out/wallpaper.png" \
    --out "$out/$1" --timeline "$timelines/$1.timeline" "${@:2}" "$plugin" > /dev/null
done
