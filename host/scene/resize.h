// SPDX-License-Identifier: Apache-2.0
/// The same view with more or fewer pixels.
#pragma once

#include "scene/scene.h"

namespace zsi::host {

/// Gives the film another size. The crop keeps its share of the picture. A backplate, whose
/// parameters `uv_scale`, `uv_offset` and `render_size` count in pixels, keeps its place behind the
/// things that the camera sees: its height fits as before, its middle stays in the middle.
void resize(Scene& scene, int width, int height);

} // namespace zsi::host
