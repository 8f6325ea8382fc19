// SPDX-License-Identifier: Apache-2.0
/// Procedural bends of the normal: cast-glass ripple and orange peel.
#pragma once

#include "materials/physical/shared/shadingFrame.h"

#include <cmath>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

enum PatternSpace : int {
    kPatternWorld = 0, ///< world axes
    kPatternObject = 1, ///< the object's axes, lengths still in world units
};

/// Pattern coordinate of a position: taken along the axes that `mode` tells, times `tiling`, plus
/// `offset`; `shift` (xyz) is added before the tiling, `turn` (radians) rotates it about z and
/// `jitter` scales the shift's w, which moves all three axes alike. toWorld: object axes as rows.
inline Vec3f f_elm_rtpb_XYZGenerator(IShaderAPI*, ShadeState const&, int mode, Vec3f P,
                                     Mat3f const& toWorld, Vec4f const& shift, Vec3f tiling,
                                     Vec3f offset, float turn, float jitter)
{
    Vec3f p = P;
    if (mode == kPatternObject) {
        float const* m = toWorld.m;
        p = {dot(normalize({m[0], m[1], m[2]}), P), dot(normalize({m[3], m[4], m[5]}), P),
             dot(normalize({m[6], m[7], m[8]}), P)};
    }
    p = p + rgb(shift) + grey(jitter * shift.w);
    if (turn != 0.0f) {
        float const c = std::cos(turn), s = std::sin(turn);
        p = {c * p.x - s * p.y, s * p.x + c * p.y, p.z};
    }
    return p * tiling + offset;
}

/// Offset of the normal in frame coordinates (along T, B, N), of order 1: the downhill slope of a
/// two-octave noise height along T and B. P: pattern coordinate; frequency: cells per unit of it;
/// lacunarity: frequency ratio of the second octave; coarse, fine: weights of the octaves' slopes.
/// Six calls of `noise3D`. Slopes are measured in each octave's own cells (Perlin 1985, "An Image
/// Synthesizer", calls the second octave's scaling the 1/f sum), so the size of the offset does
/// not depend on the frequency.
inline Vec3f f_noiseEvalNormalPerturb(IShaderAPI* api, ShadeState const&, Vec3f P, float frequency,
                                      float lacunarity, float coarse, float fine, Vec3f const& T,
                                      Vec3f const& B, Vec3f const& /*N*/)
{
    constexpr float kStep = 0.1f; // of a cell: small against a bump, large against rounding
    constexpr float kContrast = 2.0f; // [0, 1] noise has half the slope of signed noise
    float du = 0.0f, dv = 0.0f, cells = frequency;
    for (int octave = 0; octave < 2; ++octave) {
        float const weight = octave == 0 ? coarse : fine;
        Vec3f const p = P * cells;
        auto const height = [api](Vec3f at) {
            Vec4f const pointAndPhase(at.x, at.y, at.z, 0.0f);
            return api->noise3D(&pointAndPhase);
        };
        float const h = height(p);
        float const k = weight * kContrast / kStep;
        du += (h - height(p + T * kStep)) * k;
        dv += (h - height(p + B * kStep)) * k;
        cells *= lacunarity;
    }
    return {du, dv, 0.0f};
}

/// The library's finish: fixed frequencies and weights. frame: T and B in the pattern's axes.
inline Vec3f rippleOffset(IShaderAPI* api, ShadeState const& state, Vec3f patternPosition,
                          SLArray<Vec3f> const& frame)
{
    return f_noiseEvalNormalPerturb(api, state, patternPosition, 2.6f, 2.0f, 1.0f, 0.5f, frame[0],
                                    frame[1], frame[2]);
}

/// Cast-glass ripple at P: the finish in the object's axes, tiled. Slopes are taken along the
/// surface in pattern units, so a turned object keeps its ripple and tiling changes its size only.
inline Vec3f castRippleOffset(IShaderAPI* api, ShadeState const& state, Vec3f P,
                              Mat3f const& toWorld, Vec3f tiling, SLArray<Vec3f> const& frame)
{
    auto const pattern = [&](Vec3f at, Vec3f offset) {
        return f_elm_rtpb_XYZGenerator(api, state, kPatternObject, at, toWorld,
                                       Vec4f(0.0f, 0.0f, 0.0f, 0.0f), tiling, offset, 0.0f, 0.0f);
    };
    Vec3f constexpr kNone(0.0f, 0.0f, 0.0f);
    SLArray<Vec3f> const inPattern{
        {normalize(pattern(frame[0], kNone)), normalize(pattern(frame[1], kNone)), frame[2]}};
    return rippleOffset(api, state, pattern(P, Vec3f(-0.6f, -0.6f, 0.5f)), inPattern);
}

/// Adds an offset in frame coordinates to the normal, which is not normalised, and turns tangent
/// and bitangent after it.
inline void bendByOffset(SLArray<Vec3f>& frame, Vec3f d)
{
    frame[2] = frame[2] + d.x * frame[0] + d.y * frame[1] + d.z * frame[2];
    reorthogonalize(frame);
}

} // namespace zsi
