#!/usr/bin/env bash
# The author's kit as an author meets it: installed into a prefix, moved to a
# folder with a space in its name, the README's effect built against the moved
# kit in a folder outside the repository, and played with the kit's player,
# once through the package's imported tool (the effect's own ctest) and once
# through a symbolic link to the launcher.
# Usage: InstalledKit.sh BUILD_DIR SOURCE_DIR CXX CXX_FLAGS LINKER_FLAGS
set -euo pipefail
build=$1 source=$2 cxx=$3 cxxflags=$4 ldflags=$5
work=$(mktemp -d "${TMPDIR:-/tmp}/vi-kit.XXXXXX")
trap 'rm -rf "$work"' EXIT
fail() { echo "FAIL: $*" >&2; exit 1; }

first=$work/first
kit="$work/moved kit"
cmake --install "$build" --prefix "$first" --component tarqvevyn >/dev/null
mv "$first" "$kit"

# Nothing installed points back into the build, the sources or the first prefix.
if grep -rIl -e "$build" -e "$source" -e "$first" "$kit"; then fail "the files above name a path of the build"; fi
while IFS= read -r -d '' file; do
  if readelf -d "$file" 2>/dev/null | grep -E 'R(UN)?PATH' | grep -v -F '[$ORIGIN'; then
    fail "$file has a run path outside the kit"
  fi
done < <(find "$kit" -type f -name '*.so' -print0; find "$kit/bin" -type f -print0)

# Every tool answers --help.
for tool in vi-player vi-live vi-modelconv vi-new; do
  usage=$(timeout 60 "$kit/bin/$tool" --help) || fail "$tool --help ended with status $?"
  [[ $usage == "usage: $tool "* ]] || fail "$tool --help printed: ${usage:0:200}"
done

# Only a plug-in's headers, and each compiles on its own.
for internal in Entry Application/ApplicationLock.h Application/ContextRecovery.h Application/SelfTestKey.h \
    Tools/FatalReport.h; do
  [ ! -e "$kit/include/tarqvevyn/$internal" ] || fail "the runtime's own $internal is installed"
done
while IFS= read -r -d '' header; do
  $cxx $cxxflags -std=c++17 -fsyntax-only -I"$kit/include/tarqvevyn" -I/usr/include/android -x c++ "$header" ||
    fail "$header does not compile on its own"
done < <(find "$kit/include" -name '*.h' -print0)

# The README's effect: its source and its CMake lines, as an author copies them.
block() {  # the first fenced block of language $2 after the line holding $1
  awk -v start="$1" -v fence="\`\`\`$2" \
    'index($0, start) { found = 1 } found && $0 == fence { inside = 1; next } inside && /^```/ { exit } inside' \
    "$source/README.md"
}
effect=$work/myeffect
mkdir -p "$effect/assets"
block "A minimal complete effect" cpp >"$effect/MyScene.cpp"
block "The effect's \`CMakeLists.txt\`" cmake >"$effect/CMakeLists.txt"
[ -s "$effect/MyScene.cpp" ] && [ -s "$effect/CMakeLists.txt" ] || fail "README.md no longer shows the effect"
echo "the effect's own file" >"$effect/assets/note.txt"

cmake -S "$effect" -B "$effect/build" -DCMAKE_PREFIX_PATH="$kit" -DCMAKE_CXX_COMPILER="$cxx" \
  -DCMAKE_CXX_FLAGS="$cxxflags" -DCMAKE_SHARED_LINKER_FLAGS="$ldflags" >"$work/configure.log" ||
  { cat "$work/configure.log"; fail "the effect does not configure against the moved kit"; }
cmake --build "$effect/build" >"$work/build.log" || { cat "$work/build.log"; fail "the effect does not build"; }
[ -f "$effect/build/assets/note.txt" ] || fail "the effect's assets/ is not beside the plug-in"

ctest --test-dir "$effect/build" --output-on-failure --timeout 120 >"$work/ctest.log" ||
  { cat "$work/ctest.log"; fail "the effect's own test does not pass"; }
[ -f "$effect/build/frames/frame-00000.png" ] || fail "the effect's own test wrote no frame"

mkdir "$work/links"
ln -s "$kit/bin/vi-player" "$work/links/vi-player"
status=0
(cd "$work" && timeout 120 links/vi-player --quiet --fixed-step --duration 0.2 --out out myeffect/build/libmyeffect.so) ||
  status=$?
[ $status -eq 0 ] || fail "the kit's vi-player ended with status $status"
[ -f "$work/out/frame-00000.png" ] || fail "the kit's vi-player wrote no frame"
# A launcher copied away from the kit says so.
cp "$kit/bin/vi-player" "$work/links/copied-vi-player"
status=0
message=$("$work/links/copied-vi-player" --help 2>&1) || status=$?
[ $status -eq 2 ] && [[ $message == "vi-player: error: the kit's files are not where this launcher looks"* ]] ||
  fail "a launcher away from its kit ended with status $status: ${message:0:300}"
echo "the kit installs, moves, builds the README's effect and plays it"
