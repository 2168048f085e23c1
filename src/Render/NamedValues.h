#pragma once

// The framework's special values, each named once. The numbers are part of
// the plug-in interface (plug-ins read the fields that hold them), so they
// never change.

#include "Render/GL.h"

namespace vi {

// Texture::mKind: what a renderer must do with a texture it samples.
enum TextureKind : unsigned int {
    kPlainTexture = 0,         // a plain or cube texture
    kRenderTargetTexture = 1,  // a RenderableTexture: drawn again before it is sampled
};

// A renderer's index buffer, or an attribute's buffer, while none exists (a
// drawable without indices, an attribute not in the program, a lost context).
constexpr GLuint kNoBuffer = 0xFFFFFFFF;

// The slots of RenderableTexture::mAnchor: the binding saved by enableAnchor().
enum AnchorSlot {
    kAnchorFrameBuffer = 0,
    kAnchorX = 1,
    kAnchorY = 2,
    kAnchorWidth = 3,
    kAnchorHeight = 4,
    kAnchorSlotCount = 5,
};

// The Texture constructor's flags by name, for call sites: its parameter list
// (ten plain values) is fixed by the plug-in interface.
namespace TextureArgument {
constexpr bool kUploadOnce = true;  // static: uploaded at allocation
constexpr bool kEveryBind = false;  // dynamic: uploaded at every bind
constexpr bool kRepeat = true;
constexpr bool kNotMirrored = false;
constexpr bool kLinear = true;
constexpr bool kNotCompressed = false;
constexpr unsigned int kRgba = 4;
constexpr bool kBytes = false;
}  // namespace TextureArgument

}  // namespace vi
