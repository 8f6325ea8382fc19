// SPDX-License-Identifier: Apache-2.0
/// Noise functions behind the services.
#pragma once

#include <zsi/types.h>

namespace zsi::host {

// Gradient noise after Perlin 2002, "Improving Noise", on hashed lattices that do not repeat.
// Coordinates that are not finite count as 0. Neighbouring floats beyond 2^24 are whole numbers,
// where gradient noise has its mean value.

float noise2D(Vec2f p); ///< in [0, 1], mean 1/2
float signedNoise3D(Vec3f p); ///< in [-1, 1], mean 0
float noise3D(Vec3f p); ///< in [0, 1], mean 1/2
float noise4D(Vec4f p); ///< in [0, 1], mean 1/2

float cellNoise1D(float x); ///< in [0, 1), constant from one integer to the next
Vec3f cellNoise3D(Vec3f p); ///< in [0, 1), constant within an integer cell

} // namespace zsi::host
