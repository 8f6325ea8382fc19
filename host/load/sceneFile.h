// SPDX-License-Identifier: Apache-2.0
/// Scene files put together: one file, and what it includes.
#pragma once

#include "json/jsonTree.h"

namespace zsi::host {

/// Reads the scene file and, where it has the key "include", puts it over the file that it names:
/// values of the file replace those of the included one, name by name and key by key; null takes
/// a value out. The result has neither "include" nor null. Every value keeps the file that it came
/// from. "-" is standard input, whose relative files start in the current folder. `assignments`:
/// values put over those of the files (see assignment.h). A model in the place of a scene file is
/// the scene that shows it (model/modelScene.h); `warnings` gets what of it is left out. Throws
/// InputError for files that are no JSON, cycles, and null where there is nothing.
JsonValue readSceneFile(std::filesystem::path const& file,
                        std::vector<std::string> const& assignments = {},
                        std::vector<std::string>* warnings = nullptr);

} // namespace zsi::host
