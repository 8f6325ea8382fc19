// SPDX-License-Identifier: Apache-2.0
/// A model's size, and the camera that shows it.
#pragma once

#include "scene/scene.h"
#include "json/jsonTree.h"

#include <limits>
#include <span>

namespace zsi::host {

struct Bounds {
    static constexpr float kNone = std::numeric_limits<float>::infinity();
    Vec3f low{kNone, kNone, kNone}, high{-kNone, -kNone, -kNone};

    bool isEmpty() const { return !(low.x <= high.x); }
    void add(Vec3f point);
    Vec3f centre() const { return (low + high) * 0.5f; }
    float radius() const { return length(high - low) * 0.5f; } ///< of the ball around the box
};

/// Around z, counterclockwise from above, from straight before the model to where its camera
/// stands; radians.
constexpr float kCameraTurn = 0.35f;

/// A camera in front of the box, a little to the right and above, that has all of it in a picture
/// of width over height `aspect`. For a scene.
JsonValue framingCamera(Bounds const& bounds, float aspect);

} // namespace zsi::host
