// SPDX-License-Identifier: Apache-2.0
#include "model/modelScene.h"

#include "base/error.h"
#include "base/names.h"
#include "model/modelParts.h"
#include "model/stage.h"
#include "json/jsonText.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>

namespace zsi::host {
namespace {

constexpr float kStageRadius = 1.25f; ///< of what the stage is made for
constexpr int kHeight = 640; ///< pixels
constexpr int kSamples = 128;

JsonValue& section(JsonValue& scene, std::string const& name)
{
    for (JsonMember& member : scene.members)
        if (member.key == name)
            return member.value;
    return scene.members.emplace_back(JsonMember{name, jsonObject()}).value;
}

/// Puts the model's things before those of the stage, whose names make room.
void lay(JsonValue const& things, JsonValue& scene, std::string const& name)
{
    if (things.members.empty())
        return;
    JsonValue& into = section(scene, name);
    into.members.insert(into.members.begin(), things.members.begin(), things.members.end());
}

/// The stage's own names where the model has none of them.
void makeRoom(JsonValue& scene, ModelParts const& parts)
{
    auto const isTaken = [&](std::string const& name) {
        return parts.meshes.find(name) || parts.materials.find(name) || parts.instances.find(name)
            || parts.lights.find(name);
    };
    auto const freeName = [&](std::string name) {
        while (isTaken(name))
            name.insert(0, "stage ");
        return name;
    };
    for (char const* const kind : {"meshes", "materials", "instances", "lights"})
        if (scene.find(kind))
            for (JsonMember& thing : section(scene, kind).members) {
                thing.key = freeName(thing.key);
                for (JsonMember& key : thing.value.members)
                    if (key.key == "mesh" || key.key == "material")
                        key.value.text = freeName(key.value.text);
            }
}

/// Models in their own light are shown so that a white surface in their middle is about white: what
/// lights bring there, each as if it faced them.
float exposureFor(ModelParts const& parts)
{
    float sum = 0;
    for (JsonMember const& member : parts.lights.members) {
        JsonReader const light(member.value);
        Vec3f const color = light.at("color").toVec3f();
        float const bright = maxOf(color.x, maxOf(color.y, color.z));
        auto const position = light.find("position");
        float const distance = position ? maxOf(length(position->toVec3f() - parts.bounds.centre()),
                                                parts.bounds.radius() * 0.5f)
                                        : 1.0f;
        sum += bright / (distance * distance);
    }
    if (!(sum > 0.0f) || !std::isfinite(sum))
        return 0;
    float const stops = -std::log2(sum);
    return std::fabs(stops) < 1.5f ? 0 : std::round(clamp(stops, -60.0f, 60.0f) * 10) / 10;
}

JsonValue assembled(ModelParts const& parts)
{
    StageParts wanted;
    wanted.camera = false;
    wanted.lights = parts.lights.members.empty();
    bool const hasCamera = parts.camera.kind != JsonValue::Kind::Null;
    wanted.ground = wanted.lights || !hasCamera; // a camera and lights: the model is a scene
    Bounds bounds = parts.bounds;
    if (bounds.isEmpty())
        bounds = {{-1, -1, 0}, {1, 1, 2}};
    float const radius = bounds.radius() > 0.0f ? bounds.radius() : 1.0f;
    float const scale = radius / kStageRadius;
    Vec3f const centre = bounds.centre();
    // A hair's breadth below what lies flat on the ground.
    JsonValue scene = stage(
        {scale, hasCamera ? 0 : kCameraTurn, {centre.x, centre.y, bounds.low.z - 1e-3f * radius}},
        wanted);
    makeRoom(scene, parts);

    float const aspect = clamp(parts.aspect > 0.0f ? parts.aspect : 1.5f, 0.1f, 10.0f);
    scene.members.insert(scene.members.begin(),
                         {"camera", hasCamera ? parts.camera : framingCamera(bounds, aspect)});
    for (JsonMember& setting : section(scene, "settings").members)
        if (setting.key == "samples")
            setting.value = jsonOf(kSamples);
    if (!wanted.lights) // light of the model has any unit
        std::erase_if(section(scene, "settings").members,
                      [](JsonMember const& setting) { return setting.key == "sampleClamp"; });
    JsonValue& film = section(scene, "film");
    film = jsonObject({{"width", jsonOf(static_cast<int>(std::lround(aspect * kHeight)))},
                       {"height", jsonOf(kHeight)}});
    if (float const exposure = exposureFor(parts); exposure != 0.0f)
        film.members.push_back({"exposure", jsonOf(exposure)});
    lay(parts.meshes, scene, "meshes");
    lay(parts.materials, scene, "materials");
    lay(parts.instances, scene, "instances");
    lay(parts.lights, scene, "lights");
    return scene;
}

} // namespace

bool isModel(std::filesystem::path const& file)
{
    constexpr std::string_view kEndings[] = {".gltf", ".glb", ".obj", ".ply", ".stl"};
    return std::ranges::find(kEndings, lowered(file.extension().string())) != std::end(kEndings);
}

ModelScene modelScene(std::filesystem::path const& file, PicturePlaces const& places)
{
    LeftOut leftOut;
    std::string const ending = lowered(file.extension().string());
    bool const isGltf = ending == ".gltf" || ending == ".glb";
    ModelParts const parts =
        isGltf ? gltfParts(file, places, leftOut) : plainParts(file, places, leftOut);
    ModelScene result{assembled(parts), {}, parts.pictures};
    if (parts.instances.members.empty())
        leftOut.add("has no triangles in its scene; the stage is empty");
    result.warnings = leftOut.warnings(file.string());
    setOrigin(result.document, places.folder / file.filename());
    return result;
}

} // namespace zsi::host
