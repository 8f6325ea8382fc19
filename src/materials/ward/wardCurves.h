// SPDX-License-Identifier: Apache-2.0
/// What the channels of the Ward family make of the numbers in their maps.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// Roughness that a glossiness channel stands for; x = 1 - glossiness. The curve is fitted in
/// three pieces.
constexpr float roughnessOfGlossiness(float x)
{
    if (x < 0.5f)
        return (1.11078f * x - 0.225494f) * x + 0.0505339f;
    if (x < 0.9f)
        return ((24.1745f * x - 45.6128f) * x + 28.605f) * x - 5.72202f;
    return (x - 0.9f) * 3.0f + 0.7f;
}

/// Spread of a traced refraction for a glossiness map; 0 sharp. The exponential never reaches its
/// ends, so that clear and fully blurred are taken exactly.
inline float spreadOfGlossiness(float glossiness)
{
    constexpr float kEnd = 0.01f;
    if (std::fabs(glossiness) <= kEnd)
        return 1.0f;
    if (std::fabs(glossiness - 1.0f) <= kEnd)
        return 0.0f;
    return 0.8082f * std::exp(-4.956f * glossiness);
}

/// Grey of the procedural fade: 0.58 and 0.65 blended at the mean of the noise, 0.2160714. The
/// pattern's finest octave is always wider than the filter, so that only its mean is left.
inline constexpr float kFadeGrey = 0.595125f;

/// One channel of `f_rtMix2Color`.
constexpr float overlayThenMultiply(float a, float b, float t)
{
    float const o = a < 0.5f ? 2.0f * a * b : 1.0f - 2.0f * (1.0f - a) * (1.0f - b);
    float const m = a + (o - a) * t;
    return m + (b * m - m) * t;
}

/// `b` laid over `a`: an overlay, then a multiply, both with weight `t` (0 leaves `a`).
inline Vec3f f_rtMix2Color(IShaderAPI*, ShadeState const&, Vec3f a, Vec3f b, float t)
{
    return {overlayThenMultiply(a.x, b.x, t), overlayThenMultiply(a.y, b.y, t),
            overlayThenMultiply(a.z, b.z, t)};
}

} // namespace zsi
