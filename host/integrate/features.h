// SPDX-License-Identifier: Apache-2.0
/// What a camera ray shows without its light: what tells a denoiser where edges are.
#pragma once

#include "shading/shadingContext.h"

namespace zsi::host {

/// Of the first rough surface; where smooth glass or a mirror shows several, the mean by what each
/// counts.
struct Feature {
    Vec3f albedo{0, 0, 0}; ///< each channel in [0, 1]
    Vec3f normal{0, 0, 0}; ///< interpolated; 0 where only the environment or a lamp is seen
    float depth = 0.0f; ///< length of the way there; 0 likewise
};

/// The feature of a camera ray. The albedo is what the materials' `shade` shows where no lamp
/// shines, nothing is occluded and 1 arrives from everywhere; the environment's and a lamp's is
/// their colour, dimmed to 1. Draws from `random` and never asks for the sampler of `context`.
Feature findFeature(ShadingContext& context, PathRay const& ray, Sampler random);

} // namespace zsi::host
