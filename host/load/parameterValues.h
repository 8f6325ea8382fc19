// SPDX-License-Identifier: Apache-2.0
/// From JSON to what a shader's parameters take.
#pragma once

#include "plugin/shader.h"
#include "json/jsonReader.h"

namespace zsi::host {

class TextureStore;

/// The value of a parameter of `type`. Pictures are loaded into `textures`, which owns them.
/// Throws InputError with the place when the value is of another type or out of range, or a
/// picture cannot be read.
ParameterValue readParameterValue(JsonReader const& reader, ParameterType type,
                                  TextureStore& textures);

/// A cube of the picture that the key "file" of an object names, with its "colorSpace";
/// `halfAngle`: radians over which it is averaged. Throws as above.
HostTextureCube const* readPictureAround(JsonReader const& reader, float halfAngle,
                                         TextureStore& textures);

} // namespace zsi::host
