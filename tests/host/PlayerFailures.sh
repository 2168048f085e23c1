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

# Each kind of bad timeline line, played as a user would: the file, the line
# (the third, after a comment and a good event) and the problem.
bad_line() {
  printf '# fine so far\n0.5 touch down 1 2\n%s\n' "$1" > line.timeline
  expect 1 "line.timeline:3: $2" --timeline line.timeline "$plugin"
}
bad_line "1 wiggle" "unknown event \"wiggle\""
bad_line "soon unlock" "\"soon\" is not a time in seconds"
bad_line "0.2 unlock" "time 0.2 goes back (the line before is at 0.500)"
bad_line "1 key home" "\"home\" is not a valid menu|up|down for \"key\""
bad_line "1 param 1" "\"param\" takes 2 arguments: param A B"
bad_line "1 orientation x" "\"x\" is not a valid 0|1 for \"orientation\""
bad_line "1" "a time without an event"
printf '0.5 end\n1 unlock\n' > after-end.timeline
expect 1 "after-end.timeline:2: an event after \"end\"" --timeline after-end.timeline "$plugin"
printf '0.5 image wallpaper missing.png\n' > image.timeline
expect 1 "image.timeline:1: cannot read image" --timeline image.timeline "$plugin"
expect 2 "--size takes WxH" --size 100 "$plugin"
expect 2 "unknown option --colour" --colour "$plugin"
expect 2 "no plug-in given" --fixed-step
expect 2 "--fps takes a whole number from 1 to 240, not \"0\"" --fps 0 "$plugin"
expect 2 "--image takes NAME=FILE" --image wallpaper "$plugin"

# A folder the player did not write is never replaced.
mkdir -p result && touch result/keep
"$player" --quiet --out result --duration 0.1 "$plugin" > /dev/null 2> stderr.txt && { echo "FAIL: replaced a foreign folder"; failures=$((failures + 1)); }
grep -qF "exists and was not written by the player" stderr.txt || { echo "FAIL: no message for a foreign folder"; cat stderr.txt; failures=$((failures + 1)); }
[ -f result/keep ] || { echo "FAIL: the foreign folder was touched"; failures=$((failures + 1)); }

# Asked for, the usage is an answer, not a failure.
"$player" --help > stdout.txt 2> stderr.txt || { echo "FAIL: --help exited with $?"; failures=$((failures + 1)); }
grep -qF "usage: vi-player [options] PLUGIN.so" stdout.txt || { echo "FAIL: no usage for --help"; cat stdout.txt; failures=$((failures + 1)); }

[ "$failures" -eq 0 ] && echo "all failures reported"
exit $(( failures > 0 ))
