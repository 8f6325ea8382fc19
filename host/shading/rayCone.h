// SPDX-License-Identifier: Apache-2.0
/// How wide what a ray stands for is along its way.
/// Akenine-Moeller et al. 2021, "Improved Shader and Texture Level of Detail Using Ray Cones".
#pragma once

#include <cmath>

namespace zsi::host {

/// Signed: behind a focus the width is below 0.
struct RayCone {
    float width = 0.0f; ///< where the ray begins, scene units
    float spread = 0.0f; ///< growth of the width per unit of length

    RayCone after(float distance) const { return {width + spread * distance, spread}; }
    /// Mirrored. curvature: 1 / radius, positive where the centre lies beyond the surface.
    RayCone mirrored(float curvature) const { return {width, spread + 2.0f * curvature * width}; }
    /// Refracted from a medium of index n1 into n2, for directions near the normal.
    RayCone refracted(float curvature, float n1, float n2) const
    {
        return {width, (n1 * spread - (n2 - n1) * curvature * width) / n2};
    }
    /// One of many directions, drawn with `density` per steradian: a quarter of the width of
    /// 1 / density, since it is one of several.
    RayCone scattered(float density) const
    {
        return {std::fabs(width), std::fabs(spread) + 0.25f / std::sqrt(density)};
    }
};

} // namespace zsi::host
