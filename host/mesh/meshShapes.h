// SPDX-License-Identifier: Apache-2.0
/// Meshes that a scene makes without a file, complete.
#pragma once

#include "scene/scene.h"

namespace zsi::host {

/// A ball around the origin: u once around from +x over +y, v from the bottom to the top.
/// radius > 0; segments: of the equator, at least 3; half as many from pole to pole.
Mesh sphereMesh(float radius, int segments);

/// A box around the origin with edges of these lengths. Each face has the whole uv square, upright
/// on the sides; seen from above with v along +y on top and, mirrored, at the bottom.
Mesh boxMesh(Vec3f size);

/// A rectangle in the xy plane around the origin, facing +z; u along +x, v along +y.
Mesh planeMesh(Vec2f size);

/// A disc in the xy plane around the origin, facing +z, of 128 corners and the area of the circle.
Mesh discMesh(float radius);

} // namespace zsi::host
