// SPDX-License-Identifier: Apache-2.0
/// Reads a JSON scene file.
#pragma once

#include "plugin/shaderSource.h"
#include "scene/scene.h"
#include "texture/textureStore.h"
#include "json/jsonTree.h"

#include <filesystem>
#include <functional>

namespace zsi::host {

struct LoadOptions {
    /// Values that stand in the place of the file's own, "PATH=VALUE" (load/assignment.h).
    std::vector<std::string> assignments = {};
    TextureOptions textures = {};
    /// Not null: pictures that it holds are not read again.
    std::shared_ptr<TextureStore> textureStore = {};
    /// A mesh that is there already, by its name in the scene; the others are read.
    std::function<std::optional<Mesh>(std::string const& name)> knownMesh = {};
    /// Called with the path in the scene, such as "meshes.ball", of what is loaded next.
    std::function<void(std::string const& path)> progress = {};
};

/// Loads scene, meshes, textures and shaders; "-" is standard input. Relative file names are
/// relative to the file that has them. Throws InputError that names file, JSON path, what was
/// expected, and near names.
Scene loadScene(std::filesystem::path const& file, ShaderSource const& shaders,
                LoadOptions const& options = {});
/// The same of a document that has been read already; assignments are not looked at. `file`: what
/// messages call it.
Scene loadScene(JsonValue const& document, std::filesystem::path const& file,
                ShaderSource const& shaders, LoadOptions const& options = {});

} // namespace zsi::host
