// SPDX-License-Identifier: Apache-2.0
/// Procedural bumps of the Ward family, built on the host's noise.
///
/// A height pattern takes a point in pattern space and gives a height in 0..1.
#pragma once

#include "materials/physical/shared/proceduralNormal.h"

namespace zsi {

/// Values of `u_procedureMapEnable`.
enum ProcedureMap : int {
    kProcedureNone = 0,
    kProcedureNoise = 1, ///< ripple, the same as the dielectric's
    kProcedureBrush = 2,
    kProcedureSmoke = 3,
    kProcedureCells = 4,
};
/// Whether this value is a pattern; others bend nothing.
constexpr bool isProcedure(int kind) { return kind >= kProcedureNoise && kind <= kProcedureCells; }

/// Brushed metal: streaks, made of noise that is stretched per axis; two octaves, the second of
/// half the width and strength.
inline float f_rtBrushNoise(IShaderAPI* api, ShadeState const&, Vec3f p, Vec3f frequency)
{
    Vec3f const q = p * frequency;
    Vec4f const coarse = withAlpha(q, 0.0f);
    Vec4f const fine = withAlpha(q * 2.0f, 0.5f);
    float const wide = api->noise3D(&coarse);
    return (2.0f * wide + api->noise3D(&fine)) / 3.0f;
}

/// Smoke: turbulence, a sum of absolute signed noise (Perlin 1985, "An Image Synthesizer"), as a
/// density of 0..1. `ramp`, where there is one, shapes it into a height.
inline float f_rtSmokeNoise(IShaderAPI* api, ShadeState const&, Vec3f p, Vec3f frequency,
                            TextureSampler1D const& ramp)
{
    constexpr int kOctaves = 4;
    Vec3f q = p * frequency;
    float density = 0.0f;
    float amplitude = 1.0f;
    for (int i = 0; i < kOctaves; ++i) {
        density += amplitude * std::fabs(api->noise3DPoint(&q));
        q = q * 2.0f;
        amplitude *= 0.5f;
    }
    density = clamp01(density);
    return ramp.texture ? ramp.lookup(density).x : density;
}

/// Cells: distance to the nearest of one feature point per unit cube (Worley 1996, "A Cellular
/// Texture Basis Function", F1), clamped to 1. jitter: how far the points stray from the middle of
/// their cube, 0 a lattice .. 1 the whole cube.
inline float f_rtCellular(IShaderAPI* api, ShadeState const&, Vec3f p, Vec3f jitter)
{
    Vec3f const base(std::floor(p.x), std::floor(p.y), std::floor(p.z));
    float nearest2 = 1.0f;
    for (int i = 0; i < 27; ++i) {
        int const x = i % 3 - 1, y = i / 3 % 3 - 1, z = i / 9 - 1;
        Vec3f const cell =
            base + Vec3f(static_cast<float>(x), static_cast<float>(y), static_cast<float>(z));
        Vec3f const middle = cell + grey(0.5f); // the middle, so that rounding finds its cube
        Vec3f const d = middle + jitter * (api->cellNoise3D(&middle) - grey(0.5f)) - p;
        nearest2 = minOf(nearest2, dot(d, d));
    }
    return std::sqrt(nearest2);
}

/// Height of a height pattern at `p`.
inline float patternHeight(IShaderAPI* api, ShadeState const& state, int kind, Vec3f p,
                           TextureSampler1D const& smokeRamp)
{
    switch (kind) {
    case kProcedureBrush:
        return f_rtBrushNoise(api, state, p,
                              {0.5f, 40.0f, 40.0f}); // streaks 80 times as long as wide
    case kProcedureSmoke:
        return f_rtSmokeNoise(api, state, p, {1.0f, 1.0f, 1.0f}, smokeRamp);
    default:
        return f_rtCellular(api, state, p, {0.9f, 0.9f, 0.9f});
    }
}
/// Cells of a height pattern per unit of pattern space, across its features.
constexpr float patternFrequency(int kind) { return kind == kProcedureBrush ? 40.0f : 1.0f; }

/// Offset of the normal, in frame coordinates, that a pattern makes of itself at P.
/// toWorld: object axes as rows; tiling: repeats per unit along them.
inline Vec3f patternOffset(IShaderAPI* api, ShadeState const& state, int kind, Vec3f P,
                           Mat3f const& toWorld, Vec3f tiling, TextureSampler1D const& smokeRamp,
                           SLArray<Vec3f> const& frame)
{
    if (kind == kProcedureNoise)
        return castRippleOffset(api, state, P, toWorld, tiling, frame);
    auto const pattern = [&](Vec3f at) {
        return f_elm_rtpb_XYZGenerator(api, state, kPatternObject, at, toWorld,
                                       Vec4f(0.0f, 0.0f, 0.0f, 0.0f), tiling,
                                       Vec3f(-0.6f, -0.6f, 0.5f), 0.0f, 0.0f);
    };
    // Slopes per cell of the pattern: neither its tiling nor its kind changes the depth.
    constexpr float kStep = 0.1f; // cells
    float const step = kStep / patternFrequency(kind);
    Vec3f const p = pattern(P);
    float const here = patternHeight(api, state, kind, p, smokeRamp);
    auto const slope = [&](Vec3f along) {
        Vec3f const q = p + normalize(pattern(P + along) - p) * step;
        return (here - patternHeight(api, state, kind, q, smokeRamp)) / kStep;
    };
    float const alongTangent = slope(frame[0]);
    return {alongTangent, slope(frame[1]), 0.0f};
}

} // namespace zsi
