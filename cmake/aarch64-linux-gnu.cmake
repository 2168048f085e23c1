# Cross build for arm64 Linux on an x86-64 Debian machine (scripts/test-arm64):
# Debian's aarch64 cross compiler, the arm64 libraries installed under
# multiarch (/usr/lib/aarch64-linux-gnu), and the test binaries run under
# qemu-aarch64-static by CTest, GoogleTest's test discovery and the build
# steps that run a built tool.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR aarch64)
set(CMAKE_LIBRARY_ARCHITECTURE aarch64-linux-gnu)

set(CMAKE_C_COMPILER aarch64-linux-gnu-gcc)
set(CMAKE_CXX_COMPILER aarch64-linux-gnu-g++)

# The arm64 libraries are installed beside the host's (multiarch), not in a
# sysroot: CMAKE_LIBRARY_ARCHITECTURE makes find_library and find_package look
# in /usr/lib/aarch64-linux-gnu, and the cross compiler links from there.
# The binaries run under qemu with the arm64 loader and libraries of those
# same packages (/lib/ld-linux-aarch64.so.1), Mesa's llvmpipe among them.
find_program(VI_QEMU_AARCH64 qemu-aarch64-static REQUIRED)
set(CMAKE_CROSSCOMPILING_EMULATOR ${VI_QEMU_AARCH64})

# JNI: only the headers are used, and jni_md.h for Linux is the same on every
# CPU, so the host's JDK serves. No arm64 JVM is installed: the parts that
# need one (the JVM tests, the desktop player) are left out of this build.
set(VI_HOST_JDK /usr/lib/jvm/java-17-openjdk-amd64)
set(JAVA_INCLUDE_PATH ${VI_HOST_JDK}/include CACHE PATH "")
set(JAVA_INCLUDE_PATH2 ${VI_HOST_JDK}/include/linux CACHE PATH "")
set(JAVA_AWT_INCLUDE_PATH ${VI_HOST_JDK}/include CACHE PATH "")
set(JAVA_JVM_LIBRARY ${VI_HOST_JDK}/lib/server/libjvm.so CACHE FILEPATH "not linked")
set(JAVA_AWT_LIBRARY ${VI_HOST_JDK}/lib/libjawt.so CACHE FILEPATH "not linked")
