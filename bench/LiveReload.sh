#!/usr/bin/env bash
# How long the live window takes to bring a new build in: from the plug-in's
# last write (its modification time) to the new build's first frame, as the
# window measures it, with the sample rewritten in place as a linker does.
# Prints "reload-ms <median>" over a few reloads; the window settles a change
# for 0.3 s before it loads it, so that a build is not caught half-written.
# usage: LiveReload.sh BUILD_DIR WALLPAPER
set -euo pipefail
build="$1" wallpaper="$2"
reloads=9
scratch="$(mktemp -d)"
pid=
cleanup() {
  [ -n "$pid" ] && kill "$pid" 2>/dev/null && wait "$pid" 2>/dev/null
  rm -rf "$scratch"
}
trap cleanup EXIT
display=(xvfb-run -a -s "-screen 0 1280x1024x24")
[ -n "${DISPLAY:-}" ] && display=()
plugin="$scratch/libripple.so"
cp "$build/samples/ripple/libripple.so" "$plugin"
mkfifo "$scratch/input"
VI_BENCH_RELOADS=1 "${display[@]}" "$build/host/vi-live" --assets "$build/samples/ripple/assets" \
  --image "wallpaper=$wallpaper" "$plugin" <"$scratch/input" >"$scratch/log" 2>&1 &
pid=$!
exec 3>"$scratch/input"

# Waits up to 30 s for the log to hold `count` lines matching `pattern`.
await() {
  local pattern="$1" count="$2"
  for _ in $(seq 600); do
    [ "$(grep -c "$pattern" "$scratch/log")" -ge "$count" ] && return 0
    kill -0 "$pid" 2>/dev/null || break
    sleep 0.05
  done
  echo "LiveReload.sh: the window did not get to \"$pattern\" ($count); it said:" >&2
  cat "$scratch/log" >&2
  exit 1
}
await "^vi-live: playing" 1
for i in $(seq "$reloads"); do
  cp "$build/samples/ripple/libripple.so" "$plugin"
  await "^reload-ms" "$i"
done
echo end >&3
wait "$pid"
pid=
awk '/^reload-ms/ {print $2}' "$scratch/log" | sort -n | awk '{v[NR] = $1} END {
  printf "reload-ms %.0f   (median of %d reloads, from the last write to the first frame)\n", v[int((NR + 1) / 2)], NR }'
