// SPDX-License-Identifier: Apache-2.0
#include "view/openScene.h"

#include "base/error.h"
#include "load/assignment.h"
#include "load/sceneFile.h"

namespace zsi::view {
namespace {

/// A ball, a tile and a floor under soft boxes, as the gallery's stage but without files.
constexpr char kStage[] = R"({
  "camera": {"position": [0, -7.4, 2.3], "target": [0, 0, 0.85], "fov": 23},
  "film": {"width": 960, "height": 640},
  "settings": {"samples": 256, "integrator": "path", "sampleClamp": 6},
  "meshes": {
    "ball": {"sphere": {"radius": 0.95, "segments": 192}},
    "tile": {"box": {"size": [0.9, 0.08, 0.9]}},
    "floor": {"plane": {"size": 40}},
    "wall": {"plane": {"size": [40, 20]}}
  },
  "materials": {
    "floor": {"class": "corvid_Mtl_Ward",
      "parameters": {"u_additionalColor": [0, 0, 0], "u_diffuseColor": [0.35, 0.355, 0.365],
                     "u_brdf00Reflectivity": 0.0, "u_brdf90Reflectivity": 0.0,
                     "usingRaytracedAO": false}}
  },
  "instances": {
    "ball": {"mesh": "ball", "material": "subject", "transform": {"translate": [-0.55, 0, 0.95]}},
    "tile": {"mesh": "tile", "material": "subject",
             "transform": {"rotate": [[1, 0, 0, -14], [0, 0, 1, -18]], "translate": [1.1, -0.1, 0.45]}},
    "floor": {"mesh": "floor", "material": "floor"},
    "wall": {"mesh": "wall", "material": "floor",
             "transform": {"rotate": [1, 0, 0, 90], "translate": [0, 9, 0]}}
  },
  "lights": {
    "key": {"kind": "rectangle", "position": [-4.2, -4, 4.6], "target": [-0.2, 0, 0.8], "size": [2.6, 3],
            "emission": [10, 9.7, 9.3]},
    "top": {"kind": "rectangle", "position": [0.4, 0.2, 6], "target": [0.2, 0, 0.6], "size": [3.6, 2.4],
            "emission": [3.2, 3.25, 3.3]},
    "rim": {"kind": "rectangle", "position": [4.2, 2.6, 3], "target": [0, 0, 1], "size": [0.7, 4.2],
            "emission": [13, 13.4, 14]},
    "front": {"kind": "rectangle", "position": [-4.6, -9, 3.4], "target": [0.4, 0, 0.6], "size": [5, 4],
              "emission": [0.75, 0.76, 0.8]}
  }
})";

host::JsonValue stageFor(host::Shader const& shader, std::filesystem::path const& file)
{
    host::JsonValue scene = host::parseJson(kStage, file);
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
        set("instances.floor=null");
        set("instances.wall=null");
        set("materials.floor=null");
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
        opened.document = host::readSceneFile(argument, assignments);
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
