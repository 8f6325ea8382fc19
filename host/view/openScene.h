// SPDX-License-Identifier: Apache-2.0
/// What a session starts from.
#pragma once

#include "plugin/shaderSource.h"
#include "json/jsonTree.h"

#include <filesystem>
#include <string>
#include <vector>

namespace zsi::view {

struct OpenedScene {
    host::JsonValue document; ///< one scene, without includes
    /// In whose folder relative names start; of a scene that is no file, in the current folder.
    std::filesystem::path file;
    bool isFile = false;
    std::vector<std::string> warnings = {}; ///< such as what of a model has no counterpart
};

/// A scene file or a model; or a shader class, on a small stage that suits its kind. `assignments`:
/// as of `zsi render --set`. Throws InputError.
OpenedScene openScene(std::string const& argument, host::ShaderSource const& shaders,
                      std::vector<std::string> const& assignments);

} // namespace zsi::view
