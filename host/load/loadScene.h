/// Reads a JSON scene file.
#pragma once

#include "plugin/shaderSource.h"
#include "scene/scene.h"

#include <filesystem>

namespace zsi::host {

/// Loads scene, meshes, textures and shaders. Relative file names are relative to the scene file.
/// Throws InputError that names file, JSON path, what was expected, and near names.
Scene loadScene(std::filesystem::path const& file, ShaderSource const& shaders);

} // namespace zsi::host
