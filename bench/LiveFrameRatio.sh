#!/usr/bin/env bash
# The live window's frame time against the headless player's, for the same
# effect, size and fixed steps, in one run: "ratio live-frame <value> <limit>".
# A frame is the runtime's draw and the frame leaving GL (the window's swap,
# the player's read-back); each side's figure is the median of its frames,
# and the two sides alternate twice. Exits non-zero above the limit.
# usage: LiveFrameRatio.sh BUILD_DIR WALLPAPER
set -euo pipefail
build="$1" wallpaper="$2"
limit=1.2
frames=45
plugin="$build/samples/ripple/libripple.so"
scratch="$(mktemp -d)"
trap 'rm -rf "$scratch"' EXIT
display=(xvfb-run -a -s "-screen 0 1280x1024x24")
[ -n "${DISPLAY:-}" ] && display=()

player() {
  VI_BENCH_FRAMES="$frames" "$build/host/vi-player" --fixed-step --quiet --fps 30 --duration 1.5 \
    --image "wallpaper=$wallpaper" --out "$scratch/out" "$plugin" | awk '/^frame-time/ {print $2}'
}
live() {
  VI_BENCH_FRAMES="$frames" "${display[@]}" "$build/host/vi-live" --fixed-step \
    --image "wallpaper=$wallpaper" "$plugin" </dev/null 2>/dev/null | awk '/^frame-time/ {print $2}'
}
times="$(player) $(live) $(player) $(live)"
echo "$times" | awk -v limit="$limit" '{
  ratio = ($2 + $4) / ($1 + $3)
  printf "ratio live-frame %.3f %.2f   (live %.1f ms, player %.1f ms)\n", ratio, limit, ($2 + $4) / 2, ($1 + $3) / 2
  exit ratio > limit }'
