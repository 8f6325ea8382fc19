// SPDX-License-Identifier: Apache-2.0
/// What a glTF material says of a picture.
#pragma once

#include "model/gltfFile.h"

#include <zsi/vecmath.h>

namespace zsi::host {

/// A picture of a material: glTF's "textureInfo".
struct GltfTexture {
    std::size_t image = 0; ///< index
    std::filesystem::path ownFile =
        {}; ///< not empty: of a model that is no glTF file, in its place
    int set = 0; ///< TEXCOORD_n
    Mat3f transform{1, 0, 0, 0, 1, 0, 0, 0, 1}; ///< of uv whose v runs upwards
    bool isTransformed = false;
    JsonValue wrap; ///< as scenes write it; null: repeats
};

/// `info`: a material's "...Texture".
GltfTexture gltfTexture(GltfFile const& file, JsonReader const& info);

/// Sets of texture coordinates that the material of a primitive uses.
struct UvSets {
    int uv = 0, uv1 = 0;
    Mat3f uv1Transform{1, 0, 0, 0, 1, 0, 0, 0, 1};
};
UvSets uvSetsOf(GltfFile const& file, JsonReader const& primitive);

/// The pictures of a material but its occlusion, those first whose set counts; readers of
/// "textureInfo".
std::vector<JsonReader> picturesOf(JsonReader const& material);

/// `reader[key]` of an object, by several keys one after another.
std::optional<JsonReader> findPath(JsonReader const& reader,
                                   std::initializer_list<char const*> keys);

} // namespace zsi::host
