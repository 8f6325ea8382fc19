// SPDX-License-Identifier: Apache-2.0
/// Facets with Gaussian slopes about a tilted mean.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi {

/// Density of facet normals h around the slope s, times pi, 1/sr: Beckmann facets of squared width
/// alpha2 about a tilted mean. A slope is the tangent-plane part of a normal over its upright part.
inline float facetsAbout(Vec3f h, Vec2f s, float alpha2)
{
    constexpr float kLevel = 1e-6f; // no facets; its fourth power is still a number
    if (h.z <= kLevel)
        return 0.0f;
    float const dx = h.x / h.z - s.x, dy = h.y / h.z - s.y, z2 = h.z * h.z;
    return std::exp(-(dx * dx + dy * dy) / alpha2) / (alpha2 * z2 * z2);
}

} // namespace zsi
