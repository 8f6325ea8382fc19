// SPDX-License-Identifier: Apache-2.0
/// Built-in functions of the shading language that are more than plain arithmetic.
#pragma once

#include "runtime/arithmetic.h"

#include <cmath>

namespace zsi {

/// N turned against I as Nref tells: N where I.Nref < 0, -N where it is > 0, and the zero vector
/// where it is exactly 0 or NaN.
inline Vec3f sl_lib_faceforward(Vec3f const& N, Vec3f const& I, Vec3f const& Nref)
{
    float const d = dot(I, Nref);
    if (d < 0.0f)
        return N;
    return d > 0.0f ? -N : Vec3f(0.0f, 0.0f, 0.0f);
}

/// Margin below which refraction counts as total internal reflection.
inline constexpr float kTotalReflectionMargin = 0.000001f;

/// Refracted direction, not renormalised; (0, 0, 0) at total internal reflection.
/// eta: index on I's side over index beyond. The caller turns N against I.
inline Vec3f sl_lib_refract(Vec3f const& I, Vec3f const& N, float eta)
{
    float const c = std::fabs(dot(I, N));
    float const k = 1.0f + eta * eta * (c * c - 1.0f);
    if (k <= kTotalReflectionMargin)
        return {0.0f, 0.0f, 0.0f};
    return eta * I + (eta * c - std::sqrt(k)) * N;
}

/// Logarithm to base 2.
inline float sl_lib_log2(float x)
{
    static float const fInvLog2 = 1.0f / std::log(2.0f);
    return std::log(x) * fInvLog2;
}

/// Logarithm to base 10.
inline float sl_lib_log10(float x)
{
    static float const fInvLog10 = 1.0f / std::log(10.0f);
    return std::log(x) * fInvLog10;
}

/// The same vector copied float by float: GCC takes a copy of the block through memory.
constexpr Vec3f scalars(Vec3f const& v) { return {v.x, v.y, v.z}; }

/// -1 where the ray meets the side that `Ng` points to, +1 on the far side, 0 edge on.
inline float facingSign(Vec3f const& I, Vec3f const& Ng) { return sign(dot(I, Ng)); }

} // namespace zsi
