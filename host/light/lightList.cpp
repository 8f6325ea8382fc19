#include "light/lightList.h"

#include <cmath>

namespace zsi::host {

LightSample& LightRecords::add()
{
    if (used_ == blocks_.size() * kBlock)
        blocks_.push_back(std::make_unique<LightSample[]>(kBlock));
    LightSample& record = blocks_[used_ / kBlock][used_ % kBlock];
    ++used_;
    return record;
}

Vec3f lightPoint(Light const& light, Vec3f P, Vec2f u)
{
    if (!(light.radius > 0.0f))
        return light.position;
    Vec3f const axis = normalize(light.position - P);
    // Any two directions across the axis; the one that is not near it starts them.
    Vec3f const across =
        normalize(cross(axis, std::fabs(axis.x) < 0.5f ? Vec3f(1, 0, 0) : Vec3f(0, 1, 0)));
    Vec3f const other = cross(axis, across);
    float const r = light.radius * std::sqrt(u.x);
    float const phi = 6.28318531f * u.y;
    return light.position + across * (r * std::cos(phi)) + other * (r * std::sin(phi));
}

bool askLight(Light const& light, Vec3f position, Vec3f P, Vec3f normal, IShaderAPI* api,
              ShadeState& record, LightSample& sample)
{
    Vec3f const towards = position - P;
    float const distance = length(towards);
    if (!(distance > 0.0f) || !std::isfinite(distance))
        return false;
    Vec3f const L = towards / distance;
    float const cosine = dot(L, normal);
    if (!(cosine > 0.0f))
        return false;

    record.P = P;
    record.lightPosition = position;
    record.lightAxis = light.axis;
    record.lightToPoint = -L;
    record.lightDistance = distance;
    record.lightColor = {0, 0, 0}; // what a light leaves untouched does not count
    record.lightShadow = {1, 1, 1};
    light.shader.light()->illumination(api, record);
    Vec3f const color = record.lightColor, shadow = record.lightShadow;
    if (color == Vec3f(0, 0, 0))
        return false;

    sample = {};
    sample.L = L;
    sample.color = color;
    sample.shadow = shadow;
    sample.weight = minOf(cosine, 1.0f);
    return true;
}

} // namespace zsi::host
