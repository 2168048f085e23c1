#pragma once

// The runtime is built with hidden visibility: only what plug-ins and the host
// use is exported. Classes and functions a plug-in links against carry VI_EXPORT;
// JNI entry points carry JNIEXPORT.
#if defined(__GNUC__)
#define VI_EXPORT __attribute__((visibility("default")))
#define VI_HIDDEN __attribute__((visibility("hidden")))
#else
#define VI_EXPORT
#define VI_HIDDEN
#endif
