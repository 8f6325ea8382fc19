// SPDX-License-Identifier: Apache-2.0
/// A ray on its way through the scene.
#pragma once

#include "shading/media.h"
#include "shading/rayCone.h"

#include <cstdint>
#include <limits>
#include <zsi/zsi.h>

namespace zsi::host {

struct PathRay {
    Vec3f E{0, 0, 0}; ///< where it began, as the record tells
    Vec3f origin{0, 0,
                 0}; ///< from where it is traced: `E` off its surface, or behind an ignored hit
    Vec3f direction{0, 0, 1}; ///< unit
    std::uint32_t type = kRayCamera;
    std::uint32_t depth = 0; ///< bends and bounces before it; going on straight does not count
    int passes = 0; ///< how often it went on straight through a surface
    int ignored = 0; ///< how many hits it passed as if nothing had been there
    float importance = 1.0f; ///< the most that it counts in the picture
    MediumStack media = {};
    RayCone cone = {}; ///< from `E` on
    Vec3f scatteredAt{0, 0, 0}; ///< where it was last bent or bounced
    /// Of the lobe that it was drawn from, per steradian, where the lights were asked as well: what
    /// of a surface light's emission the ray stands for, and what the light list does, adds up to
    /// one (balance heuristic; Veach 1997, 9.2.2). Infinite: the ray stands for all of it.
    float lobeDensity = std::numeric_limits<float>::infinity();
    /// Likewise for the sky, which rays that meet nothing at all share with directions drawn from
    /// the sky itself.
    float skyDensity = std::numeric_limits<float>::infinity();
};

/// Who answers what light comes along a ray that a shading service sends out: the integrator.
class RadianceSource {
public:
    /// Colour and alpha that arrive at the ray's origin.
    virtual Vec4f radiance(PathRay ray) = 0;

protected:
    ~RadianceSource() = default;
};

} // namespace zsi::host
