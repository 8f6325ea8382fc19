// SPDX-License-Identifier: Apache-2.0
/// Light that a value sends back, without a sampler's help.
#pragma once

#include "lab/specimen.h"

#include <cstdint>

namespace zsi::lab {

struct Estimate {
    Vec3f mean;
    Vec3f error; ///< standard, of each channel
};

/// The integral of the value times the cosine over the upper hemisphere, from `points` directions.
Estimate reflected(Specimen const& specimen, Vec3f wi, int points, std::uint32_t seed, int threads);

} // namespace zsi::lab
