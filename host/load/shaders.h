// SPDX-License-Identifier: Apache-2.0
/// The shaders of a scene file.
#pragma once

#include "load/sceneBuilder.h"

namespace zsi::host {

/// The class and the parameters that an object names. Warns of parameters that will be read though
/// they stand nowhere. Throws InputError with the place.
Shader readShader(JsonReader const& reader, ShaderKind wanted, SceneBuilder& builder);

/// A shader of the class that the value of `place` asks for; not having it is an error there.
Shader createShader(JsonReader const& place, std::string const& name, SceneBuilder const& builder);

} // namespace zsi::host
