// SPDX-License-Identifier: Apache-2.0
/// The environment of a scene file.
#pragma once

#include "load/sceneBuilder.h"

namespace zsi::host {

/// A class with parameters, or a picture all around. Throws InputError with the place.
void readEnvironment(JsonReader const& reader, SceneBuilder& builder);

} // namespace zsi::host
