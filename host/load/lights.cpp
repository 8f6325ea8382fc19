// SPDX-License-Identifier: Apache-2.0
#include "load/lights.h"

#include "light/lightCheck.h"
#include "load/placing.h"
#include "load/shaders.h"
#include "mesh/meshShapes.h"

#include <fmt/format.h>

namespace zsi::host {
namespace {

ShaderLight readShaderLight(JsonReader const& reader, SceneBuilder& builder)
{
    reader.expectKeys({"class", "kind", "position", "target", "axis", "radius", "parameters"});
    ShaderLight light{readShader(reader, kLight, builder), readPosition(reader.at("position"))};
    if (auto const v = reader.find("radius"))
        light.radius = v->toFloat(0, kFarthest);
    if (reader.find("target") || reader.find("axis"))
        light.axis = readAxis(reader, light.position);
    return light;
}

PointLight readPointLight(JsonReader const& reader)
{
    reader.expectKeys({"kind", "position", "color", "radius"});
    PointLight light{readPosition(reader.at("position"))};
    if (auto const v = reader.find("color"))
        light.color = v->toVec3f();
    if (auto const v = reader.find("radius"))
        light.radius = v->toFloat(0, kFarthest);
    return light;
}

PointLight readSpotLight(JsonReader const& reader)
{
    reader.expectKeys(
        {"kind", "position", "target", "axis", "color", "radius", "angle", "innerAngle"});
    PointLight light{readPosition(reader.at("position"))};
    if (reader.find("target") || reader.find("axis"))
        light.axis = readAxis(reader, light.position);
    if (auto const v = reader.find("color"))
        light.color = v->toVec3f();
    if (auto const v = reader.find("radius"))
        light.radius = v->toFloat(0, kFarthest);
    auto const angle = reader.find("angle"), inner = reader.find("innerAngle");
    light.angle = angle ? angle->toFloat(0, 360) : 45.0f;
    light.innerAngle = inner ? inner->toFloat(0, light.angle) : light.angle;
    return light;
}

SunLight readSunLight(JsonReader const& reader)
{
    reader.expectKeys({"kind", "direction", "angle", "color"});
    SunLight light;
    if (auto const v = reader.find("direction"))
        light.direction = toDirection(*v, v->toVec3f(), "expected a direction that is not 0");
    if (auto const v = reader.find("angle"))
        light.angle = v->toFloat(0, 180);
    if (auto const v = reader.find("color"))
        light.color = v->toVec3f();
    return light;
}

/// Adds the instance that shines.
SurfaceLight readSurfaceLight(JsonReader const& reader, int mesh, Mat4f const& objectToWorld,
                              SceneBuilder& builder)
{
    SurfaceLight light{static_cast<int>(builder.scene.instances.size())};
    if (auto const v = reader.find("emission"))
        light.emission = v->toVec3f();
    builder.addInstance(reader,
                        {mesh, -1, objectToWorld, static_cast<int>(builder.scene.lights.size())});
    return light;
}

Light placedLight(JsonReader const& reader, SceneBuilder& builder)
{
    auto const kind = reader.find("kind");
    if (!kind)
        return readShaderLight(reader, builder);
    switch (kind->toChoice({"point", "spot", "sun", "rectangle", "disc", "mesh"})) {
    case 0:
        return readPointLight(reader);
    case 1:
        return readSpotLight(reader);
    case 2:
        return readSunLight(reader);
    case 3: {
        reader.expectKeys({"kind", "position", "target", "axis", "up", "size", "emission"});
        std::vector<float> const s = readSize(reader, 2);
        return readSurfaceLight(reader, builder.addMesh(planeMesh({s[0], s[1]})), readPose(reader),
                                builder);
    }
    case 4: {
        reader.expectKeys({"kind", "position", "target", "axis", "radius", "emission"});
        auto const radius = reader.find("radius");
        return readSurfaceLight(reader,
                                builder.addMesh(discMesh(radius ? radius->toPositive() : 1.0f)),
                                readPose(reader), builder);
    }
    default:
        reader.expectKeys({"kind", "mesh", "transform", "emission"});
        return readSurfaceLight(reader, builder.meshes.indexOf(reader.at("mesh")),
                                readPlacing(reader), builder);
    }
}

} // namespace

void readLight(JsonReader const& reader, SceneBuilder& builder)
{
    builder.scene.lights.push_back(placedLight(reader, builder));
    if (!lightsAnything(builder.scene.lights.back()))
        builder.scene.warnings.push_back(fmt::format(
            "{}: lights nothing at any distance; its colour or its fall-off is 0", reader.place()));
}

} // namespace zsi::host
