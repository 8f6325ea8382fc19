/// Clear varnish over a layer of colour: what it mirrors and what it lets down and up again.
#pragma once

#include "materials/physical/shared/fresnel.h"
#include "materials/physical/shared/ggx.h"

namespace zsi {

/// A dielectric coat of GGX facets seen along v. Directions are local to the coat's frame, unit,
/// with z > 0 for v. Layers share the light by the coat's reflectance for the way in and for the
/// way out: Kelemen and Szirmay-Kalos 2001, "A Microfacet Based Coupled Specular-Matte BRDF Model
/// with Importance Sampling", eq. 7.
class ClearCoat {
public:
    /// r0: reflectance at normal incidence, 0..1; width: of the facets' slopes, above 0, at most 1.
    ClearCoat(float r0, float width, Vec3f v)
        : r0_(r0)
        , facets_{width, width}
        , v_(v)
        , stretchedV_(facets_.stretched(v))
    {
    }

    /// Share of the light along a direction of cosine c that the coat mirrors: Schlick's curve at
    /// the mean cosine on the facets seen, which rough coats keep off the grazing end. Fitted to
    /// the integral of the lobe for widths up to 0.5; within 0.05, at grazing angles on its upper
    /// side.
    float albedo(float c) const
    {
        float const m = 1.0f - c, m2 = m * m;
        return schlick(r0_, std::sqrt(c * c + 0.36f * facets_.ax * m2 * m2));
    }
    /// What it lets through along that direction; none from below the coat.
    float passed(float c) const { return c > 0.0f ? 1.0f - albedo(c) : 0.0f; }
    float passedV() const { return passed(v_.z); }
    /// No less than the mean of `passed` over the hemisphere, weighted with the cosine, which is
    /// (1 - r0) 20/21 for a smooth coat.
    float meanPassed() const { return (1.0f - r0_) * (1.0f - 1.0f / (21.0f + 58.0f * facets_.ax)); }

    float width() const { return facets_.ax; }

    struct Value {
        float value; ///< scattering value without the cosine, 1/sr
        float pdf; ///< of `direction`, 1/sr
    };
    /// l: any unit direction; nothing below the coat.
    Value operator()(Vec3f l) const
    {
        if (!(l.z > 0.0f))
            return {0.0f, 0.0f};
        Vec3f const h = v_ + l;
        float const hh = dot(h, h);
        float const density = facets_.density(h, hh);
        float const cosine = 0.5f * std::sqrt(hh); // |v + l| is twice the cosine on the facet
        return {schlick(r0_, cosine) * density
                    * AnisotropicGgx::visibility(v_.z, stretchedV_, l.z, facets_.stretched(l)),
                AnisotropicGgx::reflectedDensity(density, v_.z, stretchedV_)};
    }

    /// A direction off the facets that v sees; it may point below the coat.
    Vec3f direction(Vec2f u) const { return facets_.mirrorVisible(v_, stretchedV_, u); }

private:
    float r0_;
    AnisotropicGgx facets_;
    Vec3f v_;
    float stretchedV_;
};

} // namespace zsi
