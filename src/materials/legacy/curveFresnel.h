// SPDX-License-Identifier: Apache-2.0
/// Reflectance as a curve of four numbers, fitted to measured clear coats.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi {

/// min(ceiling, base + scale (1 - c)^exponent). cosine: clamped to 0..1.
/// curve: base, scale, exponent, ceiling.
inline float curveFresnel(float cosine, Vec4f const& curve)
{
    float const c = minOf(1.0f, maxOf(cosine, 0.0f));
    return minOf(curve.w, curve.x + curve.y * std::pow(1.0f - c, curve.z));
}

} // namespace zsi
