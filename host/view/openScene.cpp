// SPDX-License-Identifier: Apache-2.0
#include "view/openScene.h"

#include "base/error.h"
#include "load/assignment.h"
#include "load/sceneFile.h"
#include "model/stage.h"
#include "json/jsonText.h"

namespace zsi::view {
namespace {

/// A ball and a tile, in the order in which they stand before the floor.
constexpr char kSubjects[] = R"({
  "meshes": {
    "ball": {"sphere": {"radius": 0.95, "segments": 192}},
    "tile": {"box": {"size": [0.9, 0.08, 0.9]}}
  },
  "instances": {
    "ball": {"mesh": "ball", "material": "subject", "transform": {"translate": [-0.55, 0, 0.95]}},
    "tile": {"mesh": "tile", "material": "subject",
             "transform": {"rotate": [[1, 0, 0, -14], [0, 0, 1, -18]], "translate": [1.1, -0.1, 0.45]}}
  }
})";

host::JsonValue stageWithSubjects(std::filesystem::path const& file)
{
    host::JsonValue scene = host::stage({}, {});
    host::JsonValue const subjects = host::parseJson(kSubjects, file);
    for (host::JsonMember& section : scene.members)
        if (host::JsonValue const* const own = subjects.find(section.key))
            section.value.members.insert(section.value.members.begin(), own->members.begin(),
                                         own->members.end());
    host::setOrigin(scene, file);
    return scene;
}

host::JsonValue stageFor(host::Shader const& shader, std::filesystem::path const& file)
{
    host::JsonValue scene = stageWithSubjects(file);
    auto const set = [&](std::string const& assignment) {
        host::assign(scene, assignment, file.string());
    };
    std::string const quoted = '"' + shader.className() + '"';
    std::string const plain =
        R"({"class": "corvid_Mtl_Ward", "parameters": {"u_additionalColor": [0, 0, 0],
        "u_diffuseColor": [0.6, 0.6, 0.6], "u_brdf00Reflectivity": 0.04, "u_brdf90Reflectivity": 0.9,
        "u_brdfCurvePower": 5, "u_roughValue": 0.2, "usingRaytracedAO": false}})";
    switch (shader.kind()) {
    case kMaterial:
        set(R"(materials.subject={"class": )" + quoted + "}");
        break;
    case kLight: // alone, close above the ball
        set("materials.subject=" + plain);
        set("lights=null");
        set(R"(lights={"subject": {"class": )" + quoted
            + R"(, "position": [-1.6, -1.8, 3.4], "target": [0, 0, 0.6], "radius": 0.2}})");
        break;
    default: // around a mirror and what is matt, with nothing else
        set(R"(materials.subject={"class": "corvid_Mtl_Mirror"})");
        set("materials.matt=" + plain);
        set("instances.tile.material=matt");
        set("instances.ground=null");
        set("materials.ground=null");
        set("lights=null");
        set(R"(environment={"class": )" + quoted + R"(, "visible": true})");
    }
    return scene;
}

} // namespace

OpenedScene openScene(std::string const& argument, host::ShaderSource const& shaders,
                      std::vector<std::string> const& assignments)
{
    OpenedScene opened;
    std::error_code failed;
    opened.isFile = std::filesystem::exists(argument, failed) || !shaders.has(argument);
    if (opened.isFile) {
        if (argument == "-")
            throw host::InputError("-: expected a scene file or a shader class");
        opened.document = host::readSceneFile(argument, assignments, &opened.warnings);
        opened.file = argument;
        return opened;
    }
    opened.file = argument + ".json";
    opened.document = stageFor(shaders.create(argument), opened.file);
    for (std::string const& assignment : assignments)
        host::assign(opened.document, assignment, "--set");
    return opened;
}

} // namespace zsi::view
