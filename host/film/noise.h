// SPDX-License-Identifier: Apache-2.0
/// How far a picture still is from what it converges to.
#pragma once

#include "film/film.h"

namespace zsi::host {

/// Square of the standard error of the first layer's colour, the mean over the pixels of `part`,
/// from the difference of its halves (Rousselle et al. 2012, "Adaptive Rendering with Non-Local
/// Means Filtering", 4.1). Relative to the pixel's brightness where that is above 1, to its square
/// root below, about as the eye sees it (Dammertz et al. 2010, "A Hierarchical Automatic Stopping
/// Condition for Monte Carlo Global Illumination", eq. 3). The film keeps halves of that layer.
double squaredNoise(Film const& film, Window const& part);

} // namespace zsi::host
