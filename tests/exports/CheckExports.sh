#!/usr/bin/env bash
# The runtime exports the host's JNI entry points, the vi classes plug-ins use
# and the desktop asset functions, and nothing else.
# usage: CheckExports.sh libtarqvevyncommon.so [nm of the library's toolchain]
set -euo pipefail
library="$1"
nm="${2:-nm}"
symbols="$("$nm" -D --defined-only "$library" | awk '{print $3}')"
[ -n "$symbols" ] || { echo "no exported symbols read from $library" >&2; exit 1; }

stray="$(echo "$symbols" | c++filt | grep -v -E \
  '^(vi::|typeinfo for vi::|typeinfo name for vi::|vtable for vi::|Java_com_tarq_android_visualeffect_common_Native_|AAssetManager_open$|AAsset_(getLength|read|close)$)' || true)"
if [ -n "$stray" ]; then
  echo "exported beyond the runtime's interface:" >&2
  echo "$stray" >&2
  exit 1
fi

# Here-strings, not pipes: grep -q stops reading at its match, and under
# pipefail the writer's broken pipe would count as a miss.
methods="prehandleStart prehandleInitEffect prehandleRestart prehandleStop prehandlePause
  prehandleRecycleTextures prehandleDraw prehandleTouch prehandleMenuPressed prehandleVolumeUpPressed
  prehandleVolumeDownPressed prehandleParam prehandleClearEffect prehandleAffordance prehandleUnlock
  prehandleSetOrientation loadModel loadTexture"
missing=0
for method in $methods; do
  if ! grep -qx "Java_com_tarq_android_visualeffect_common_Native_$method" <<<"$symbols"; then
    echo "JNI entry point not exported: $method" >&2
    missing=1
  fi
done
for asset_function in AAssetManager_open AAsset_getLength AAsset_read AAsset_close; do
  if ! grep -qx "$asset_function" <<<"$symbols"; then
    echo "asset function not exported: $asset_function" >&2
    missing=1
  fi
done
count="$(echo "$symbols" | grep -c '^Java_')"
[ "$count" -eq 18 ] || { echo "expected 18 JNI entry points, found $count" >&2; missing=1; }
exit $missing
