// SPDX-License-Identifier: Apache-2.0
/// Light that leaves perfectly reflecting facets after one bounce, by width and direction.
#pragma once

#include "materials/legacy/albedoTables.h"

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi {

/// Interpolated in a table of albedoTables.h. rootLeast: root of the table's least width; width:
/// from that to 1; cosine: 0..1, of the direction.
template <int Widths, int Cosines>
float facetAlbedo(float const (&table)[Widths][Cosines], float rootLeast, float width, float cosine)
{
    // Whatever comes, NaN included, ends between the first node and a little before the last.
    auto const position = [](float x, int nodes) {
        float const end = static_cast<float>(nodes - 1);
        return maxOf(0.0f, minOf(x * end, end * (1.0f - 0x1p-23f)));
    };
    float const y = position((std::sqrt(width) - rootLeast) / (1.0f - rootLeast), Widths);
    float const x = position(cosine * (1.0f + width) / (cosine + width), Cosines);
    int const row = static_cast<int>(y), column = static_cast<int>(x);
    float const t = x - static_cast<float>(column);
    auto const at = [&](float const(&nodes)[Cosines]) {
        return nodes[column] + t * (nodes[column + 1] - nodes[column]);
    };
    float const below = at(table[row]), above = at(table[row + 1]);
    return below + (y - static_cast<float>(row)) * (above - below);
}

/// Trowbridge-Reitz facets, of widths from 0.02 on.
inline float lobeAlbedo(float width, float cosine)
{
    return facetAlbedo(kLobeAlbedo, 0.14142136f, width, cosine);
}

/// Facets of Gaussian slopes, of widths from 0.1 on.
inline float flakeAlbedo(float width, float cosine)
{
    return facetAlbedo(kFlakeAlbedo, 0.31622777f, width, cosine);
}

} // namespace zsi
