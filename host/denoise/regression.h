// SPDX-License-Identifier: Apache-2.0
/// Weighted first-order regression of colours on features.
#pragma once

#include "denoise/nlMeans.h"

namespace zsi::host {

constexpr std::size_t kFeatures = 9; ///< albedo 3, normal 3, depth, place 2

/// Of a pixel: 1, then its features.
using FeatureRow = std::array<float, kFeatures + 1>;

/// The plane over the features around a pixel that best fits the colours of its neighbours.
class Regression {
public:
    /// `row`: 1 and the neighbour's features less the pixel's.
    void add(FeatureRow const& row, Float4 const& color, float weight);
    /// After the last `add`. `noise`: variance of each feature at the pixel, by which its slope is
    /// held back; its first entry is not used.
    void solve(FeatureRow const& noise);
    /// What the plane says where a neighbour's row is this.
    Float4 at(FeatureRow const& row) const;

private:
    static constexpr std::size_t kRows = kFeatures + 1;
    /// Four at a time, as registers have them; the colour is the last four.
    static constexpr std::size_t kLanes = 4, kColor = (kRows + kLanes - 1) / kLanes * kLanes;
    static constexpr std::size_t kColumns = kColor + 4;
    /// Weighted products of features with features and colours: from the diagonal's lanes on.
    std::array<std::array<float, kColumns>, kRows> products_{};
    std::array<Float4, kRows> plane_{};
};

} // namespace zsi::host
