// SPDX-License-Identifier: Apache-2.0
/// Directions drawn in proportion to a radiance.
#pragma once

#include <cstdint>
#include <functional>
#include <vector>
#include <zsi/vecmath.h>

namespace zsi::host {

/// A density over the sphere that follows what a radiance has above its mean, made to be combined
/// with another way of drawing directions that covers the rest: what multiple importance sampling
/// gives to that one needs no draws of this (Karlik et al. 2019, "MIS Compensation").
class DirectionMap {
public:
    /// Nothing stands out: `density` is 0 everywhere and `sample` must not be called.
    DirectionMap() = default;
    /// Asks `radiance` for unit directions all around, 1024 x 512 of them. Where it is smooth, four
    /// make a cell: a smaller map is at hand sooner.
    explicit DirectionMap(std::function<float(Vec3f)> const& radiance);

    bool isEmpty() const { return rows_.empty(); }
    struct Drawn {
        Vec3f direction;
        float density; ///< 1/sr
    };
    /// A unit direction for `u` in [0, 1)^2; neighbours stay neighbours.
    Drawn sample(Vec2f u) const;
    float density(Vec3f d) const; ///< of `sample` at unit `d`, 1/sr

private:
    float cellDensity(int row, int column) const;

    int width_ = 0, height_ = 0; ///< in cells
    float perCell_ = 0.0f; ///< 1 over their solid angle, which is the same for all
    std::vector<float> rows_; ///< shares up to and with each row
    std::vector<float> columns_; ///< shares up to and with each cell within its row
    /// For equal parts of [0, 1) the first cell of the row, and behind the rows the first row, with
    /// a share above it: where the search for a cell begins.
    std::vector<std::uint16_t> first_;
};

} // namespace zsi::host
