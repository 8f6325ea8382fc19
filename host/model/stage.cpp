// SPDX-License-Identifier: Apache-2.0
#include "model/stage.h"

#include "json/jsonReader.h"
#include "json/jsonText.h"

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

/// As the gallery's stage, but without files.
constexpr char kStage[] = R"({
  "camera": {"position": [0, -7.4, 2.3], "target": [0, 0, 0.85], "fov": 23},
  "film": {"width": 960, "height": 640},
  "settings": {"samples": 256, "integrator": "path", "sampleClamp": 3},
  "meshes": {
    "ground": {"sweep": {"size": [60, 32, 24], "radius": 9}}
  },
  "materials": {
    "ground": {"class": "corvid_Mtl_Ward",
      "parameters": {"u_additionalColor": [0, 0, 0], "u_diffuseColor": [0.35, 0.355, 0.365],
                     "u_brdf00Reflectivity": 0.0, "u_brdf90Reflectivity": 0.0,
                     "usingRaytracedAO": false}}
  },
  "instances": {
    "ground": {"mesh": "ground", "material": "ground", "transform": {"rotate": [0, 0, 1, 0], "translate": [0, -5, 0]}}
  },
  "lights": {
    "key": {"kind": "rectangle", "position": [-4.2, -4, 4.6], "target": [-0.2, 0, 0.8], "size": [2.6, 3],
            "emission": [10, 9.7, 9.3]},
    "top": {"kind": "rectangle", "position": [0.4, 0.2, 6], "target": [0.2, 0, 0.6], "size": [3.6, 2.4],
            "emission": [3.2, 3.25, 3.3]},
    "rim": {"kind": "rectangle", "position": [4.2, 2.6, 3], "target": [0, 0, 1], "size": [0.7, 4.2],
            "emission": [13, 13.4, 14]},
    "front": {"kind": "rectangle", "position": [-4.6, -9, 3.4], "target": [0.4, 0, 0.6], "size": [5, 4],
              "emission": [0.75, 0.76, 0.8]},
    "ceiling": {"kind": "rectangle", "position": [0, 0, 11], "axis": [0, 0, -1], "size": [36, 36],
                "emission": [0.12, 0.12, 0.125]}
  }
})";

/// Places the tree's points, directions and lengths.
void place(JsonValue& tree, StagePlacing const& to)
{
    float const c = std::cos(to.turn), s = std::sin(to.turn);
    for (JsonMember& member : tree.members) {
        bool const isPoint =
            member.key == "position" || member.key == "target" || member.key == "translate";
        if (isPoint) {
            Vec3f const p = JsonReader(member.value).toVec3f() * to.scale;
            member.value = jsonShort(Vec3f(c * p.x - s * p.y, s * p.x + c * p.y, p.z) + to.at);
        } else if (member.key == "radius") {
            member.value = jsonShort(static_cast<float>(member.value.number) * to.scale);
        } else if (member.key == "size") {
            for (JsonValue& side : member.value.items)
                side = jsonShort(static_cast<float>(side.number) * to.scale);
        } else if (member.key == "rotate") {
            constexpr float kDegrees = 57.2957795f;
            JsonValue const turn =
                jsonArray({jsonOf(0), jsonOf(0), jsonOf(1), jsonShort(to.turn * kDegrees)});
            member.value = jsonArray({member.value, turn});
        } else {
            place(member.value, to);
        }
    }
}

void drop(JsonValue& scene, std::string_view section)
{
    std::erase_if(scene.members, [&](JsonMember const& m) { return m.key == section; });
}

} // namespace

JsonValue stage(StagePlacing const& placing, StageParts const& parts)
{
    JsonValue scene = parseJson(kStage, "stage");
    if (placing.scale != 1.0f || placing.turn != 0.0f || !(placing.at == Vec3f(0, 0, 0)))
        place(scene, placing);
    if (!parts.camera)
        drop(scene, "camera");
    if (!parts.lights)
        drop(scene, "lights");
    if (!parts.ground)
        for (char const* const section : {"meshes", "materials", "instances"})
            drop(scene, section);
    return scene;
}

} // namespace zsi::host
