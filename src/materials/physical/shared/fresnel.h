// SPDX-License-Identifier: Apache-2.0
/// Reflectance of a dielectric interface.
#pragma once

#include <zsi/vecmath.h>

namespace zsi {

/// (1 - c)^5 as ((1 - c)^2)^2 (1 - c). c: cosine, 0..1.
constexpr float schlickWeight(float c)
{
    float const m = 1.0f - c;
    float const m2 = m * m;
    return m2 * m2 * m;
}

/// Reflectance at the cosine c, clamped to 0..1. r0: reflectance at normal incidence.
/// Schlick 1994, "An Inexpensive BRDF Model for Physically-based Rendering", eq. 15.
constexpr float schlick(float r0, float c)
{
    return clamp01(r0 + schlickWeight(clamp01(c)) * (1.0f - r0));
}

} // namespace zsi
