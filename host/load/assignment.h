// SPDX-License-Identifier: Apache-2.0
/// Values of a scene given apart from its file.
#pragma once

#include "json/jsonTree.h"

#include <string>

namespace zsi::host {

/// "PATH=VALUE": puts VALUE in the place of what `scene` has at PATH, before the scene is built.
/// PATH: keys with points between them, such as `materials.glass.parameters.u_ior`, and `[i]` for
/// an element of an array. VALUE: JSON, or a string without its quotes; null takes out what is
/// there. Files that it names are relative to the current folder. `option`: what messages call it.
/// Throws InputError that begins with `option`.
void assign(JsonValue& scene, std::string const& assignment, std::string const& option);

} // namespace zsi::host
