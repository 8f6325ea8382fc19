// SPDX-License-Identifier: Apache-2.0
/// Matrices as scene files write them.
#pragma once

#include "json/jsonReader.h"

namespace zsi::host {

/// 16 numbers, 4 rows of 4, or {"scale", "rotate", "translate"} in that order: `scale` a number or
/// one for each axis; `rotate` [x, y, z, degrees], or an array of such, counterclockwise seen
/// against the axis (x, y, z). Points are row vectors: the translation is the last row.
Mat4f readTransform(JsonReader const& reader);

/// 9 numbers, 3 rows of 3, or {"scale", "rotate", "translate"}. With two numbers, or degrees alone
/// for `rotate`, they act on texture coordinates (u, v, 1); with axes on directions, as row
/// vectors like those of `readTransform`.
Mat3f readTransform3(JsonReader const& reader);

/// A turn of directions around the z axis, counterclockwise from above.
Mat3f turnAroundZ(float degrees);

} // namespace zsi::host
