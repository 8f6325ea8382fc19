// SPDX-License-Identifier: Apache-2.0
/// What model files bring into a scene.
#pragma once

#include "model/framing.h"
#include "model/gltfPictures.h"
#include "model/leftOut.h"

namespace zsi::host {

/// What a model brings into its scene. World: z up.
struct ModelParts {
    JsonValue meshes, materials, instances, lights; ///< objects
    JsonValue camera; ///< null: none
    float aspect = 0; ///< of the camera's picture, width over height; 0: not said
    Bounds bounds; ///< of what instances show
    std::map<std::string, std::size_t> pictures; ///< as in ModelScene
};

ModelParts gltfParts(std::filesystem::path const& file, PicturePlaces const& places,
                     LeftOut& leftOut);

/// The same of an OBJ, PLY or STL file.
ModelParts plainParts(std::filesystem::path const& file, PicturePlaces const& places,
                      LeftOut& leftOut);

} // namespace zsi::host
