// SPDX-License-Identifier: Apache-2.0
/// Flakes in a paint: which of them a view ray meets, and what they mirror.
///
/// A flake is a facet of slope s (the tangent-plane part of its normal over the upright part) with
/// a gloss of its own. Slopes of many flakes are taken as Gaussian, so that together they mirror
/// like one wider lobe whose variance is that of the gloss plus that of the slopes; what a
/// footprint no longer resolves moves from flakes into that lobe. Olano and Baker 2010, "LEAN
/// Mapping". Local directions: z along the normal.
#pragma once

#include "materials/legacy/facetAlbedo.h"
#include "materials/physical/shared/tiltedFacets.h"

#include <cmath>
#include <cstdint>
#include <zsi/vecmath.h>

namespace zsi {

/// Squared width of the lobe of one flake: glints of some 6 degrees.
inline constexpr float kFlakeGloss = 0.01f;
/// Mean squared slope of the flakes that a flake-normal texture holds, at coarseness 1.
inline constexpr float kFlakeSlope = 0.1f;

/// Slopes beyond this many times those of the texture tell nothing apart.
inline constexpr float kMostCoarseness = 3.0f;
/// Mean of `FlakeLayer::flop` over Gaussian slopes: 1 - e E1(1), E1 the exponential integral.
inline constexpr float kMeanFlop = 0.4036526f;

/// Three numbers in [0, 1) of a cell.
/// Jarzynski and Olano 2020, "Hash Functions for GPU Rendering" (pcg3d).
inline Vec3f cellHash(std::int32_t ix, std::int32_t iy)
{
    auto const step = [](std::uint32_t v) { return v * 1664525u + 1013904223u; };
    std::uint32_t x = step(static_cast<std::uint32_t>(ix));
    std::uint32_t y = step(static_cast<std::uint32_t>(iy));
    std::uint32_t z = step(0u);
    for (int round = 0; round < 2; ++round) {
        x += y * z;
        y += z * x;
        z += x * y;
        if (round == 0) {
            x ^= x >> 16u;
            y ^= y >> 16u;
            z ^= z >> 16u;
        }
    }
    auto const unit = [](std::uint32_t v) { return static_cast<float>(v >> 8u) * 0x1p-24f; };
    return {unit(x), unit(y), unit(z)};
}

/// The cell whose flake covers p: each cell holds the centre of one flake, and the nearest wins.
inline Vec3i flakeAt(Vec2f p)
{
    auto const x0 = static_cast<std::int32_t>(std::floor(p.x));
    auto const y0 = static_cast<std::int32_t>(std::floor(p.y));
    Vec3i nearest(x0, y0, 0);
    float best = 9.0f;
    for (std::int32_t y = y0 - 1; y <= y0 + 1; ++y)
        for (std::int32_t x = x0 - 1; x <= x0 + 1; ++x) {
            Vec3f const h = cellHash(x, y);
            float const dx = static_cast<float>(x) + h.x - p.x;
            float const dy = static_cast<float>(y) + h.y - p.y;
            float const d = dx * dx + dy * dy;
            if (d < best) {
                best = d;
                nearest = {x, y, 0};
            }
        }
    return nearest;
}

/// What a view ray meets of the layer.
struct FlakeLayer {
    /// More flakes than these look no different from their mean.
    static constexpr int kMost = 16;

    struct Flake {
        Vec2f slope;
        float weight; ///< of the sum over the flakes, 1 in total
    };
    Flake flake[kMost];
    int count = 0;
    float resolved = 0.0f; ///< share of the layer that shows as flakes and not as their mean, 0..1
    float spread = 0.0f; ///< mean squared slope; 0: all flakes lie flat

    /// Squared width of the lobe of many flakes.
    float alpha2() const { return kFlakeGloss + spread; }

    /// Share of the second flake colour at a slope: flakes that lie flat show the first colour,
    /// those that lean more than most the second. variance: mean squared slope of all of them.
    static float flop(Vec2f s, float variance)
    {
        float const tilt = s.x * s.x + s.y * s.y;
        return tilt > 0.0f ? tilt / (tilt + variance) : 0.0f;
    }
    float flop(Flake const& f) const { return flop(f.slope, spread); }

    /// What is left of the light along v after one bounce on white flakes, 0..1. What they lose to
    /// each other, more bounces give back: `glint` is to be divided by it, as by Turquin 2019,
    /// "Practical Multiple Scattering Compensation for Microfacet Models".
    float albedo(Vec3f v) const { return flakeAlbedo(std::sqrt(alpha2()), v.z); }

    /// Colour that flakes mirror from l to v in one bounce, for a light of irradiance pi. h: unit.
    Vec3f glint(Vec3f v, Vec3f l, Vec3f h, Vec3f const& color, Vec3f const& color2) const
    {
        // Smith shadowing of all flakes for each: they lie in the same layer.
        auto const shadowing = [this](float c) {
            return c + std::sqrt(c * c + alpha2() * (1.0f - c * c));
        };
        float const visible = 1.0f / (shadowing(v.z) * shadowing(l.z));
        Vec3f sum(0.0f, 0.0f, 0.0f);
        if (resolved < 1.0f) {
            float const t =
                spread > 0.0f && h.z > 0.0f ? flop({h.x / h.z, h.y / h.z}, alpha2()) : 0.0f;
            sum = mix(color, color2, t) * ((1.0f - resolved) * facetsAbout(h, {0, 0}, alpha2()));
        }
        for (int i = 0; i < count; ++i)
            sum += mix(color, color2, flop(flake[i]))
                * (resolved * flake[i].weight * facetsAbout(h, flake[i].slope, kFlakeGloss));
        return sum * visible;
    }
};

} // namespace zsi
