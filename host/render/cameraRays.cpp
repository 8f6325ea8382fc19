// SPDX-License-Identifier: Apache-2.0
#include "render/cameraRays.h"

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi::host {

CameraRays::CameraRays(Camera const& camera, FilmSettings const& film)
    : position_(camera.position)
    , halfHeight_(std::tan(camera.verticalFov * (3.14159265f / 360.0f)))
    , width_(static_cast<float>(film.width))
    , height_(static_cast<float>(film.height))
    , lensRadius_(camera.lensRadius)
{
    Vec3f const to = camera.target - camera.position;
    float const distance = length(to);
    forward_ = distance > 0.0f ? to / distance : Vec3f(0, 1, 0);
    right_ = cross(forward_, camera.up);
    if (!(dot(right_, right_) > 1e-12f)) // looks along `up`: any other direction will do
        right_ = cross(forward_, std::fabs(forward_.y) < 0.9f ? Vec3f(0, 1, 0) : Vec3f(1, 0, 0));
    right_ = normalize(right_);
    up_ = cross(right_, forward_);
    focus_ = camera.focusDistance > 0.0f ? camera.focusDistance : distance;
}

void CameraRays::ray(float x, float y, Vec2f lens, Vec3f& origin, Vec3f& direction) const
{
    float const sx = (2.0f * x - width_) / height_ * halfHeight_;
    float const sy = (height_ - 2.0f * y) / height_ * halfHeight_;
    Vec3f const through = forward_ + right_ * sx + up_ * sy;
    origin = position_;
    direction = through;
    if (lensRadius_ > 0.0f && focus_ > 0.0f) {
        float const r = lensRadius_ * std::sqrt(lens.x);
        float const phi = 6.28318531f * lens.y;
        Vec3f const shift = right_ * (r * std::cos(phi)) + up_ * (r * std::sin(phi));
        origin = position_ + shift;
        direction = through * focus_ - shift;
    }
    direction = normalize(direction);
}

} // namespace zsi::host
