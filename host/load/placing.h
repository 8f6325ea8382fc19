// SPDX-License-Identifier: Apache-2.0
/// Where things of a scene file stand, which way they point and how large they are.
#pragma once

#include "json/jsonReader.h"

namespace zsi::host {

/// A point that rays can reach.
Vec3f readPosition(JsonReader const& reader);

/// `v` made unit; throws InputError at `place` that says `why` where it has no direction.
Vec3f toDirection(JsonReader const& place, Vec3f v, char const* why);

/// The unit direction from `position` to the key "target", or the key "axis".
Vec3f readAxis(JsonReader const& reader, Vec3f position);

/// The keys "position", "target" or "axis", and "up": turns +z to the axis, by default down, and +y
/// as far as can be to `up`.
Mat4f readPose(JsonReader const& reader);

/// The key "transform", one that can be undone; none is the identity.
Mat4f readPlacing(JsonReader const& reader);

/// The key "size": a positive number for all axes or one for each; none is 1.
std::vector<float> readSize(JsonReader const& reader, std::size_t axes);

} // namespace zsi::host
