#!/usr/bin/env bash
# The player's clear failures: for each bad input, its status, a message naming
# the problem, and no output folder (nor a partial one) left behind.
# usage: PlayerFailures.sh PLAYER PLUGIN NOFACTORY_PLUGIN SCRATCH_DIR
set -uo pipefail
player="$1" plugin="$2" nofactory="$3" scratch="$4"
rm -rf "$scratch"
mkdir -p "$scratch"
cd "$scratch"
echo "not a picture" > broken.png
printf '0.5 touch down 1 2\n1 touch sideways 1 2\n' > bad.timeline
failures=0

# expect STATUS MESSAGE ARGS...
expect() {
  local status="$1" message="$2"
  shift 2
  local actual=0
  "$player" --quiet --out result "$@" > stdout.txt 2> stderr.txt || actual=$?
  if [ "$actual" -ne "$status" ]; then
    echo "FAIL ($*): status $actual, expected $status"; failures=$((failures + 1))
  fi
  if ! grep -qF -- "$message" stderr.txt; then
    echo "FAIL ($*): no \"$message\" in:"; cat stderr.txt; failures=$((failures + 1))
  fi
  if [ -e result ] || ls -A | grep -q '^\.result\.'; then
    echo "FAIL ($*): output left behind"; ls -A; failures=$((failures + 1))
  fi
  rm -rf result .result.*
}

expect 1 "plug-in not found: missing/libnone.so" missing/libnone.so
expect 1 "cannot start the effect in $nofactory" "$nofactory"
expect 1 "the library has no \"createScene\"" "$nofactory"
expect 1 "--image wallpaper: cannot read image broken.png: not a PNG or JPEG image" --image wallpaper=broken.png "$plugin"
echo "garbage" > libgarbage.so
expect 1 "cannot start the effect in libgarbage.so: " libgarbage.so
expect 1 "cannot read image nowhere.png" --image wallpaper=nowhere.png "$plugin"
expect 1 "bad.timeline:2: \"sideways\" is not a valid down|move|up for \"touch\"" --timeline bad.timeline "$plugin"
expect 1 "cannot read timeline none.timeline" --timeline none.timeline "$plugin"
expect 2 "--size takes WxH" --size 100 "$plugin"
expect 2 "unknown option --colour" --colour "$plugin"
expect 2 "no plug-in given" --fixed-step

# A folder the player did not write is never replaced.
mkdir -p result && touch result/keep
"$player" --quiet --out result --duration 0.1 "$plugin" > /dev/null 2> stderr.txt && { echo "FAIL: replaced a foreign folder"; failures=$((failures + 1)); }
grep -qF "exists and was not written by the player" stderr.txt || { echo "FAIL: no message for a foreign folder"; cat stderr.txt; failures=$((failures + 1)); }
[ -f result/keep ] || { echo "FAIL: the foreign folder was touched"; failures=$((failures + 1)); }

[ "$failures" -eq 0 ] && echo "all failures reported"
exit $(( failures > 0 ))
