// SPDX-License-Identifier: Apache-2.0
/// The meshes of a scene file.
#pragma once

#include "scene/scene.h"
#include "json/jsonReader.h"

namespace zsi::host {

/// A mesh of a file or a shape, complete. Appends to the scene's warnings what was mended, and to
/// its further files. Throws InputError with the place.
Mesh readMesh(JsonReader const& reader, Scene& scene);

} // namespace zsi::host
