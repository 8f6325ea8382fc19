// SPDX-License-Identifier: Apache-2.0
/// The lights of a scene file.
#pragma once

#include "load/sceneBuilder.h"

namespace zsi::host {

/// A light, with the instance that shines where it is a surface. Warns of one that lights nothing.
/// Throws InputError with the place.
void readLight(JsonReader const& reader, SceneBuilder& builder);

} // namespace zsi::host
