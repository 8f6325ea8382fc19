// SPDX-License-Identifier: Apache-2.0
/// How alike the surroundings of two pixels are, beyond their noise.
#pragma once

#include "base/grid.h"
#include "film/window.h"

#include <array>
#include <cstddef>
#include <vector>

namespace zsi::host {

using Float4 = std::array<float, 4>;

template <class T>
struct Raster {
    int width = 0, height = 0;
    std::vector<T> pixels = {}; ///< rows from the top

    Raster() = default;
    Raster(int w, int h)
        : width(w)
        , height(h)
        , pixels(cellCount(w, h))
    {
    }
    T& at(int x, int y) { return pixels[index(x, y)]; }
    T const& at(int x, int y) const { return pixels[index(x, y)]; }
    std::size_t index(int x, int y) const { return cellIndex(x, y, width); }
};

/// Mean over the square of 2 `radius` + 1 pixels around each, as far as it lies in the picture.
Raster<Float4> boxMean(Raster<Float4> const& picture, int radius);

/// What non-local means compares.
struct NoisyRaster {
    Raster<Float4> const& value;
    Raster<Float4> const& variance; ///< of `value`
    Float4 shares; ///< of each channel in the distance
};

/// Weights exp(-d) of the pixels at (dx, dy) from those of `tile`, written row by row to `weights`;
/// 0 beyond the picture and where there is next to nothing. d compares patches of 2 `patch` + 1
/// pixels by squared differences less the variance that noise gives them, over the variance
/// (Rousselle, Knaus, Zwicker 2012, equations 5 and 6, with k = 1).
void nlMeansWeights(NoisyRaster const& picture, Window const& tile, int dx, int dy, int patch,
                    float* weights);

} // namespace zsi::host
