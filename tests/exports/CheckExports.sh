#!/usr/bin/env bash
# The runtime exports the host's 18 JNI entry points, the vi classes plug-ins
# use and the desktop asset functions, and nothing else.
# usage: CheckExports.sh libtarqvevyncommon.so [nm of the library's toolchain]
set -euo pipefail
symbols="$("${2:-nm}" -D --defined-only "$1" | awk '{print $3}' | sort)"
stray="$(c++filt <<<"$symbols" | grep -v -E '^((typeinfo for |typeinfo name for |vtable for )?vi::|Java_com_tarq_android_visualeffect_common_Native_|AAssetManager_open$|AAsset_(getLength|read|close)$)' || true)"
[ -z "$stray" ] || { printf 'exported beyond the runtime interface:\n%s\n' "$stray" >&2; exit 1; }
expected="$(printf '%s\n' AAssetManager_open AAsset_close AAsset_getLength AAsset_read \
  Java_com_tarq_android_visualeffect_common_Native_{prehandle{Start,InitEffect,Restart,Stop,Pause,RecycleTextures,Draw,Touch,MenuPressed,VolumeUpPressed,VolumeDownPressed,Param,ClearEffect,Affordance,Unlock,SetOrientation},loadModel,loadTexture} | sort)"
missing="$(comm -23 <(echo "$expected") <(grep -v '^_Z' <<<"$symbols"))"
[ -z "$missing" ] || { printf 'not exported:\n%s\n' "$missing" >&2; exit 1; }
[ "$(grep -c '^Java_' <<<"$symbols")" -eq 18 ] || { echo "not 18 JNI entry points" >&2; exit 1; }
