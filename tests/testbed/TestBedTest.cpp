// The test bed itself: a real context draws, calls are recorded on their way
// to the driver, and the context helpers give distinct contexts.
#include <gtest/gtest.h>

#include <GLES2/gl2.h>

#include "GlContext.h"
#include "GlRecorder.h"

using namespace vitest;

TEST(TestBed, ClearedFramebufferReadsBackTheClearColour) {
    GlContext gl(16, 16);
    glClearColor(1.0f, 0.0f, 0.0f, 1.0f);
    glClear(GL_COLOR_BUFFER_BIT);
    EXPECT_EQ(readPixel(3, 3), 0xFF0000FFu);
}

TEST(TestBed, RecordedCallsReachTheDriver) {
    GlContext gl(8, 8);
    GlRecording recording;
    glClearColor(0.0f, 1.0f, 0.0f, 1.0f);
    glClear(GL_COLOR_BUFFER_BIT);
    ASSERT_EQ(GlRecorder::names(), (std::vector<std::string>{"glClearColor", "glClear"}));
    EXPECT_EQ(GlRecorder::calls()[1].args[0], double(GL_COLOR_BUFFER_BIT));
    GlRecorder::stop();
    EXPECT_EQ(readPixel(0, 0), 0x00FF00FFu);
}

TEST(TestBed, SecondContextRecreatedContextAndNoContext) {
    GlContext gl(8, 8);
    EGLContext first = eglGetCurrentContext();
    EXPECT_EQ(first, gl.context());
    gl.makeSecondCurrent();
    EXPECT_NE(eglGetCurrentContext(), first);
    EXPECT_EQ(eglGetCurrentContext(), gl.secondContext());
    gl.makeCurrent();
    GLuint texture = 0;
    glGenTextures(1, &texture);
    glBindTexture(GL_TEXTURE_2D, texture);
    EXPECT_TRUE(glIsTexture(texture));
    gl.recreate();
    EXPECT_FALSE(glIsTexture(texture));
    GlContext::releaseCurrent();
    EXPECT_EQ(eglGetCurrentContext(), EGL_NO_CONTEXT);
}
