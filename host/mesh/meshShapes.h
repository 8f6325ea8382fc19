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

/// A floor that bends up into a wall, as behind a photographer's table: the floor in the xy plane
/// around the origin, facing +z; at its end towards +y an arc of this radius, and the wall above
/// it. size: width along x, depth along y, height; 0 < radius <= depth and height. u along +x, v
/// along the bend from the floor's front to the wall's top.
Mesh sweepMesh(Vec3f size, float radius);

/// A disc in the xy plane around the origin, facing +z, of 128 corners and the area of the circle.
Mesh discMesh(float radius);

} // namespace zsi::host
