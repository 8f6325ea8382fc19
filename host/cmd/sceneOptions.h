// SPDX-License-Identifier: Apache-2.0
/// Which scene, and what the command line puts in the place of what it says.
#pragma once

#include "cmd/progressBar.h"
#include "plugin/shaderLibrary.h"
#include "scene/scene.h"

#include <array>
#include <cstdint>
#include <optional>

namespace CLI {
class App;
}

namespace zsi::cmd {

struct SceneOptions {
    std::string file;
    std::string size, crop;
    std::optional<std::int64_t> seed;
    std::optional<int> textureCache; ///< megabytes
    std::string integrator;
    std::vector<std::string> layers, assignments;
};

void addSceneOptions(CLI::App& command, SceneOptions& options);
void addThreadsOption(CLI::App& command, int& threads);

/// Throws UsageError for what no scene could make good.
void checkOptions(SceneOptions const& options);
/// Throws InputError as host::loadScene does, and UsageError.
host::Scene loadScene(SceneOptions const& options, host::ShaderLibraries const& libraries,
                      ProgressBar& bar);

/// "X0,Y0,X1,Y1" of the option of that name. Throws UsageError.
std::array<int, 4> parseWindow(char const* option, std::string const& text);
/// "A:B" of numbers from 0, A below B.
std::array<int, 2> parseRange(char const* option, std::string const& text);

} // namespace zsi::cmd
