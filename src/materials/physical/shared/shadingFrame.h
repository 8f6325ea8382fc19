// SPDX-License-Identifier: Apache-2.0
/// The local frame of a hit, and the bumps that bend it.
///
/// A frame holds tangent, bitangent, normal. Local coordinates are (along tangent, along
/// bitangent, along normal); an azimuth phi is cos phi along the tangent, sin phi along the
/// bitangent.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// Frame of a normal as it is, unit or not: the tangent made perpendicular to it, both unit.
inline SLArray<Vec3f> orthonormalFrame(Vec3f const& tangent, Vec3f const& N)
{
    Vec3f const T = normalize(tangent - dot(tangent, N) * N);
    return {{T, normalize(cross(N, T)), N}};
}

/// Tangent and bitangent made unit and perpendicular to the normal.
inline void reorthogonalize(SLArray<Vec3f>& frame) { frame = orthonormalFrame(frame[0], frame[2]); }

/// Frame of the "tangent" attribute (object space) and a world-space normal, not normalised here.
inline SLArray<Vec3f> computeBaseFrame(Vec3f const& tangent, Vec3f const& N, Mat3f const& toWorld)
{
    return orthonormalFrame(transformDirection(toWorld, tangent), N);
}

/// Any frame about a unit normal. Duff et al. 2017, "Building an Orthonormal Basis, Revisited".
inline SLArray<Vec3f> frameAbout(Vec3f const& N)
{
    float const s = std::copysign(1.0f, N.z);
    float const a = -1.0f / (s + N.z);
    float const b = N.x * N.y * a;
    return {{{1.0f + s * N.x * N.x * a, s * b, -s * N.x}, {b, s + N.y * N.y * a, -N.y}, N}};
}

/// Gives a frame of a unit normal whose tangent vanished (a mesh without one) any tangent. Other
/// frames stay as they are.
inline void orthonormalTangent(SLArray<Vec3f>& frame)
{
    if (dot(frame[0], frame[0]) > 0.0f) [[likely]]
        return;
    frame = frameAbout(frame[2]);
}

/// World direction in local coordinates.
inline Vec3f toLocal(SLArray<Vec3f> const& frame, Vec3f const& d)
{
    return {dot(frame[0], d), dot(frame[1], d), dot(frame[2], d)};
}

/// Local direction in world space.
inline Vec3f toWorld(SLArray<Vec3f> const& frame, Vec3f const& d)
{
    return frame[0] * d.x + frame[1] * d.y + frame[2] * d.z;
}

/// Step of the finite differences on a height map, in texture coordinates.
inline constexpr float kBumpStep = 0.001f;

/// Heights (r + g + b) of a map at the transformed coordinate and one step along u and v.
inline SLArray<float> bumpHeights(TextureSampler2D const& map, Mat3f const& transform, Vec2f uv,
                                  float uvScale = 1.0f)
{
    Vec2f const p = transformUv(transform, uv) * uvScale;
    auto const height = [&map](Vec2f at) {
        Vec4f const texel = map.lookup(at);
        return texel.x + texel.y + texel.z;
    };
    return {{height(p), height({p.x + kBumpStep, p.y}), height({p.x, p.y + kBumpStep})}};
}

/// Bends the normal by three heights as `bumpHeights` gives them. The normal is not normalised and
/// tangent and bitangent stay; a flat map leaves the frame as it is.
inline void bendByHeights(SLArray<Vec3f>& frame, SLArray<float> const& heights, float amount)
{
    float const du = heights[0] - heights[1];
    float const dv = heights[0] - heights[2];
    constexpr float kFlat = 1e-5f;
    if (std::fabs(du) < kFlat && std::fabs(dv) < kFlat)
        return;
    // The differences are not divided by the step; 3.33 brings amounts near 1 to usual slopes.
    frame[2] = frame[2] + (frame[0] * du + frame[1] * dv) * (amount * 3.33f);
}

/// Bump of a height map. The caller normalises and re-orthogonalises.
inline void f_rtBumpPerturb(IShaderAPI*, ShadeState const&, SLArray<Vec3f>& frame, Vec2f uv,
                            TextureSampler2D const& map, Mat3f const& transform, float amount,
                            float uvScale)
{
    bendByHeights(frame, bumpHeights(map, transform, uv, uvScale), amount);
}

/// What follows a bump: unit normal, tangent and bitangent perpendicular to it.
inline void normalizeAndReorthogonalize(SLArray<Vec3f>& frame)
{
    frame[2] = normalize(frame[2]);
    reorthogonalize(frame);
}

} // namespace zsi
