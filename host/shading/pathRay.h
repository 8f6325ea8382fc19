/// A ray on its way through the scene.
#pragma once

#include "shading/media.h"

#include <cstdint>
#include <zsi/zsi.h>

namespace zsi::host {

struct PathRay {
    Vec3f E; ///< where it began, as the record tells
    Vec3f origin; ///< from where it is traced: `E` off its surface, or behind an ignored hit
    Vec3f direction; ///< unit
    std::uint32_t type = kRayCamera;
    std::uint32_t depth = 0; ///< bends and bounces before it; going on straight does not count
    int passes = 0; ///< how often it went on straight through a surface
    int ignored = 0; ///< how many hits it passed as if nothing had been there
    int diffuseBounces = 0;
    float importance = 1.0f; ///< the most that it counts in the picture
    MediumStack media = {};
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
