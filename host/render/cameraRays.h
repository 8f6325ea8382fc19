// SPDX-License-Identifier: Apache-2.0
/// Rays of a camera.
#pragma once

#include "sampling/sampler.h"
#include "scene/scene.h"

namespace zsi::host {

class CameraRays {
public:
    CameraRays(Camera const& camera, FilmSettings const& film);

    /// The ray through raster position (x, y), pixels, x to the right, y downwards; `lens` in
    /// [0, 1)^2 picks the point of the lens.
    void ray(float x, float y, Vec2f lens, Vec3f& origin, Vec3f& direction) const;

private:
    Vec3f position_;
    Vec3f right_, up_, forward_; ///< unit
    float halfHeight_; ///< of the picture at distance 1
    float width_, height_; ///< pixels
    float lensRadius_;
    float focus_; ///< distance, along the axis
};

} // namespace zsi::host
