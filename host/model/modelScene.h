// SPDX-License-Identifier: Apache-2.0
/// Models as scenes: glTF, GLB, OBJ, PLY and STL files, with a camera, lights and a ground where
/// they bring none.
#pragma once

#include "model/gltfPictures.h"

namespace zsi::host {

/// By its name: .gltf, .glb, .obj, .ply, .stl.
bool isModel(std::filesystem::path const& file);

struct ModelScene {
    JsonValue document; ///< whose names of files start in the folder that was asked for
    std::vector<std::string> warnings; ///< what has no counterpart, once each
    /// Pictures that the document names below that folder and that lie in the model: names, and
    /// numbers of the file's images.
    std::map<std::string, std::size_t> pictures;
};

/// Throws InputError that names the file and the place in it. What only the meshes' data tells
/// is found here; what only the pictures' does may be found when the scene is loaded.
ModelScene modelScene(std::filesystem::path const& file, PicturePlaces const& places);

} // namespace zsi::host
