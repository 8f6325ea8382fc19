// SPDX-License-Identifier: Apache-2.0
#include "model/framing.h"

#include "json/jsonText.h"

#include <cmath>

namespace zsi::host {
namespace {

constexpr float kFov = 26; ///< vertical, degrees: a portrait lens
constexpr float kFilled = 0.86f; ///< of the picture, by the box
constexpr float kRadians = 0.0174532925f;

} // namespace

void Bounds::add(Vec3f p)
{
    low = {minOf(low.x, p.x), minOf(low.y, p.y), minOf(low.z, p.z)};
    high = {maxOf(high.x, p.x), maxOf(high.y, p.y), maxOf(high.z, p.z)};
}

JsonValue framingCamera(Bounds const& bounds, float aspect)
{
    constexpr float kRise = 0.32f; // slope of the view
    Vec3f const back = // from the target to the camera
        normalize(Vec3f(std::sin(kCameraTurn), -std::cos(kCameraTurn), kRise));
    Vec3f const right = normalize(cross(Vec3f(0, 0, 1), back)), up = cross(back, right);
    Vec3f const centre = bounds.centre();
    float const tanY = std::tan(0.5f * kFov * kRadians) * kFilled, tanX = tanY * aspect;
    float distance = 0;
    for (int corner = 0; corner < 8; ++corner) {
        Vec3f const p = Vec3f(corner & 1 ? bounds.high.x : bounds.low.x,
                              corner & 2 ? bounds.high.y : bounds.low.y,
                              corner & 4 ? bounds.high.z : bounds.low.z)
            - centre;
        float const wide = maxOf(std::fabs(dot(p, right)) / tanX, std::fabs(dot(p, up)) / tanY);
        distance = maxOf(distance, wide + dot(p, back));
    }
    if (!(distance > 0.0f))
        distance = 1;
    return jsonObject({{"position", jsonShort(centre + back * distance)},
                       {"target", jsonShort(centre)},
                       {"fov", jsonOf(kFov)}});
}

} // namespace zsi::host
