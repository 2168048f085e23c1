#!/usr/bin/env bash
# vi-new: writes a new effect project from the kit's template (installed as
# bin/vi-new; the template is found from this script's own folder, so the kit
# can be moved). The project is written into a hidden folder beside its place
# and moved there whole, so a failure leaves nothing behind.
set -euo pipefail
here=$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")
template="$here/@VI_TEMPLATE_FROM_BIN@"
kit=$(cd "$here/.." && pwd)

usage() {
  cat <<'TXT'
usage: vi-new NAME [DIR]
  Writes a new effect project NAME into DIR (default: ./NAME), which must not
  exist yet (or be empty): a CMakeLists.txt that finds the kit, a scene with its
  own shaders in assets/, a timeline, a picture for the host to hand in, and a
  test that compares the effect's frames with reference pictures. NAME names
  the plug-in (libNAME.so) and its scene class, so it must be a C++ identifier.
  The project's README.md has the commands to build, open and test it.
TXT
}

fail() {  # fail STATUS MESSAGE [DETAIL...]
  local status=$1
  echo "vi-new: error: $2" >&2
  shift 2
  [ $# -eq 0 ] || printf '  %s\n' "$@" >&2
  exit "$status"
}

if [ $# -ge 1 ] && { [ "$1" = "--help" ] || [ "$1" = "-h" ]; }; then usage; exit 0; fi
for argument in "$@"; do
  [[ $argument != -* ]] || fail 2 "unknown option '$argument'" "Try 'vi-new --help'."
done
if [ $# -lt 1 ] || [ $# -gt 2 ]; then
  fail 2 "give the effect's name, and the folder to write it into if not ./NAME" "usage: vi-new NAME [DIR]; try 'vi-new --help'."
fi
[ -f "$template/Scene.cpp.in" ] ||
  fail 2 "the kit's files are not where this script looks for them" "$template is missing; keep vi-new in the kit's bin/, or link to it"

name=$1
dir=${2:-$name}

# The name becomes a CMake target, a library file and the scene's class name.
keywords=" alignas alignof and and_eq asm auto bitand bitor bool break case catch char char16_t char32_t char8_t
  class compl concept const consteval constexpr constinit const_cast continue co_await co_return co_yield decltype
  default delete do double dynamic_cast else enum explicit export extern false float for friend goto if inline int
  long mutable namespace new noexcept not not_eq nullptr operator or or_eq private protected public register
  reinterpret_cast requires return short signed sizeof static static_assert static_cast struct switch template this
  thread_local throw true try typedef typeid typename union unsigned using virtual void volatile wchar_t while xor
  xor_eq "
cmake_targets=" all ALL_BUILD clean edit_cache help install INSTALL list_install_components package PACKAGE
  package_source preinstall rebuild_cache RUN_TESTS test ZERO_CHECK "
if [[ ! $name =~ ^[A-Za-z_][A-Za-z0-9_]*$ ]]; then
  suggestion=${name//[^A-Za-z0-9_]/_}
  [[ $suggestion =~ ^[0-9] ]] && suggestion="effect_$suggestion"
  fail 1 "'$name' is not a C++ identifier: the name becomes the scene's class name" \
    "use letters, digits and underscores, not starting with a digit; for example '$suggestion'"
fi
[[ $keywords != *" $name "* ]] || fail 1 "'$name' is a C++ keyword: the name becomes the scene's class name" \
  "choose another, for example '${name}_effect'"
if [[ $name == *__* || $name =~ ^_[A-Z] ]]; then
  suggestion=$(sed 's/__*/_/g; s/^_//' <<<"$name")
  fail 1 "'$name' is reserved for the compiler: a C++ name may not hold '__' nor start with '_' and a capital" \
    "choose another, for example '${suggestion:-effect}'"
fi
[[ $cmake_targets != *" $name "* ]] || fail 1 "'$name' is one of CMake's own target names: the name becomes the plug-in's target" \
  "choose another, for example '${name}_effect'"

# Never over anything: a folder may exist only if it is empty.
if [ -e "$dir" ] || [ -L "$dir" ]; then
  if [ ! -d "$dir" ] || [ -L "$dir" ] || [ -n "$(ls -A "$dir")" ]; then
    fail 1 "$dir already exists and is not an empty folder; vi-new never writes over it" \
      "give another folder as the second argument, or remove this one"
  fi
fi
# Absolute, so that "." and "glow/" work as well as "glow".
target=$(realpath -m -- "$dir")
parent=$(dirname "$target")
[ -d "$parent" ] || fail 1 "the folder $(dirname "$dir"), where $dir would go, does not exist"
[ -w "$parent" ] || fail 1 "the folder $parent, where $dir would go, cannot be written to"

class="${name^}Scene"
staging=$(mktemp -d "$parent/.vi-new.XXXXXX" 2>/dev/null) || fail 1 "the folder $parent, where $dir would go, cannot be written to"
trap 'rm -rf "$staging"' EXIT
trap 'exit 130' INT
trap 'exit 143' TERM

fill() {  # fill TEMPLATE DESTINATION: the template with its placeholders replaced
  local text
  text=$(<"$template/$1")
  text=${text//@NAME@/"$name"}
  text=${text//@CLASS@/"$class"}
  text=${text//@KIT@/"$kit"}
  printf '%s\n' "$text" >"$staging/$2"
}
mkdir "$staging/assets"
fill CMakeLists.txt.in CMakeLists.txt
fill Scene.cpp.in "$class.cpp"
fill effect.vert.in "assets/$name.vert"
fill effect.frag.in "assets/$name.frag"
fill effect.timeline.in "$name.timeline"
fill README.md.in README.md
fill gitignore.in .gitignore
cp "$template/wallpaper.png" "$staging/wallpaper.png"
chmod "$(printf '%o' $((0777 & ~$(umask))))" "$staging"

# A new folder is the staging folder renamed, whole. An empty one may be the
# current folder (vi-new glow .), so it stays and the files move into it;
# should that fail, it is emptied again.
if [ -d "$target" ]; then
  written=("$staging"/* "$staging"/.gitignore)
  if ! mv -n -t "$target" -- "${written[@]}" 2>/dev/null || [ -n "$(ls -A "$staging")" ]; then
    (cd "$target" && rm -rf -- "${written[@]##*/}")
    fail 1 "$dir could not be written (something else wrote into it meanwhile)"
  fi
else
  mv -T "$staging" "$target" 2>/dev/null || fail 1 "$dir could not be written (it exists now, or its folder changed)"
  trap - EXIT
fi
echo "vi-new: wrote the effect $name into $dir"
where="cd $dir, then "
[ "$target" != "$(pwd -P)" ] || where=""
echo "  next: ${where}the three commands in its README.md (build, open in the live window, test)"
