// SPDX-License-Identifier: Apache-2.0
/// How wide a look-up looks: a hint from the renderer around calls of shaders.
#pragma once

namespace zsi::host {

/// While one lives, look-ups of 2D textures on this thread average over about `width` in texture
/// coordinates (1: the picture) by reading smaller levels of the picture. Shaders
/// look up points, so this is the way by which they get anything but single texels of a large
/// picture seen from afar. Scopes nest; without one, or with width 0, textures are read at full
/// size.
///
/// The width is that of the mesh's own coordinates. A shader that scales them up reads sharper
/// levels than it might, which costs noise; one that scales them down blurs.
class TextureFootprint {
public:
    explicit TextureFootprint(float width)
        : outer_(current_)
    {
        current_ = width;
    }
    ~TextureFootprint() { current_ = outer_; }
    TextureFootprint(TextureFootprint const&) = delete;
    TextureFootprint& operator=(TextureFootprint const&) = delete;

    static float width() { return current_; }

private:
    inline static thread_local constinit float current_ = 0.0f;
    float outer_;
};

} // namespace zsi::host
