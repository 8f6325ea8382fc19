/// Anisotropic Trowbridge-Reitz (GGX) facets that reflect.
///
/// Directions are unit, local (z along the normal), above the surface and point away from it.
/// Distribution: Burley 2012, "Physically Based Shading at Disney", eq. 13. Height-correlated
/// masking: Heitz 2014, "Understanding the Masking-Shadowing Function in Microfacet-Based BRDFs",
/// eq. 87 and 99.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi {

inline constexpr float kPi = 3.14159265f;
inline constexpr float kInvPi = 0.318309886f;

struct AnisotropicGgx {
    float ax, ay; ///< widths along tangent and bitangent, above 0

    /// Length of w stretched by the widths: 2 cos / (cos + this) is G1.
    float stretched(Vec3f w) const
    {
        float const x = ax * w.x, y = ay * w.y;
        return std::sqrt(x * x + y * y + w.z * w.z);
    }

    /// Density of facet normals at h of any length, hh = h.h; 1/sr.
    float density(Vec3f h, float hh) const
    {
        float const x = h.x / ax, y = h.y / ay;
        float const q = x * x + y * y + h.z * h.z;
        float const r = hh / q;
        return r * r / (kPi * ax * ay);
    }

    /// G2 / (4 cos v cos l); stretchedV, stretchedL: of the two directions.
    static float visibility(float cosV, float stretchedV, float cosL, float stretchedL)
    {
        return 0.5f / (cosV * stretchedL + cosL * stretchedV);
    }

    /// Density of `mirrorVisible`'s directions, 1/sr. d: facet density of the half vector.
    static float reflectedDensity(float d, float cosV, float stretchedV)
    {
        return d / (2.0f * (cosV + stretchedV));
    }

    /// v mirrored about a facet drawn from those that v sees; it may point below the surface.
    /// u: in [0, 1). Heitz 2018, "Sampling the GGX Distribution of Visible Normals", in the form
    /// of Dupuy and Benyoub 2023, "Sampling Visible GGX Normals with Spherical Caps".
    Vec3f mirrorVisible(Vec3f v, float stretchedV, Vec2f u) const
    {
        float const scale = 1.0f / stretchedV;
        float const vz = v.z * scale;
        float const phi = 2.0f * kPi * u.x;
        float const z = (1.0f - u.y) * (1.0f + vz) - vz;
        float const r = std::sqrt(maxOf(0.0f, 1.0f - z * z));
        Vec3f const h((r * std::cos(phi) + ax * v.x * scale) * ax,
                      (r * std::sin(phi) + ay * v.y * scale) * ay, z + vz);
        return h * (2.0f * dot(v, h) / dot(h, h)) - v;
    }
};

} // namespace zsi
