#!/usr/bin/env bash
# vi-new as an author meets it: from an installed kit moved elsewhere, the
# names and folders it must refuse (each with its message, nothing written),
# then a new project built with the runtime's own compiler and standard
# library, its ctest recording the reference frames, comparing with them,
# failing with a diff picture on a changed reference, recording anew when
# asked, and a misspelt attribute told at the author's line.
# Usage: NewEffect.sh BUILD_DIR CXX CXX_FLAGS LINKER_FLAGS
set -euo pipefail
build=$1 cxx=$2 cxxflags=$3 ldflags=$4
work=$(mktemp -d "${TMPDIR:-/tmp}/vi-new.XXXXXX")
trap 'rm -rf "$work"' EXIT
fail() { echo "FAIL: $*" >&2; exit 1; }

kit="$work/moved kit"
cmake --install "$build" --prefix "$work/first" --component tarqvevyn >/dev/null && mv "$work/first" "$kit"
# An empty folder is vi-new's to fill, even the current one.
mkdir -p "$work/author/taken/notes" "$work/author/glow" && cd "$work/author"

# arguments | status | the message's first line starts with
refusals=(
  "taken|1|vi-new: error: taken already exists and is not an empty folder; vi-new never writes over it"
  "my-glow|1|vi-new: error: 'my-glow' is not a C++ identifier"
  "class|1|vi-new: error: 'class' is a C++ keyword"
  "test|1|vi-new: error: 'test' is one of CMake's own target names"
  "a__b|1|vi-new: error: 'a__b' is reserved for the compiler"
  "glow missing/glow|1|vi-new: error: the folder missing, where missing/glow would go, does not exist"
  "|2|vi-new: error: give the effect's name"
  "--force glow|2|vi-new: error: unknown option '--force'"
)
before=$(find . | sort)
for row in "${refusals[@]}"; do
  IFS='|' read -r arguments expected start <<<"$row"
  status=0
  # shellcheck disable=SC2086
  message=$("$kit/bin/vi-new" $arguments 2>&1 >/dev/null) || status=$?
  [ $status -eq "$expected" ] && [[ $message == "$start"* ]] ||
    fail "vi-new $arguments ended with status $status (expected $expected): ${message:0:300}"
  [ "$(find . | sort)" = "$before" ] || fail "vi-new $arguments left files behind"
done
(cd glow && "$kit/bin/vi-new" glow . >/dev/null) || fail "vi-new glow . ended with status $?"
"$kit/bin/vi-new" other >/dev/null && [ -f other/OtherScene.cpp ] && [ "$(ls -A | tr '\n' ' ')" = "glow other taken " ] ||
  fail "vi-new other ended with status $? and left: $(ls -A)"
{ cmake -S glow -B glow/build -DCMAKE_PREFIX_PATH="$kit" -DCMAKE_CXX_COMPILER="$cxx" -DCMAKE_CXX_FLAGS="$cxxflags" \
  -DCMAKE_SHARED_LINKER_FLAGS="$ldflags" && cmake --build glow/build; } >"$work/build.log" 2>&1 ||
  { cat "$work/build.log"; fail "the new effect does not configure and build against the moved kit"; }

run_ctest() {  # passes when ctest ends with status $1 and names the test $2 with its result $3
  status=0
  ctest --test-dir glow/build --output-on-failure --timeout 300 >"$work/ctest.log" 2>&1 || status=$?
  [ $status -eq "$1" ] && grep -q -F "$2 " "$work/ctest.log" && grep -q "$3" "$work/ctest.log" ||
    { cat "$work/ctest.log"; fail "ctest ended with status $status, expected $1 and the test '$2': $3"; }
}
run_ctest 0 "glow.golden (no references yet: records them)" Passed
[ "$(find glow/golden -name 'frame-*.png' | wc -l)" -eq 10 ] || fail "the first ctest did not record 10 frames"

run_ctest 0 "glow.golden" "glow.golden \.* *Passed"

cp glow/golden/frame-00000.png glow/golden/frame-00005.png
run_ctest 8 "glow.golden" "frame-00005.png differs from its reference"
[ "$(cd glow/build/glow.golden-frames && echo diff-*)" = diff-00005.png ] || fail "no diff-00005.png alone"

VI_UPDATE_GOLDENS=1 run_ctest 0 "glow.golden (VI_UPDATE_GOLDENS: records them)" Passed
run_ctest 0 "glow.golden" "glow.golden \.* *Passed"
# An attribute misspelt in its shader, bound through the kit's helpers: warned about at the author's call.
sed -i 's/aPosition/aPositon/' glow/assets/glow.vert && cmake --build glow/build >/dev/null
"$kit/bin/vi-player" --quiet --duration 0.2 --out "$work/frames" glow/build/libglow.so >/dev/null 2>"$work/warned.txt"
line=$(grep -n 'DrawableArrays::bind' glow/GlowScene.cpp | cut -d: -f1)
grep -qF "warning: the attribute 'aPosition' is not an active attribute of its program" "$work/warned.txt" &&
  grep -q " at .*/glow/GlowScene.cpp:$line\$" "$work/warned.txt" || { cat "$work/warned.txt"; fail "not told at line $line"; }
echo "vi-new refuses what it must and makes an effect that builds, records its references and holds to them"
