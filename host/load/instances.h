// SPDX-License-Identifier: Apache-2.0
/// The instances of a scene file.
#pragma once

#include "load/sceneBuilder.h"

namespace zsi::host {

/// A mesh in one material, or each part of a mesh in its own. Throws InputError with the place.
void readInstance(JsonReader const& reader, SceneBuilder& builder);

} // namespace zsi::host
