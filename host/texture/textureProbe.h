// SPDX-License-Identifier: Apache-2.0
/// Stands in for pictures while a shader is asked what it can do at all.
#pragma once

#include <cstdint>
#include <zsi/types.h>

namespace zsi::host {

/// While one lives, look-ups of 2D textures on this thread give numbers in (0, 1) that differ from
/// one to the next: what a shader does anywhere under its maps shows after few calls, however small
/// the part of a map that holds it.
class TextureProbe {
public:
    TextureProbe() { current_ = this; }
    ~TextureProbe() { current_ = nullptr; }
    TextureProbe(TextureProbe const&) = delete;
    TextureProbe& operator=(TextureProbe const&) = delete;

    static TextureProbe* current() { return current_; }
    Vec4f texel() { return {number(), number(), number(), number()}; }

private:
    float number()
    {
        state_ = state_ * 1664525u + 1013904223u; // Press et al., "Numerical Recipes", 7.1
        return (static_cast<float>(state_ >> 8) + 0.5f) * 0x1p-24f;
    }

    inline static thread_local constinit TextureProbe* current_ = nullptr;
    std::uint32_t state_ = 1;
};

} // namespace zsi::host
