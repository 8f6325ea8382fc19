// SPDX-License-Identifier: Apache-2.0
/// The filter that turns samples into pixels.
#pragma once

#include <array>
#include <zsi/types.h>

namespace zsi::host {

/// Blackman-Harris window of 1.5 pixels' radius, by importance: samples are placed with the
/// filter's density and all count alike (Ernst et al. 2006, "Filter Importance Sampling"), so that
/// a pixel needs no samples of its neighbours.
class PixelFilter {
public:
    static constexpr float kRadius = 1.5f; ///< pixels

    PixelFilter();
    /// Offset from the pixel's centre, pixels, for uniform `u` in [0, 1)^2.
    Vec2f offset(Vec2f u) const { return {offset(u.x), offset(u.y)}; }

private:
    float offset(float u) const;

    static constexpr int kSteps = 2048;
    std::array<float, kSteps + 1> inverse_; ///< offset at every 1 / kSteps of the distribution
};

} // namespace zsi::host
