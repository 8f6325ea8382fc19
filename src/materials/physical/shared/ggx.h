// SPDX-License-Identifier: Apache-2.0
/// Trowbridge-Reitz (GGX) facets: of one squared width, reflecting and transmitting; of two widths,
/// reflecting.
///
/// Directions are unit, local (z along the normal) and point away from the surface: v to the
/// viewer, l to where light comes from or goes.
#pragma once

#include "runtime/arithmetic.h"

#include <cmath>

namespace zsi {

/// Normal of the facet that mirrors l into v; any length.
constexpr Vec3f reflectionHalf(Vec3f v, Vec3f l) { return v + l; }

/// Normal of the facet that refracts between v, in a medium of index nv, and l, in a medium of
/// index nl (eq. 16); any length. It points into the medium of the lower index, so it has the
/// upper side of the frame only where nl is above nv.
constexpr Vec3f refractionHalf(Vec3f v, float nv, Vec3f l, float nl) { return -(nl * l + nv * v); }

/// Isotropic facets of a rough interface with uncorrelated masking: Walter et al. 2007, "Microfacet
/// Models for Refraction through Rough Surfaces".
///
/// The paper's tan^2 are expanded by cos^2 here, and factors that stand above and below the line
/// are left out: one division each, and nothing blows up at grazing angles.
struct Ggx {
    float alpha2; ///< squared width, 0 or more

    /// cos + sqrt(cos^2 + alpha^2 sin^2), so that G1 is 2 cos over it (eq. 34).
    float shadowing(float c) const
    {
        float const c2 = c * c;
        // A ripple leaves normals longer than 1, whose cosines wide facets would take the root
        // below 0.
        return std::fabs(c) + std::sqrt(maxOf(0.0f, c2 + alpha2 * (1.0f - c2)));
    }

    /// Whether facets of normal h show themselves to w: else G1 is 0.
    static constexpr bool shown(Vec3f w, Vec3f h) { return dot(w, h) * w.z > 0.0f; }

    /// G1(v) G1(l) D(h) / (4 |cos v| |cos l|) (eq. 20), 1/sr. h: of any length; facets that face
    /// away give 0.
    float reflection(Vec3f v, Vec3f l, Vec3f h) const
    {
        return visible(v, l, h) ? scaled(v, l, h, dot(h, h) * dot(h, h)) : 0.0f;
    }

    /// The transmitted counterpart (eq. 21): G1(v) G1(l) D(h) |v.h| |l.h| nl^2
    /// / (|cos v| |cos l| (nv v.h + nl l.h)^2), 1/sr, for h as `refractionHalf` gives it, for which
    /// the bracket is -h.h.
    float transmission(Vec3f v, Vec3f l, Vec3f h, float nl) const
    {
        return visible(v, l, h) ? scaled(v, l, h, 4.0f * nl * nl * std::fabs(dot(v, h) * dot(l, h)))
                                : 0.0f;
    }

    /// tan^2 of the angle of a facet normal, distributed as D(h) cos h (eq. 35). xi: in [0, 1).
    float sampleTan2(float xi) const { return alpha2 * xi / (1.0f - xi); }

    /// v.h G1(v) G1(l) / (cos v cos h) (eq. 41): what a path through a sampled facet keeps, not
    /// clamped. h: unit, v.h not negative.
    float sampleWeight(Vec3f v, Vec3f l, Vec3f h) const
    {
        if (!shown(v, h) || !shown(l, h))
            return 0.0f;
        return 4.0f * dot(v, h) * std::fabs(l.z) / (shadowing(v.z) * shadowing(l.z) * h.z);
    }

private:
    static constexpr bool visible(Vec3f v, Vec3f l, Vec3f h)
    {
        return h.z > 0.0f && shown(v, h) && shown(l, h);
    }
    float scaled(Vec3f v, Vec3f l, Vec3f h, float numerator) const
    {
        float const q = h.x * h.x + h.y * h.y + alpha2 * (h.z * h.z); // (D's root) x h.h
        float const below = kPi * q * q * (shadowing(v.z) * shadowing(l.z));
        return below > 0.0f ? alpha2 * numerator / below : 0.0f; // width 0, met exactly: a mirror
    }
};

/// Facets of two widths that reflect, drawn from the normals that are visible. Directions are above
/// the surface. Distribution: Burley 2012, "Physically Based Shading at Disney", eq. 13.
/// Height-correlated masking: Heitz 2014, "Understanding the Masking-Shadowing Function in
/// Microfacet-Based BRDFs", eq. 87 and 99.
struct AnisotropicGgx {
    float ax, ay; ///< widths along tangent and bitangent, above 0: no squares

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
