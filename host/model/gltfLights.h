// SPDX-License-Identifier: Apache-2.0
/// Lights and cameras of glTF files.
#pragma once

#include "model/gltfNodes.h"

namespace zsi::host {

/// The light that a node carries (KHR_lights_punctual), for a scene; null without one.
JsonValue gltfLight(GltfFile const& file, GltfNode const& node, LeftOut& leftOut);

/// The perspective camera that a node carries, looking as far as `centre` lies before it; null
/// without one. `aspect`: gets its picture's width over height where the file says one.
JsonValue gltfCamera(GltfFile const& file, GltfNode const& node, Vec3f centre, float& aspect,
                     LeftOut& leftOut);

} // namespace zsi::host
