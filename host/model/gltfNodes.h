// SPDX-License-Identifier: Apache-2.0
/// The nodes of a glTF file's scene at their places.
#pragma once

#include "model/gltfFile.h"
#include "model/leftOut.h"
#include "model/matrix.h"

#include <unordered_set>

namespace zsi::host {

struct GltfNode {
    std::size_t index;
    std::string name; ///< of its own among all, for a scene
    Matrix toWorld; ///< y up
};

/// The nodes of the scene that the file shows, parents before children. Refuses a node that is
/// reached twice, as in a circle.
std::vector<GltfNode> gltfNodes(GltfFile const& file);

/// Where a node's mesh stands: once, or as often as EXT_mesh_gpu_instancing says.
std::vector<Matrix> placesOf(GltfFile const& file, GltfNode const& node);

/// `name`, or with a number behind it where `taken` has it; goes into `taken`.
std::string uniqueName(std::string const& name, std::unordered_set<std::string>& taken);

} // namespace zsi::host
