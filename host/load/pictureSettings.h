// SPDX-License-Identifier: Apache-2.0
/// What a scene file says of the picture: camera, film and settings.
#pragma once

#include "scene/scene.h"
#include "json/jsonReader.h"

namespace zsi::host {

// Each takes the object under the key of its name and throws InputError with the place of what is
// out of range.
Camera readCamera(JsonReader const& reader);
FilmSettings readFilm(JsonReader const& reader);
Settings readSettings(JsonReader const& reader);

} // namespace zsi::host
