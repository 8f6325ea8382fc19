// SPDX-License-Identifier: Apache-2.0
/// Parameters without a default that a scene forgot.
#pragma once

#include "plugin/shader.h"

#include <set>
#include <string>
#include <vector>

namespace zsi::host {

/// Names of the shader's parameters that have no default, are not in `written`, and that the
/// shader reads with the values it has now, as far as its description tells; registered order.
std::vector<std::string> unwrittenParameters(Shader const& shader,
                                             std::set<std::string> const& written);

} // namespace zsi::host
