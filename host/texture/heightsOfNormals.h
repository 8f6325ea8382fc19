// SPDX-License-Identifier: Apache-2.0
/// Normal maps as height maps, for materials that are bent by heights.
#pragma once

#include <vector>
#include <zsi/types.h>

namespace zsi::host {

/// Heights whose slopes are nearest to those of a normal map, by least squares over a picture that
/// repeats: Frankot, Chellappa 1988, "A Method for Enforcing Integrability in Shape from Shading
/// Algorithms". `normals`: texels as they are stored, 0 to 1 for -1 to 1, rows from the top, y up.
/// A height of 1 is the picture's width along u and its height along v.
std::vector<float> heightsOfNormals(std::vector<Vec3f> const& normals, int width, int height);

} // namespace zsi::host
