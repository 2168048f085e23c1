#!/usr/bin/env bash
# The runtime exports the host's 18 JNI entry points, the vi classes plug-ins
# use and the desktop asset functions, and nothing else.
# usage: CheckExports.sh libtarqvevyncommon.so [nm of the library's toolchain]
set -euo pipefail
symbols="$("${2:-nm}" -D --defined-only "$1" | awk '{print $3}' | sort)"
jni=Java_com_tarq_android_visualeffect_common_Native_
interface="^((typeinfo |typeinfo name |vtable )for vi::|vi::|$jni|AAssetManager_open\$|AAsset_(getLength|read|close)\$)"
stray="$(c++filt <<<"$symbols" | grep -v -E "$interface" || true)"
[ -z "$stray" ] || { printf 'exported beyond the runtime interface:\n%s\n' "$stray" >&2; exit 1; }
# The unmangled names, exactly: every entry point and asset function, and no other.
expected="$(printf '%s\n' AAssetManager_open AAsset_{close,getLength,read} "$jni"{loadModel,loadTexture} \
  "$jni"prehandle{Start,InitEffect,Restart,Stop,Pause,RecycleTextures,Draw,Touch,MenuPressed,VolumeUpPressed} \
  "$jni"prehandle{VolumeDownPressed,Param,ClearEffect,Affordance,Unlock,SetOrientation} | sort)"
diff <(echo "$expected") <(grep -v '^_Z' <<<"$symbols") >&2 || { echo "(< missing, > not expected)" >&2; exit 1; }
