// SPDX-License-Identifier: Apache-2.0
/// Bump of a normal map that was laid on by `textureMapping.h`.
#pragma once

#include "environments/textureMapping.h"

namespace zsi {

/// How a normal map lies on the surface.
struct BumpPlacement {
    MappedChannel const& channel; ///< modes kMapUv to kMapAngular bend the normal
    Mat4f const& textureMatrixInverse;
    Vec3f tangent, bitangent; ///< object space, along rising uv
    MappedAxes axes{}; ///< as the mapping wrote them
};

/// Directions of rising u and v of the map, object space, any length: turns and mirrorings of the
/// transforms count, repeats do not make a bump steeper.
inline void bumpAxes(BumpPlacement const& b, Vec3f& u, Vec3f& v)
{
    float const* const m = b.channel.textureMatrix.m;
    float const* const uv = b.channel.uvMatrix.m;
    auto const column = [m](int axis) { return Vec3f(m[axis], m[4 + axis], m[8 + axis]); };
    switch (b.channel.mode) {
    case kMapUv:
        u = uv[0] * b.tangent + uv[3] * b.bitangent;
        v = uv[1] * b.tangent + uv[4] * b.bitangent;
        break;
    case kMapAngular: {
        // The angle runs from y to x, against tangentU.
        Mat3f const toObject(b.textureMatrixInverse);
        u = transformDirection(toObject, -b.axes.tangentU);
        v = transformDirection(toObject, b.axes.tangentV);
        break;
    }
    case kMapBox:
        u = column(b.axes.box.x);
        v = column(b.axes.box.y);
        break;
    default:
        u = column(0);
        v = column(1);
        break;
    }
}

/// `N` bent by a texel of a tangent-space normal map, (2r - 1, 2g - 1, 2b - 1) with red along
/// rising u; unit. amount: scales the slopes; negative turns the relief inside out.
inline Vec3f bendNormal(BumpPlacement const& b, Vec4f texel, float amount, Vec3f const& N,
                        Mat4f const& objectToWorld)
{
    if (b.channel.mode < kMapUv || b.channel.mode > kMapAngular)
        return N;
    Vec3f u, v;
    bumpAxes(b, u, v);
    Mat3f const linear(objectToWorld);
    auto const onSurface = [&](Vec3f axis) {
        axis = transformDirection(linear, axis);
        return normalize(axis - dot(axis, N) * N);
    };
    // Texels that point level or down would tear the surface open: slopes stay below 20.
    constexpr float kLeastHeight = 0.05f;
    float const z = maxOf(2.0f * texel.z - 1.0f, kLeastHeight);
    Vec3f const bent = z * N + ((2.0f * texel.x - 1.0f) * amount) * onSurface(u)
        + ((2.0f * texel.y - 1.0f) * amount) * onSurface(v);
    return normalize(bent);
}

} // namespace zsi
