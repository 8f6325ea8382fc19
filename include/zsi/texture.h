// SPDX-License-Identifier: Apache-2.0
/// Texture handles, and the texture object that a host puts behind them.
#pragma once

#include <zsi/types.h>

namespace zsi {

/// A texture as the host implements it. Filtering, wrapping and mip selection are the host's.
/// Coordinate: float (1D), Vec2f (2D) or a Vec3f direction of any length (cube).
template <class Coordinate>
class HostTexture {
public:
    /// Two operations for the host's own use; shaders never call them.
    virtual void reserved0() = 0;
    virtual void reserved1() = 0;

    /// Writes the filtered texel (linear RGBA) into `result`, which arrives as (0, 0, 0, 1).
    /// Called from many threads at once; must not throw.
    virtual void lookup(Vec4f* result, Coordinate const* coordinate) const = 0;

protected:
    ~HostTexture() = default; // owned by the host, never deleted through this class
};

using HostTexture1D = HostTexture<float>;
using HostTexture2D = HostTexture<Vec2f>;
using HostTextureCube = HostTexture<Vec3f>;

/// Handle: the host's texture object (null = no texture) and a word that belongs to the host.
template <class Coordinate>
struct TextureSampler {
    HostTexture<Coordinate> const* texture = nullptr;
    std::int64_t index = -1;

    /// Filtered texel, linear RGBA; (0, 0, 0, 1) where there is no texture or it writes nothing.
    Vec4f lookup(Coordinate const& coordinate) const
    {
        Vec4f result(0.0f, 0.0f, 0.0f, 1.0f);
        if (texture)
            texture->lookup(&result, &coordinate);
        return result;
    }
};

struct TextureSampler1D : TextureSampler<float> { };
struct TextureSampler2D : TextureSampler<Vec2f> { };
struct TextureSamplerCube : TextureSampler<Vec3f> { };

static_assert(sizeof(TextureSampler1D) == 16 && sizeof(TextureSampler2D) == 16);
static_assert(sizeof(TextureSamplerCube) == 16 && alignof(TextureSamplerCube) == 8);

} // namespace zsi
