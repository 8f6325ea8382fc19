// SPDX-License-Identifier: Apache-2.0
/// What is made of a picture's texels on the way into a texture, and how it goes on at its edges.
#pragma once

#include <array>
#include <string>
#include <vector>
#include <zsi/types.h>

namespace zsi::host {

enum class EdgeMode { Repeat, Clamp, Mirror };

/// In this order, on linear values.
struct PictureTreatment {
    int channel = -1; ///< 0 to 3: this one in all; -1: as they are
    std::array<float, 4> factor{1, 1, 1, 1};
    float power = 1;
    std::vector<float> curve; ///< not empty: values over 0..1 at even steps, straight between
    float threshold = -1; ///< 0 or more: 1 from here on, else 0
    std::array<EdgeMode, 2> edges{}; ///< along u and v

    /// Whether values stay as they are but for the choice of a channel.
    bool keepsValues() const;
    Vec4f applied(Vec4f texel) const;
    /// Different for different treatments.
    std::string key() const;
};

} // namespace zsi::host
