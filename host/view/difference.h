// SPDX-License-Identifier: Apache-2.0
/// How much two pictures differ, in numbers and as a picture.
#pragma once

#include "view/display.h"

namespace zsi::view {

/// Root of the mean square over pixels and colour channels, linear; the largest difference
/// likewise.
struct LinearDifference {
    double rmse = 0, largest = 0;
};
/// Of RGBA layers of the same size; alpha does not count.
LinearDifference linearDifference(std::vector<float> const& a, std::vector<float> const& b);

/// Of each pixel, 0 (none) to 1: what somebody sees who flips between two pictures on a screen with
/// `pixelsPerDegree` of the field of view. Andersson et al. 2020, "FLIP: A Difference Evaluator for
/// Alternating Images", for displayed pictures. Throws InputError unless the sizes are the same.
std::vector<float> flipDifference(ShownPicture const& reference, ShownPicture const& test,
                                  double pixelsPerDegree = 67.0206);

} // namespace zsi::view
