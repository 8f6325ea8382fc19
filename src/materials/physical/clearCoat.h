// SPDX-License-Identifier: Apache-2.0
/// Clear varnish over a layer of colour: what it mirrors and what it lets down and up again.
#pragma once

#include "materials/physical/paintTables.h"
#include "materials/physical/shared/facetLoss.h"
#include "materials/physical/shared/fresnel.h"
#include "materials/physical/shared/ggx.h"

#include <iterator>

namespace zsi {

/// A dielectric coat of GGX facets seen along v. Directions are local to the coat's frame, unit,
/// with z > 0 for v. Layers share the light by the coat's reflectance for the way in and for the
/// way out: Kelemen and Szirmay-Kalos 2001, "A Microfacet Based Coupled Specular-Matte BRDF Model
/// with Importance Sampling", eq. 7. What the facets lose to each other passes.
class ClearCoat {
public:
    /// Widths that the tables hold.
    static constexpr float kLeastWidth = 0.001f, kMostWidth = 0.5f;

    /// r0: reflectance at normal incidence, 0..1; width: of the facets' slopes, in that range.
    ClearCoat(float r0, float width, Vec3f v)
        : r0_(r0)
        , facets_{width, width}
        , width_((fourthRoot(width / kMostWidth) - kLeastNode)
                 * ((kWidths - 1) / (1.0f - kLeastNode)))
        , v_(v)
        , stretchedV_(facets_.stretched(v))
        , albedo_(albedo(v.z))
    {
    }

    /// Share of the light along v that the coat mirrors.
    float albedo() const { return albedo_; }
    float passedV() const { return 1.0f - albedo_; }
    /// What it lets through along a direction of cosine c; none from below the coat.
    float passed(float c) const { return c > 0.0f ? 1.0f - albedo(c) : 0.0f; }
    /// By how much `passed` falls where Schlick's weight rises by 1. Rough facets blur that, most
    /// towards the horizon; never more than that.
    float fall() const { return (1.0f - r0_) / (1.0f + 20.0f * facets_.ax); }
    /// Mean of `passed` over the hemisphere, weighted with the cosine.
    float meanPassed() const
    {
        float const* const below = kCoatMean[width_.node];
        float const* const above = kCoatMean[width_.node + 1];
        float const dark = lerp(below[0], above[0], width_.fraction);
        float const bright = lerp(below[1], above[1], width_.fraction);
        return 1.0f - lerp(dark, bright, r0_);
    }

    struct Value {
        float value; ///< scattering value times the cosine on the coat, 1/sr
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
        return {schlick(r0_, cosine) * density * l.z
                    * AnisotropicGgx::visibility(v_.z, stretchedV_, l.z, facets_.stretched(l)),
                AnisotropicGgx::reflectedDensity(density, v_.z, stretchedV_)};
    }

    /// A direction off the facets that v sees; it may point below the coat.
    Vec3f direction(Vec2f u) const { return facets_.mirrorVisible(v_, stretchedV_, u); }

private:
    static constexpr int kWidths = std::size(kCoatLoss), kLossCosines = std::size(kCoatLoss[0]),
                         kCosines = std::size(kCoatRise[0]);
    static constexpr float kLeastNode = 0.21147425f; // (kLeastWidth / kMostWidth)^(1/4)

    static float fourthRoot(float x) { return std::sqrt(std::sqrt(x)); }
    static float lerp(float a, float b, float t) { return a + t * (b - a); }
    template <int Columns, int Rows>
    float lookUp(float const (&table)[Rows][Columns], float column) const
    {
        TablePosition<Columns> const c(column);
        float const* const below = table[width_.node] + c.node;
        float const* const above = below + Columns;
        return lerp(lerp(below[0], below[1], c.fraction), lerp(above[0], above[1], c.fraction),
                    width_.fraction);
    }
    float albedo(float c) const
    {
        float const w = facets_.ax;
        float const sent = 1.0f - lookUp(kCoatLoss, c * (1.0f + w) / (c + w) * (kLossCosines - 1));
        float const rise = lookUp(kCoatRise, fourthRoot(c) * (kCosines - 1));
        return sent * schlick(r0_, c + rise);
    }

    float r0_;
    AnisotropicGgx facets_;
    TablePosition<kWidths> width_;
    Vec3f v_;
    float stretchedV_, albedo_;
};

} // namespace zsi
