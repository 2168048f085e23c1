#!/usr/bin/env bash
# The set-up scripts, unchanged, against an archive with hiccups: stand-ins
# for apt-get, dpkg-query, dpkg, id and sleep, first on PATH, play the
# archive and log its calls. usage: ArchiveHiccups.sh SOURCE_DIR (run in a
# scratch folder).
set -uo pipefail
rm -rf hiccups && mkdir -p hiccups/bin && cd hiccups || exit 1
export STATE="$PWD" PATH="$PWD/bin:$PATH" VI_APT_PAUSE=5
stand_in() { printf '#!/usr/bin/env bash\n%s\n' "$2" >"bin/$1" && chmod +x "bin/$1"; }
# Packages matching $MISSING are not installed until apt-get installs them.
stand_in dpkg-query 'grep -qx -- "${@: -1}" "$STATE/installed" || ! [[ "${@: -1}" =~ $MISSING ]] && echo "install ok installed" || { echo "dpkg-query: no packages found matching ${@: -1}" >&2; exit 1; }'
# The index update fails when $UPDATE_FAILS is set; the first $INSTALL_FAILS installs fail.
stand_in apt-get '[[ " $* " == *" update "* ]] && { [ -z "$UPDATE_FAILS" ] && exit 0; printf "E: Failed to fetch http://archive/armhf/Packages.xz  File has unexpected size (334084 != 350380). Mirror sync in progress?\nW: Some index files failed to download.\n" >&2; exit 100; }
echo install >>"$STATE/log"; [ "$(grep -c install "$STATE/log")" -gt "$INSTALL_FAILS" ] || { echo " libegl-mesa0:arm64 : Depends: libgbm1:arm64 (= 22.3.6-1) but it is not going to be installed"; echo "E: Unable to correct problems, you have held broken packages." >&2; exit 100; }
while [ "$1" != --no-install-recommends ]; do shift; done; printf "%s\n" "${@:2}" >>"$STATE/installed"'
stand_in dpkg '[ "$1" = --print-architecture ] && echo amd64 || echo arm64'
stand_in id 'echo 0'
stand_in sleep 'echo "sleep $1" >>"$STATE/log"'

install="$1/scripts/install-packages t pkg-a pkg-b" failures=0
# name | MISSING | INSTALL_FAILS | UPDATE_FAILS | tries | "status log: stderr, lines joined by ~" (regex) | command
while IFS='|' read -r name missing fails update tries want command; do
  : >installed; : >log
  MISSING="$missing" INSTALL_FAILS="$fails" UPDATE_FAILS="$update" VI_APT_TRIES="$tries" eval "$command" >out 2>err
  got="$? $(tr '\n' ' ' <log): $(paste -sd~ err)"
  grep -qE -- "$want" <<<"$got" || { echo "FAILED $name: '$got', want /$want/"; cat out err; failures=$((failures + 1)); }
done <<'ROWS'
an index fails throughout, two installs fail: pauses doubling|^pkg-|2|y|4|^0 install sleep 5 install sleep 10 install : $|$install
never: one line, the packages and apt-get's words|^pkg-|99|y|3|^75 install sleep 5 install sleep 10 install : t: the package archive could not provide pkg-a pkg-b \(after 3 tries\): libegl-mesa0:arm64 : Depends: libgbm1:arm64 \(= 22\.3\.6-1\) but it is not going to be installed; the index update said: E: Failed to fetch .*Mirror sync in progress\?$|$install
arm64 packages never come (the amd64 ones are all there): CI's skip line|:arm64$|99||2|^75 install sleep 5 install : setup-arm64: the package archive could not provide libegl-dev:arm64 [^~]*~arm64: SKIPPED, the package archive could not provide libegl-dev:arm64 .*libc6-dev:arm64 \(after 2 tries\): libegl-mesa0:arm64 : Depends: [^~]*$|$1/scripts/test-arm64
ROWS
[ $failures -eq 0 ]
