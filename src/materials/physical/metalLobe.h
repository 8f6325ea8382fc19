// SPDX-License-Identifier: Apache-2.0
/// Reflection of rough metal: one lobe that lights, paths and evaluation share.
#pragma once

#include "materials/physical/shared/facetLoss.h"
#include "materials/physical/shared/fresnel.h"

namespace zsi {

/// Reflectance of a metal with the colour at normal incidence and a tint near grazing incidence:
/// Schlick's curve less a bump that makes it tint x Schlick at the cosine 1/7, 82 degrees.
/// Kutz, Hasan and Edmondson 2021, "Novel aspects of the Adobe Standard Material", sec. 2.3.
struct ConductorFresnel {
    Vec3f r0; ///< reflectance at normal incidence, 0..1
    Vec3f bump;

    /// edge: 1 gives Schlick's curve; 0..1.
    ConductorFresnel(Vec3f r0_, Vec3f edge)
        : r0(r0_)
    {
        constexpr float kCosine = 1.0f / 7.0f;
        constexpr float kWeight = schlickWeight(kCosine);
        constexpr float kScale = 1.0f / (kCosine * (1.0f - kCosine) * kWeight);
        bump = (r0 * (1.0f - kWeight) + grey(kWeight)) * (grey(1.0f) - edge) * kScale;
    }

    /// c: cosine on the facet, 0..1.
    Vec3f operator()(float c) const
    {
        float const w = schlickWeight(c);
        return nonNegative(r0 * (1.0f - w) + grey(w) - bump * (c * (1.0f - c) * w));
    }

    /// Mean over the hemisphere, weighted with the cosine: the integral of 2 c F(c).
    Vec3f mean() const
    {
        return nonNegative(r0 * (20.0f / 21.0f) + grey(1.0f / 21.0f) - bump / 126.0f);
    }

private:
    /// Dark metals with a dark edge would fall below black.
    static Vec3f nonNegative(Vec3f f)
    {
        return {maxOf(f.x, 0.0f), maxOf(f.y, 0.0f), maxOf(f.z, 0.0f)};
    }
};

/// Metal seen along v; v and every l are local, unit, with z > 0. Values are 1/sr.
class MetalLobe {
public:
    /// facets: widths as `FacetLoss` takes them.
    MetalLobe(AnisotropicGgx facets, ConductorFresnel const& fresnel, Vec3f v)
        : facets_(facets)
        , fresnel_(fresnel)
        , loss_(facets)
        , v_(v)
        , stretchedV_(facets.stretched(v))
        , lossV_(loss_(v, stretchedV_))
    {
        // What the facets return after two and more bounces, of what they lose after one.
        float const lost = loss_.mean();
        Vec3f const F = fresnel.mean();
        Vec3f const rest = grey(1.0f) - F * lost;
        float const albedo = 1.0f - lost;
        further_ = {F.x * F.x * albedo / rest.x, F.y * F.y * albedo / rest.y,
                    F.z * F.z * albedo / rest.z};
        broad_ = lossV_ * kInvPi / lost;
    }

    /// Scattering value, without the cosine.
    Vec3f value(Vec3f l) const { return value(l, Facet(facets_, v_ + l)); }

    struct Sample {
        Vec3f l;
        Vec3f value;
        float pdf; ///< 1/sr; 0 where l is below the surface
    };
    /// A direction by the single bounces, or by the broad lobe as often as light bounces further.
    /// pick, u: in [0, 1).
    Sample sample(float pick, Vec2f u) const
    {
        Sample s;
        s.l = pick < lossV_ ? loss_.sample(u) : facets_.mirrorVisible(v_, stretchedV_, u);
        s.pdf = 0.0f;
        if (!(s.l.z > 0.0f))
            return s;
        Facet const facet(facets_, v_ + s.l);
        s.value = value(s.l, facet);
        s.pdf = (1.0f - lossV_) * AnisotropicGgx::reflectedDensity(facet.density, v_.z, stretchedV_)
            + lossV_ * loss_.density(s.l.z);
        return s;
    }

private:
    struct Facet {
        float density; ///< of facets that mirror l into v
        float cosine; ///< on them

        Facet(AnisotropicGgx const& facets, Vec3f h)
        {
            float const hh = dot(h, h);
            density = facets.density(h, hh);
            cosine = minOf(0.5f * std::sqrt(hh), 1.0f); // |v + l| is twice the cosine
        }
    };

    Vec3f value(Vec3f l, Facet facet) const
    {
        float const stretched = facets_.stretched(l);
        float const once =
            facet.density * AnisotropicGgx::visibility(v_.z, stretchedV_, l.z, stretched);
        return fresnel_(facet.cosine) * once + further_ * (broad_ * loss_(l, stretched));
    }

    AnisotropicGgx facets_;
    ConductorFresnel fresnel_;
    FacetLoss loss_;
    Vec3f v_;
    float stretchedV_, lossV_;
    Vec3f further_;
    float broad_;
};

} // namespace zsi
