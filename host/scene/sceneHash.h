// SPDX-License-Identifier: Apache-2.0
/// Tells scenes apart by what they show.
#pragma once

#include "scene/scene.h"

namespace zsi::host {

/// SHA-1 in hexadecimal of all that a sample of a picture depends on: camera, size of the frame,
/// settings, meshes, materials, instances, lights, environment and the bytes of picture files. Not
/// of names, crop, layers, exposure, the number of samples and when to stop. Reads the picture
/// files again.
std::string sceneHash(Scene const& scene);

} // namespace zsi::host
