/// Parameters without a default that a scene forgot.
#pragma once

#include "plugin/shader.h"

#include <set>
#include <string>
#include <vector>

namespace zsi::host {

/// Names of the shader's parameters that have no default, are not in `written`, and that the
/// shader will read with the values it has now; registered order.
///
/// A shader does not tell what it reads, so names do. A parameter of a channel, such as
/// `<x>Transform`, is not read while a switch of the channel (`<x>Enable`, `<x>MapEnable`) is off,
/// `<x>Mode` is another mode than the parameter is for, or the channel's texture (`<x>Map`,
/// `<x>Texture`, `<x>Cube`, `<x>`) is not bound. Another matrix is not read while none of the
/// shader's cubes is bound. Everything else counts as read.
std::vector<std::string> unwrittenParameters(Shader const& shader,
                                             std::set<std::string> const& written);

} // namespace zsi::host
