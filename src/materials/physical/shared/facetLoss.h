// SPDX-License-Identifier: Apache-2.0
/// What light loses by leaving the facets after one bounce, and what further bounces give back.
#pragma once

#include "materials/physical/shared/facetLossTable.h"
#include "materials/physical/shared/ggx.h"

#include <bit>
#include <cstdint>

namespace zsi {

/// Position of x, 0 up, between the nodes of a table: node below and fraction of the way to the one
/// above. What lies beyond the last node, and NaN, is taken as that node, less a rounding error
/// that keeps the node above inside the table.
template <int Nodes>
struct TablePosition {
    std::int64_t node;
    float fraction;

    explicit TablePosition(float x)
    {
        constexpr float kEnd = static_cast<float>(Nodes - 1) * (1.0f - 0x1p-24f);
        static_assert(kEnd < static_cast<float>(Nodes - 1));
        x = minOf(x, kEnd);
        node = static_cast<std::int64_t>(x);
        fraction = x - static_cast<float>(node);
    }
};

/// Multiple scattering between facets of two widths as a broad, reciprocal lobe,
///   loss(v) loss(l) / (pi mean) x colour:
/// Kulla and Conty 2017, "Revisiting Physically Based Shading at Imageworks".
///
/// The loss is read at the direction's cosine over its stretched length: in that measure narrow
/// facets of every width, ratio and azimuth lose alike, and what wide ones differ is smooth
/// (scripts/facetLossTable.cpp tells the terms).
class FacetLoss {
public:
    /// The table reaches to this ratio of the widths.
    static constexpr float kLeastRatio = 0.1f;

    /// Widths in [0.001, 1], at most 1 : 10.
    explicit FacetLoss(AnisotropicGgx facets)
        : FacetLoss(facets.ax * facets.ax, facets.ay * facets.ay)
    {
    }

    /// Mean of the loss over the hemisphere, weighted with the cosine.
    float mean() const
    {
        float mean = power_.at(kMeanFacetLoss, 0);
        if (unevenness_ != 0.0f) {
            float const d = unevenness_;
            mean += d * (power_.at(kMeanFacetLoss, 1) + d * power_.at(kMeanFacetLoss, 2));
        }
        return a2_ * mean;
    }

    /// Share of the light along w that single bounces on perfect mirrors do not send out.
    /// stretched: `AnisotropicGgx::stretched` of w.
    float operator()(Vec3f w, float stretched) const
    {
        float const scale = 1.0f / stretched;
        TablePosition<kCosines> const t(w.z * scale * (kCosines - 1));
        float const* const cell = &kFacetLoss[0][0][0] + width_.node * kWidthStep + t.node * kTerms;
        auto const term = [&](int k) {
            return lerp(lerp(cell[k], cell[k + kTerms], t.fraction),
                        lerp(cell[k + kWidthStep], cell[k + kWidthStep + kTerms], t.fraction),
                        width_.fraction);
        };
        float loss = term(0);
        if (unevenness_ != 0.0f) {
            float const narrowness = least2_ * (1.0f - w.z * w.z) * (scale * scale);
            loss += unevenness_ * (term(1) + term(2) * narrowness);
        }
        return maxOf(loss, 0.0f);
    }

    /// Density over the hemisphere that falls off as the loss of narrow facets does towards the
    /// normal, cos / (cos^2 + a^2), so that loss x cosine over it has no peak; 1/sr.
    float density(float cosine) const
    {
        return cosine * kInvPi / ((cosine * cosine + a2_) * logRange());
    }
    /// A direction of that density; it may point below the horizon. u: in [0, 1).
    Vec3f sample(Vec2f u) const
    {
        // From the cumulative log(1 + cos^2 / a^2). The table's logarithm is never too small: what
        // it adds lies above cosine 1 and is turned down.
        float const z2 = a2_ * std::expm1(u.y * logRange()), side2 = 1.0f - z2;
        float const r = std::sqrt(maxOf(side2, 0.0f)), phi = 2.0f * kPi * u.x;
        return {r * std::cos(phi), r * std::sin(phi), side2 < 0.0f ? -1.0f : std::sqrt(z2)};
    }

private:
    static constexpr int kWidths = 9, kCosines = 17, kTerms = 3, kWidthStep = kCosines * kTerms;
    static_assert(sizeof kFacetLoss == sizeof(float) * kWidths * kWidthStep);

    static float lerp(float a, float b, float t) { return a + t * (b - a); }

    /// x, the squared width, between the powers of 2 and their half-ways.
    struct Power {
        std::int32_t node;
        float fraction;

        explicit Power(float x)
        {
            std::int32_t const bits = std::bit_cast<std::int32_t>(x);
            node = (bits >> 22) - 2 * (127 + kFirstPower);
            fraction = static_cast<float>(bits & 0x3fffff) * 0x1p-22f;
        }
        template <class Table>
        float at(Table const& table, int column) const
        {
            return lerp(table[node][column], table[node + 1][column], fraction);
        }
    };
    float logRange() const { return power_.at(kMeanFacetLoss, 3); }

    FacetLoss(float x2, float y2)
        : a2_(0.5f * (x2 + y2))
        , least2_(minOf(x2, y2))
        , unevenness_(x2 == y2 ? 0.0f : 1.0f - least2_ / a2_)
        , width_(a2_ * (1.3f * (kWidths - 1)) / (a2_ + 0.3f))
        , power_(a2_)
    {
    }

    float a2_; ///< mean of the squared widths
    float least2_;
    float unevenness_; ///< difference of the squared widths over their sum
    TablePosition<kWidths> width_;
    Power power_;
};

} // namespace zsi
