// SPDX-License-Identifier: Apache-2.0
/// Highlights: what three numbers make of them, and their lobes.
#pragma once

#include "materials/legacy/facetAlbedo.h"
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

/// Facets of one width seen along v. What single bounces lose between facets is given back in their
/// shape, so that the lobe sends out `albedo` of the light whatever its width: Turquin 2019,
/// "Practical Multiple Scattering Compensation for Microfacet Models".
///
/// Directions are local to the viewer's side, unit; v is the same for all members, above the
/// surface. Below it there is nothing.
struct GlossyLobe {
    Vec3f albedo = kBlack; ///< black: no lobe, and nothing else is set
    float width, stretchedV, compensation;

    /// width: kLeastWidth to 1.
    void set(float width_, Vec3f const& v, Vec3f const& albedo_)
    {
        albedo = albedo_;
        width = width_;
        stretchedV = facets().stretched(v);
        compensation = 1.0f / lobeAlbedo(width, v.z);
    }
    bool empty() const { return albedo == kBlack; }

    /// Scattering value for albedo 1, without the cosine, 1/sr. Its integral with the cosine is 1.
    float value(Vec3f v, Vec3f l) const
    {
        if (!(l.z > 0.0f))
            return 0.0f;
        Vec3f const h = v + l;
        return compensation * facets().density(h, dot(h, h))
            * AnisotropicGgx::visibility(v.z, stretchedV, l.z, facets().stretched(l));
    }
    /// A direction and, for any direction, the density of these, 1/sr. u: in [0, 1). The direction
    /// need not be above the surface.
    Vec3f sample(Vec3f v, Vec2f u) const { return facets().mirrorVisible(v, stretchedV, u); }
    float density(Vec3f v, Vec3f l) const
    {
        Vec3f const h = v + l;
        return AnisotropicGgx::reflectedDensity(facets().density(h, dot(h, h)), v.z, stretchedV);
    }
    /// How much of a sampled direction other facets leave, 0..1: taken as often as this, directions
    /// are distributed as value times cosine.
    float unmasked(Vec3f v, Vec3f l) const
    {
        if (!(l.z > 0.0f))
            return 0.0f;
        return l.z * (v.z + stretchedV) / (v.z * facets().stretched(l) + l.z * stretchedV);
    }

private:
    AnisotropicGgx facets() const { return {width, width}; }
};

} // namespace zsi
