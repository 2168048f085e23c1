#!/usr/bin/env bash
# The player's failures as a user meets them: for each kind of bad input, and
# each mistake that ends the effect, its status, the message's key words
# ('^' between them), and no output folder (nor a partial one) left behind.
# A crash in the effect is its signal's status, its name, the effect's function and file:line,
# and neither a JVM banner nor a crash file. A misspelt name is a warning, once, and the run goes on.
# usage: PlayerFailures.sh PLAYER PLUGIN NOFACTORY_PLUGIN SCRATCH_DIR MISTAKE_PLUGINS_DIR MISTAKE_SOURCE PICTURE
set -uo pipefail
player="$1" plugin="$2" nofactory="$3" m="$5" source="$6" picture="$7"
at() { echo "$2^ at $source:$(grep -n "// the $1" "$source" | cut -d: -f1)"; }
rm -rf "$4" && mkdir -p "$4/assets" && cd "$4" || exit 1
echo "not a picture" | tee broken.png > libgarbage.so
echo "beside the asset folder" > secret
# A model file whose counts promise far more than its 8 bytes: warned about, and the effect starts.
printf '\350\003\0\0\003\0\0\0' > assets/broken.bin
failures=0 n=0
fail() { echo "FAIL ($args): $*"; cat stderr.txt; failures=$((failures + 1)); }

while IFS=';' read -r status message args; do
  actual=0
  # shellcheck disable=SC2086  # the arguments are words
  "$player" --quiet --out result $args > stdout.txt 2> stderr.txt || actual=$?
  [ "$actual" -eq "$status" ] || fail "status $actual, expected $status"
  while read -r -d '^' part; do grep -qF -- "$part" stderr.txt || fail "no \"$part\""; done <<< "$message^"
  ! grep -q "fatal error" stdout.txt stderr.txt || fail "the JVM's banner"
  if [ -e result ] || compgen -G '.result.*' > /dev/null || compgen -G 'hs_err*' > /dev/null; then
    fail "output left behind"
  fi
  rm -rf result .result.*
done < <(cat <<ROWS
1;plug-in not found: missing/libnone.so;missing/libnone.so
1;cannot start the effect in $nofactory: the library has no "createScene";$nofactory
1;cannot start the effect in libgarbage.so: ;libgarbage.so
1;--image wallpaper: cannot read image broken.png: not a PNG or JPEG image;--image wallpaper=broken.png $plugin
1;cannot read image nowhere.png;--image wallpaper=nowhere.png $plugin
1;cannot read timeline none.timeline;--timeline none.timeline $plugin
2;--size takes WxH;--size 100 $plugin
2;unknown option --colour;--colour $plugin
2;no plug-in given;--fixed-step
2;--fps takes a whole number from 1 to 240, not "0";--fps 0 $plugin
2;--image takes NAME=FILE;--image wallpaper $plugin
2;--update goes with --compare DIR;--update $plugin
2;--tolerance takes a whole number from 0 to 255, not "256";--compare . --tolerance 256 $plugin
1;error: the reference folder nowhere does not exist^to make it from this render: --compare nowhere --update;--compare nowhere $plugin
1;--out and --compare name the same folder result;--compare result $plugin
88;error: the fragment shader does not compile (the effect ended with status 88)^shader line 3:     gl_FragColor = vec4(0.2, 0.3, 0.4 1.0);$m/libvi_mistake_shader.so
67;error: the shader program does not link (the effect ended with status 67)^vGlow;$m/libvi_mistake_link.so
71;asset that does not exist (the effect ended with status 71)^ghost.bin, searched in $(pwd -P)/assets^warning: the asset broken.bin cannot be a model file: the file is truncated: 8 bytes, but V = 1000 and I = 3 need 32014;--assets assets $m/libvi_mistake_ghost.so
71;asset outside its asset folder (the effect ended with status 71)^../secret leads out of $(pwd -P)/assets;--assets assets $m/libvi_mistake_secret.so
45;could not open a file (the effect ended with status 45)^nowhere.txt, searched in $(pwd -P);$m/libvi_mistake_file.so
139;error: the effect crashed: SIGSEGV (a read or write through a bad pointer, at 0x0)^$(at "null write" draw);$m/libvi_mistake_nullwrite.so
139;error: the effect crashed: SIGSEGV^$(at "null call" "Mistake::draw()");$m/libvi_mistake_nullcall.so
139;error: the effect crashed: SIGSEGV (a stack overflow^deeper(int) at $source:;$m/libvi_mistake_recursion.so
139;Mistake::draw() at libvi_mistake_nodebug.so+0x^the library has no debug information^build it with -g to see the file and line;$m/libvi_mistake_nodebug.so
134;error: the effect crashed: SIGABRT (abort() was called^$(at abort "Mistake::draw()");$m/libvi_mistake_abort.so
ROWS
# Each kind of bad timeline line, after a comment and a good event: the file, the line and the problem.
while IFS='|' read -r line message; do
  printf "# fine so far\n0.5 touch down 1 2\n$line\n" > "line$((++n)).timeline"
  echo "1;line$n.timeline:$message;--timeline line$n.timeline $plugin"
done <<'LINES'
1 wiggle|3: unknown event "wiggle"
NaN unlock|3: "NaN" is not a time in seconds
0.2 unlock|3: time 0.2 goes back (the line before is at 0.500)
1 touch down 1|3: "touch" takes 3 arguments: touch down|move|up X Y
1 touch sideways 1 2|3: "sideways" is not a valid down|move|up for "touch"
1 param 1 x|3: "x" is not a valid B for "param"
1|3: a time without an event
1 end\n2 unlock|4: an event after "end"
1 image wallpaper missing.png|3: cannot read image
LINES
)

# Misspelt names: the run writes its frames, with this many warnings, their key words among them.
# The first three are one run's: three renderers, two of one program, each with the same three
# misspelt names, told once per program, and never the names a renderer binds by itself. The last run is right, a lost context and all: no warning.
printf '0 image wallpapr %s\n' "$picture" > misspelt.timeline
printf '0.1 lose-context\n0.2 image wallpaper %s\n0.3 touch down 60 200\n' "$picture" > right.timeline
while IFS='|' read -r count message args; do
  # shellcheck disable=SC2086  # the arguments are words
  "$player" --quiet --out result --duration 0.4 $args > stdout.txt 2> stderr.txt || fail "status $?"
  [ -f result/frame-00011.png ] || fail "no frames"
  [ "$(grep -c warning: stderr.txt)" -eq "$count" ] || fail "not $count warnings"
  while read -r -d '^' part; do grep -qF -- "$part" stderr.txt || fail "no \"$part\""; done <<< "${message:+$message^}"
  rm -rf result
done <<ROWS
6|warning: the uniform 'uGlw' is not an active uniform of its program^did you mean 'uGlow'?^$(at "misspelt uniform" "")^the program's active uniforms: uGlow, uTime|$m/libvi_mistake_names.so
6|warning: the attribute 'aPositon' is not an active attribute^did you mean 'aPosition'?^$(at "misspelt attribute" "")|$m/libvi_mistake_names.so
6|warning: the sampler 'uPictur' is not an active sampler^did you mean 'uPicture'?^the program's active samplers: uPicture|$m/libvi_mistake_names.so
2|warning: the image 'wallpaperr' is handed in but the effect never asks for it; did you mean 'wallpaper'?^given by --image wallpaperr^warning: the effect asks for the image 'wallpaper' but none is handed in; did you mean 'wallpaperr'?|--image wallpaperr=$picture $plugin
1|warning: the image 'wallpapr' is handed in but the effect never asks for it; did you mean 'wallpaper'?^given by misspelt.timeline:1|--image wallpaper=$picture --timeline misspelt.timeline $plugin
0||--timeline right.timeline $plugin
ROWS

# Ctrl-C, SIGTERM, or a crash's signal from outside once the output folder is being written: the
# signal's status, nothing left behind, and the sender of a crash's signal named.
for signal in INT TERM SEGV ABRT; do
  args="SIG$signal"
  env --default-signal=INT "$player" --quiet --out result --duration 60 "$m/libvi_mistake_none.so" 2> stderr.txt &
  for _ in $(seq 300); do compgen -G '.result.partial-*' > /dev/null && break; sleep 0.1; done
  compgen -G '.result.partial-*' > /dev/null || fail "no output folder within 30 s"
  kill -s "$signal" $! && wait $!
  actual=$?
  [ "$actual" -eq $((128 + $(kill -l "$signal"))) ] || fail "status $actual"
  [[ $signal == INT || $signal == TERM ]] || grep -qF "error: ended by SIG$signal from process $$" stderr.txt ||
    fail "no sender named"
  if [ -e result ] || compgen -G '.result.*' > /dev/null; then fail "output left behind"; fi
done

# A folder the player did not write is never replaced; the usage asked for is no failure.
mkdir -p result && touch result/keep
args="a foreign folder"
"$player" --quiet --out result --duration 0.1 "$plugin" > /dev/null 2> stderr.txt && fail "replaced"
grep -qF "exists and was not written by the player" stderr.txt && [ -f result/keep ] || fail "touched"
"$player" --help 2> stderr.txt | grep -qF "usage: vi-player [options] PLUGIN.so" || fail "no usage for --help"
exit $((failures > 0))
