#pragma once

// The one place the GL and EGL headers are chosen: OpenGL ES 2.0 with the ETC1
// extension, and EGL for noticing a replaced context. Same headers on the
// phone and on the desktop (Mesa).
#include <EGL/egl.h>
#include <GLES2/gl2.h>
#include <GLES2/gl2ext.h>
