/// What light loses by leaving the facets after one bounce, and what further bounces give back.
#pragma once

#include "materials/physical/shared/facetLossTable.h"
#include "materials/physical/shared/ggx.h"

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
/// Kulla and Conty 2017, "Revisiting Physically Based Shading at Imageworks". The loss depends on
/// the azimuth where the widths differ.
class FacetLoss {
public:
    /// The table reaches to this ratio of the widths.
    static constexpr float kLeastRatio = 0.1f;

    /// Widths in (0, 1], at most 1 : 10.
    explicit FacetLoss(AnisotropicGgx facets)
        : wide_(maxOf(facets.ax, facets.ay))
        , rootWide_(std::sqrt(wide_))
        , alongX_(facets.ax >= facets.ay)
        , isotropic_(facets.ax == facets.ay)
        , width_(rootWide_ * (kWidths - 1))
        , ratio_(isotropic_ ? kRatios - 1.0f
                            : (minOf(facets.ax, facets.ay) / wide_ - kLeastRatio)
                         * ((kRatios - 1) / (1.0f - kLeastRatio)))
    {
    }

    /// Mean of the loss over the hemisphere, weighted with the cosine.
    float mean() const
    {
        TablePosition<kMeanWidths> const width(rootWide_ * (kMeanWidths - 1));
        float const* const cell = flat(kMeanFacetLoss) + (width.node * kRatios + ratio_.node);
        float const below = lerp(cell[0], cell[1], ratio_.fraction);
        float const above = lerp(cell[kRatios], cell[kRatios + 1], ratio_.fraction);
        return wide_ * lerp(below, above, width.fraction);
    }

    /// Share of the light along w that single bounces on perfect mirrors do not send out.
    float operator()(Vec3f w) const
    {
        TablePosition<kCosines> const cosine(w.z * (1.0f + wide_) / (w.z + wide_) * (kCosines - 1));
        float const* const cell =
            flat(kFacetLoss) + (width_.node * kWidthStep + cosine.node * kCosineStep);
        auto const across = [&](float const* at) {
            return lerp(at[0], at[kCosineStep], cosine.fraction);
        };
        if (isotropic_) { // the same at every azimuth
            float const* const even = cell + (kRatios - 1) * kRatioStep;
            return lerp(across(even), across(even + kWidthStep), width_.fraction);
        }
        float const side = std::sqrt(w.x * w.x + w.y * w.y);
        TablePosition<kAzimuths> const azimuth(std::fabs(alongX_ ? w.x : w.y) / side
                                               * (kAzimuths - 1));
        auto const around = [&](float const* at) {
            return lerp(across(at), across(at + 1), azimuth.fraction);
        };
        auto const along = [&](float const* at) {
            return lerp(around(at), around(at + kRatioStep), ratio_.fraction);
        };
        float const* const uneven = cell + (ratio_.node * kRatioStep + azimuth.node);
        return lerp(along(uneven), along(uneven + kWidthStep), width_.fraction);
    }

private:
    static constexpr int kWidths = 7, kMeanWidths = 13, kRatios = 4, kCosines = 9, kAzimuths = 5;
    // From a node to its neighbour: the table is read as one row, with fixed steps from one
    // address.
    static constexpr int kCosineStep = kAzimuths, kRatioStep = kCosines * kCosineStep,
                         kWidthStep = kRatios * kRatioStep;
    static_assert(sizeof kFacetLoss == sizeof(float) * kWidths * kWidthStep);
    static_assert(sizeof kMeanFacetLoss == sizeof(float) * kMeanWidths * kRatios);

    template <class Table>
    static float const* flat(Table const& table)
    {
        return reinterpret_cast<float const*>(&table);
    }
    static float lerp(float a, float b, float t) { return a + t * (b - a); }

    float wide_, rootWide_;
    bool alongX_, isotropic_;
    TablePosition<kWidths> width_;
    TablePosition<kRatios> ratio_;
};

} // namespace zsi
