#!/usr/bin/env bash
# Renders the sample effect for the golden-image test, in fixed steps at
# 180 x 320, 10 frames a second: the timeline as it is ("run"), and three
# controls the comparison must tell apart from it: no touches ("no-touch"),
# another grade ("other-grade") and no gem model ("no-gem"); and an unlock, a
# clear and a turn to landscape ("unlock").
# usage: RenderGoldens.sh PLAYER PLUGIN JAVA WALLPAPER_TOOL TIMELINE OUTPUT_DIR
set -euo pipefail
player="$1" plugin="$2" timeline="$5" out="$6"
rm -rf "$out" && mkdir -p "$out/empty-assets"
"$3" "$4" "$out/wallpaper.png" 180 320
grep -v touch "$timeline" > "$out/no-touch.timeline"
sed 's/param 2 100/param 4 100/' "$timeline" > "$out/other-grade.timeline"
printf '0.2 unlock\n1.4 clear\n2.4 orientation 1\n2.8 end\n' > "$out/unlock.timeline"
for run in run:"$timeline" no-touch:"$out/no-touch.timeline" other-grade:"$out/other-grade.timeline" \
  no-gem:"$timeline --assets $out/empty-assets" unlock:"$out/unlock.timeline"; do
  # shellcheck disable=SC2086  # the timeline and options are words
  "$player" --fixed-step --quiet --size 180x320 --fps 10 --image wallpaper="$out/wallpaper.png" \
    --out "$out/${run%%:*}" --timeline ${run#*:} "$plugin" > /dev/null
done
