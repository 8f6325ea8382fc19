// SPDX-License-Identifier: Apache-2.0
/// Reads a JSON scene file.
#pragma once

#include "load/jsonTree.h"
#include "plugin/shaderSource.h"
#include "scene/scene.h"
#include "texture/textureStore.h"

#include <filesystem>
#include <functional>

namespace zsi::host {

struct LoadOptions {
    /// Values that stand in the place of the file's own, "PATH=VALUE" (load/assignment.h).
    std::vector<std::string> assignments = {};
    TextureOptions textures = {};
    /// Called with the path in the scene, such as "meshes.ball", of what is loaded next.
    std::function<void(std::string const& path)> progress = {};
};

/// Loads scene, meshes, textures and shaders; "-" is standard input. Relative file names are
/// relative to the file that has them. Throws InputError that names file, JSON path, what was
/// expected, and near names.
Scene loadScene(std::filesystem::path const& file, ShaderSource const& shaders,
                LoadOptions const& options = {});
/// The same from what `readSceneFile` made of the file.
Scene loadScene(JsonValue const& tree, std::filesystem::path const& file,
                ShaderSource const& shaders, LoadOptions const& options = {});

} // namespace zsi::host
