/// Highlights: what three numbers make of them, and their lobes.
#pragma once

#include "materials/legacy/surfaceShares.h"
#include "materials/physical/shared/fresnel.h"
#include "materials/physical/shared/ggx.h"

namespace zsi {

/// Narrowest lobe, as a facet width: lights are points, and must not vanish in a mirror.
inline constexpr float kLeastWidth = 0.02f;
constexpr float lobeWidth(float w) { return minOf(maxOf(w > 0.0f ? w : -w, kLeastWidth), 1.0f); }

/// A highlight as roll-off, eccentricity, gain.
///
/// Eccentricity is the width of Trowbridge-Reitz facets as Blinn 1977, "Models of Light Reflection
/// for Computer Synthesized Pictures", gives it (c3): 0 a mirror, 1 as blurred as can be. Roll-off
/// is the part of the highlight that is lost from grazing to facing, along the curve of Schlick
/// 1994: 0 equally strong from everywhere, 1 only at the rim. Gain scales.
struct Highlight {
    float rollOff, width, gain;

    explicit Highlight(Vec3f const& numbers)
        : rollOff(saturate(numbers.x))
        , width(lobeWidth(numbers.y))
        , gain(maxOf(numbers.z, 0.0f))
    {
    }
    /// Of the light around the mirror direction, at the cosine of the viewer.
    float strength(float cosine) const { return gain * schlick(1.0f - rollOff, cosine); }
};

/// Facets of one width that mirror `part` of the light. Directions are local, unit; below the
/// surface there is nothing.
struct GlossyLobe {
    float width = 1.0f; ///< kLeastWidth..1
    Vec3f part{0.0f, 0.0f, 0.0f};

    /// Scattering value for part 1, without the cosine, 1/sr. Its integral with the cosine is at
    /// most 1.
    float value(Vec3f v, Vec3f l) const
    {
        if (!(v.z > 0.0f && l.z > 0.0f))
            return 0.0f;
        AnisotropicGgx const facets{width, width};
        Vec3f const h = v + l;
        return facets.density(h, dot(h, h))
            * AnisotropicGgx::visibility(v.z, facets.stretched(v), l.z, facets.stretched(l));
    }
    /// A direction and, for any direction, the density of these, 1/sr. u: in [0, 1). v above the
    /// surface; the direction need not be.
    Vec3f sample(Vec3f v, Vec2f u) const
    {
        AnisotropicGgx const facets{width, width};
        return facets.mirrorVisible(v, facets.stretched(v), u);
    }
    float density(Vec3f v, Vec3f l) const
    {
        AnisotropicGgx const facets{width, width};
        Vec3f const h = v + l;
        return AnisotropicGgx::reflectedDensity(facets.density(h, dot(h, h)), v.z,
                                                facets.stretched(v));
    }
};

} // namespace zsi
