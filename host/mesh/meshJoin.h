// SPDX-License-Identifier: Apache-2.0
/// Parts of a file as one mesh.
#pragma once

#include "scene/scene.h"

namespace zsi::host {

/// All parts as one mesh, each of which has one entry in `parts`. Arrays that only some have are
/// filled for the others; tangents of several are left to be made anew.
Mesh joined(std::vector<Mesh>& parts);

} // namespace zsi::host
