/// Colour arithmetic of the Ward family.
#pragma once

#include <zsi/vecmath.h>

namespace zsi {

/// One channel of `f_rtMix2Color`.
constexpr float overlayThenMultiply(float a, float b, float t)
{
    float const o = a < 0.5f ? 2.0f * a * b : 1.0f - 2.0f * (1.0f - a) * (1.0f - b);
    float const m = a + (o - a) * t;
    return m + (b * m - m) * t;
}

/// `b` laid over `a`: an overlay, then a multiply, both with weight `t` (0 leaves `a`).
constexpr Vec3f mix2Color(Vec3f a, Vec3f b, float t)
{
    return {overlayThenMultiply(a.x, b.x, t), overlayThenMultiply(a.y, b.y, t),
            overlayThenMultiply(a.z, b.z, t)};
}

} // namespace zsi
