// SPDX-License-Identifier: Apache-2.0
/// One mesh of a glTF file.
#pragma once

#include "model/gltfFile.h"
#include "scene/scene.h"

namespace zsi::host {

/// `meshes[index]` as it is in the file, y up, with a part for each of its primitives: named by its
/// number, with the name of its material. Points and lines are left out. v runs upwards. `uv` is
/// the set that the material's pictures use, `uv1` the one of its occlusion, taken through that
/// picture's transform.
Mesh readGltfMesh(GltfFile const& file, std::size_t index);

/// A primitive that has triangles.
bool hasTriangles(JsonReader const& primitive);

} // namespace zsi::host
