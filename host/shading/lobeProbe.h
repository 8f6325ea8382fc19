// SPDX-License-Identifier: Apache-2.0
/// What a material does with light from its list and with light along its own rays, found by
/// trying.
#pragma once

#include "sampling/sampler.h"
#include "shading/preparedScene.h"

#include <functional>

namespace zsi::host {

/// Makes the record of a draw at a place and along a ray of its own choice, of the ray type given.
using TrialRecord = std::function<ShadeState(std::uint32_t rayType)>;

/// Whether `shade`, for rays of the type, takes light from its list by `transfer`, and sends rays
/// that stand for the same lobes: then what a light brings by either way may be divided between
/// them.
SharedLobes probeLobes(PreparedMaterial const& material, std::uint32_t rayType, IShaderAPI& numbers,
                       TrialRecord const& record);

/// Mean weight of the material's draws from lobes, in the brightest channel; 1 where there are
/// none.
float meanWeight(PreparedMaterial const& material, IShaderAPI& numbers, TrialRecord const& record);

} // namespace zsi::host
