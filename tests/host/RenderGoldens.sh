#!/usr/bin/env bash
# Renders the sample effect for the golden-image test, in fixed steps at
# 180 x 320, 10 frames a second: the timeline as it is ("run"), and three
# controls the comparison must tell apart from it: no touches ("no-touch"),
# another grade ("other-grade") and no gem model ("no-gem").
# usage: RenderGoldens.sh PLAYER PLUGIN JAVA WALLPAPER_TOOL TIMELINE OUTPUT_DIR
set -euo pipefail
player="$1" plugin="$2" java="$3" tool="$4" timeline="$5" out="$6"
rm -rf "$out"
mkdir -p "$out"
"$java" "$tool" "$out/wallpaper.png" 180 320

render() {
  local name="$1" timeline="$2"
  shift 2
  "$player" --fixed-step --quiet --size 180x320 --fps 10 --timeline "$timeline" \
    --image wallpaper="$out/wallpaper.png" --out "$out/$name" "$@" "$plugin" >/dev/null
}

render run "$timeline"
grep -v touch "$timeline" > "$out/no-touch.timeline"
render no-touch "$out/no-touch.timeline"
sed 's/param 2 100/param 4 100/' "$timeline" > "$out/other-grade.timeline"
render other-grade "$out/other-grade.timeline"
mkdir -p "$out/empty-assets"
render no-gem "$timeline" --assets "$out/empty-assets"
