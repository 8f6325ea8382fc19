// SPDX-License-Identifier: Apache-2.0
/// What is known of a shader class, for people and for programs.
#pragma once

#include "plugin/shader.h"

#include <nlohmann/json_fwd.hpp>
#include <string>
#include <vector>

namespace zsi::cmd {

using Json = nlohmann::ordered_json;

std::string classText(host::Shader const& shader); ///< for a terminal
std::string classMarkdown(host::Shader const& shader); ///< a page, as in docs/shaders
Json classJson(host::Shader const& shader); ///< docs/host.md tells the keys

/// What a new object holds; null for a texture, which is empty, and for what has no default.
Json defaultJson(host::Parameter const& parameter);

/// A line for each class.
std::string listText(std::vector<host::Shader> const& shaders);
Json listJson(std::vector<host::Shader> const& shaders);

} // namespace zsi::cmd
