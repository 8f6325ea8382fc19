// SPDX-License-Identifier: Apache-2.0
/// What is made of a picture's texels on the way into a texture, and how it goes on at its edges.
#pragma once

#include <array>
#include <string>
#include <vector>
#include <zsi/zsi.h>

namespace zsi::host {

enum class EdgeMode { Repeat, Clamp, Mirror };

/// In this order, on linear values.
struct PictureTreatment {
    bool fromNormals = false; ///< heights (texture/heightsOfNormals.h) in the place of normals
    int channel = -1; ///< 0 to 3: this one in all; -1: as they are
    std::array<float, 4> factor{1, 1, 1, 1};
    float power = 1;
    /// Not empty: what 0..1 of each of red, green and blue becomes, at even steps, straight
    /// between.
    std::vector<Vec3f> curve;
    float threshold = -1; ///< 0 or more: 1 from here on, else 0
    /// Not null: how much of the value counts against `ground`, by the red channel there.
    HostTexture2D const* weight = nullptr;
    std::string weightKey = {}; ///< different for different weights, and the same in each run
    float ground = 0;
    std::array<EdgeMode, 2> edges{}; ///< along u and v

    /// Whether values stay as they are but for the choice of a channel.
    bool keepsValues() const;
    /// `at`: the texel's place, v upwards.
    Vec4f applied(Vec4f texel, Vec2f at) const;
    /// Different for different treatments.
    std::string key() const;
};

} // namespace zsi::host
