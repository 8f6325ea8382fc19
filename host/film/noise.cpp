// SPDX-License-Identifier: Apache-2.0
#include "film/noise.h"

#include <cmath>

namespace zsi::host {
namespace {

constexpr double kBlack = 1e-3; ///< darker than this, errors count as here

} // namespace

double squaredNoise(Film const& film, Window const& part)
{
    double sum = 0;
    for (int y = part.y0; y < part.y1; ++y)
        for (int x = part.x0; x < part.x1; ++x) {
            double squares = 0, light = 0;
            for (std::size_t c = 0; c < 3; ++c) {
                std::array<float, 2> const half = film.halves(x, y, 0, c);
                double const a = static_cast<double>(half[0]), b = static_cast<double>(half[1]);
                // Each half has twice the variance of the whole; so has a difference of two.
                squares += (a - b) * (a - b) / 4;
                light += std::abs(a + b) / 2;
            }
            double const brightness = std::max(light / 3, kBlack);
            sum += squares / 3 / std::max(brightness, brightness * brightness);
        }
    double const pixels = static_cast<double>(part.width()) * static_cast<double>(part.height());
    return pixels > 0 ? sum / pixels : 0.0;
}

} // namespace zsi::host
