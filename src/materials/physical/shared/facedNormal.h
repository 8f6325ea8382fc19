// SPDX-License-Identifier: Apache-2.0
/// The normal that the utility materials shade with.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// `N`, reversed on request, then turned away from the far side on request: the test takes the
/// geometric normal, so a bent shading normal never decides the side.
inline Vec3f facedNormal(ShadeState const& state, bool reverseNormal, bool faceForward)
{
    Vec3f const n = reverseNormal ? -state.N : state.N;
    return faceForward && dot(state.Ng, state.I) > 0.0f ? -n : n;
}

/// The colour that shows which way a normal faces, 0..1: blue fronts and yellow backs; two-sided
/// green with `faceForward`, two-sided orange with `faceLight`.
inline Vec3f facingColor(ShadeState const& state, bool reverseNormal, bool faceForward,
                         bool faceLight)
{
    float const d = dot(state.I, facedNormal(state, reverseNormal, faceForward));
    Vec3f c;
    if (faceForward)
        c = Vec3f(0.05f, 0.8f, 0.05f) * std::fabs(d);
    else if (faceLight)
        c = Vec3f(0.45f, 0.65f, 0.35f) * std::fabs(d);
    else if (dot(state.I, reverseNormal ? -state.Ng : state.Ng) > 0.0f)
        // The side is the geometric normal's, d the shading normal's: where they disagree, black.
        c = {d, d, 0.0f};
    else
        c = {-0.05f * d, -0.05f * d, -0.8f * d};
    return clamp01(c);
}

/// Writes the colour and leaves the alpha.
inline void writeRgb(ShadeState& state, Vec3f c)
{
    state.Ci.x = c.x;
    state.Ci.y = c.y;
    state.Ci.z = c.z;
}

} // namespace zsi
