// SPDX-License-Identifier: Apache-2.0
/// Scenes on their way to other machines.
#pragma once

#include "load/loadScene.h"

namespace zsi::host {

struct PackedScene {
    Scene scene;
    /// A scene file without includes, all values of the options in their place. Names of files
    /// start at it and lead to where they are here below the folder "files", so that those which
    /// they name in turn are found beside them.
    std::string text;
    /// By their names in the text, and where they are here.
    std::vector<std::pair<std::string, std::string>> files;
};

/// Throws as `loadScene` does, which it calls.
PackedScene packScene(std::filesystem::path const& file, ShaderSource const& shaders,
                      LoadOptions const& options = {});

} // namespace zsi::host
