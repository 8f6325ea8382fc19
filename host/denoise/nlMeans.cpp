// SPDX-License-Identifier: Apache-2.0
#include "denoise/nlMeans.h"

#include <algorithm>
#include <cmath>

namespace zsi::host {

Raster<Float4> boxMean(Raster<Float4> const& picture, int radius)
{
    // Along the rows, then along the columns; both passes divide by what lies in the picture.
    auto const pass = [radius](Raster<Float4> const& from, bool rows) {
        Raster<Float4> to(from.width, from.height);
        for (int y = 0; y < from.height; ++y)
            for (int x = 0; x < from.width; ++x) {
                int const at = rows ? x : y, end = rows ? from.width : from.height;
                int const first = std::max(0, at - radius), last = std::min(end - 1, at + radius);
                Float4 sum{};
                for (int i = first; i <= last; ++i)
                    for (std::size_t c = 0; c < 4; ++c)
                        sum[c] += (rows ? from.at(i, y) : from.at(x, i))[c];
                for (std::size_t c = 0; c < 4; ++c)
                    to.at(x, y)[c] = sum[c] / static_cast<float>(last - first + 1);
            }
        return to;
    };
    return pass(pass(picture, true), false);
}

void nlMeansWeights(NoisyRaster const& picture, Window const& tile, int dx, int dy, int patch,
                    float* weights)
{
    constexpr float kFarthest = 7.0f; // weights below 1e-3 bring nothing but time
    Raster<Float4> const& value = picture.value;
    Raster<Float4> const& variance = picture.variance;
    // Pixels that patches of the tile reach and whose partners are in the picture.
    Window const all{0, 0, value.width, value.height};
    Window const reach =
        intersection({tile.x0 - patch, tile.y0 - patch, tile.x1 + patch, tile.y1 + patch},
                     intersection(all, {-dx, -dy, value.width - dx, value.height - dy}));
    int const width = reach.width(), height = reach.height();
    auto const at = [width](int x, int y) { return cellIndex(x, y, width); };
    thread_local std::vector<float> distance, rows;
    distance.resize(cellCount(width, height));
    rows.resize(distance.size());
    for (int y = 0; y < height; ++y) {
        Float4 const* const p = &value.pixels[value.index(reach.x0, reach.y0 + y)];
        Float4 const* const q = &value.pixels[value.index(reach.x0 + dx, reach.y0 + y + dy)];
        Float4 const* const vp = &variance.pixels[value.index(reach.x0, reach.y0 + y)];
        Float4 const* const vq = &variance.pixels[value.index(reach.x0 + dx, reach.y0 + y + dy)];
        for (int x = 0; x < width; ++x) {
            float sum = 0.0f;
            for (std::size_t c = 0; c < 4; ++c) {
                float const difference = p[x][c] - q[x][c];
                sum += picture.shares[c]
                    * (difference * difference - (vp[x][c] + std::min(vp[x][c], vq[x][c])))
                    / (1e-10f + vp[x][c] + vq[x][c]);
            }
            distance[at(x, y)] = sum;
        }
    }
    auto const first = [patch](int i) { return std::max(0, i - patch); };
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) {
            float sum = 0.0f;
            int const last = std::min(width - 1, x + patch);
            for (int i = first(x); i <= last; ++i)
                sum += distance[at(i, y)];
            rows[at(x, y)] = sum / static_cast<float>(last - first(x) + 1);
        }
    for (int y = tile.y0; y < tile.y1; ++y)
        for (int x = tile.x0; x < tile.x1; ++x, ++weights) {
            *weights = 0.0f;
            if (!reach.contains(x, y))
                continue;
            int const row = y - reach.y0, last = std::min(height - 1, row + patch);
            float sum = 0.0f;
            for (int i = first(row); i <= last; ++i)
                sum += rows[at(x - reach.x0, i)];
            float const d = sum / static_cast<float>(last - first(row) + 1);
            if (d < kFarthest)
                *weights = std::exp(-std::max(0.0f, d));
        }
}

} // namespace zsi::host
