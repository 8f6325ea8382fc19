// SPDX-License-Identifier: Apache-2.0
#include "load/placing.h"

#include "load/transforms.h"
#include "scene/scene.h"

#include <cmath>
#include <fmt/format.h>

namespace zsi::host {

Vec3f readPosition(JsonReader const& reader)
{
    Vec3f const v = reader.toVec3f();
    if (!(maxOf(std::fabs(v.x), maxOf(std::fabs(v.y), std::fabs(v.z))) <= kFarthest))
        reader.fail(fmt::format("lies farther out than rays go, which is {}", kFarthest));
    return v;
}

Vec3f toDirection(JsonReader const& place, Vec3f v, char const* why)
{
    if (!(length(v) > 0.0f) || !std::isfinite(length(v)))
        place.fail(why);
    return normalize(v);
}

Vec3f readAxis(JsonReader const& reader, Vec3f position)
{
    JsonReader const aim = reader.onlyOf({"target", "axis"});
    if (reader.find("target"))
        return toDirection(aim, readPosition(aim) - position, "the light stands on its target");
    return toDirection(aim, aim.toVec3f(), "expected a direction that is not 0");
}

Mat4f readPose(JsonReader const& reader)
{
    Vec3f const position = readPosition(reader.at("position"));
    Vec3f const z =
        reader.find("target") || reader.find("axis") ? readAxis(reader, position) : Vec3f(0, 0, -1);
    auto const given = reader.find("up");
    Vec3f up = given ? given->toVec3f() : Vec3f(0, 0, 1);
    if (!(length(cross(up, z)) > 1e-5f)) {
        if (given)
            given->fail("up must point across the axis, not along it");
        up = {0, 1, 0};
    }
    Vec3f const x = normalize(cross(up, z)), y = cross(z, x);
    return {x.x, x.y, x.z, 0, y.x,        y.y,        y.z,        0,
            z.x, z.y, z.z, 0, position.x, position.y, position.z, 1};
}

Mat4f readPlacing(JsonReader const& reader)
{
    auto const transform = reader.find("transform");
    if (!transform)
        return Mat4f::identity();
    Mat4f const m = readTransform(*transform);
    if (m.m[3] != 0.0f || m.m[7] != 0.0f || m.m[11] != 0.0f || m.m[15] != 1.0f)
        transform->fail("the last column must be 0, 0, 0, 1 (points are row vectors)");
    Vec3f const x{m.m[0], m.m[1], m.m[2]}, y{m.m[4], m.m[5], m.m[6]};
    float const volume = dot(cross(x, y), {m.m[8], m.m[9], m.m[10]});
    if (volume == 0.0f || !std::isfinite(volume))
        transform->fail("flattens the mesh: it has no inverse");
    return m;
}

std::vector<float> readSize(JsonReader const& reader, std::size_t axes)
{
    auto const given = reader.find("size");
    if (!given || given->kind() != JsonValue::Kind::Array)
        return std::vector<float>(axes, given ? given->toPositive() : 1.0f);
    if (given->value().items.size() != axes)
        given->failExpected(fmt::format("a number or an array of {}", axes));
    std::vector<float> size;
    for (JsonReader const& item : given->items())
        size.push_back(item.toPositive());
    return size;
}

} // namespace zsi::host
