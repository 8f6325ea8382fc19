// SPDX-License-Identifier: Apache-2.0
#include "mesh/meshFile.h"
#include "model/modelParts.h"
#include "json/jsonText.h"

namespace zsi::host {
namespace {

/// Clay: what says nothing of its surface shows its shape.
JsonValue plainMaterial()
{
    return jsonObject({{"class", jsonOf("corvid_Mtl_MetallicPaint")},
                       {"parameters",
                        jsonObject({{"u_baseColor", jsonOf(Vec3f(0.6f, 0.6f, 0.6f))},
                                    {"u_baseRoughValue", jsonOf(0)},
                                    {"u_flakeDensity", jsonOf(0)},
                                    {"u_pearlColor", jsonOf(std::array{1.0f, 1.0f, 1.0f, 0.0f})},
                                    {"u_coatReflectivity", jsonOf(0.04f)},
                                    {"u_coatRoughValue", jsonOf(0.25f)}})}});
}

} // namespace

ModelParts plainParts(std::filesystem::path const& file, PicturePlaces const& places, LeftOut&)
{
    Mesh const mesh = readMeshFile(file);
    ModelParts parts;
    std::string const name = file.stem().string();
    parts.lights = jsonObject();
    parts.meshes =
        jsonObject({{name, jsonObject({{"file", jsonOf(nameFrom(places.folder, file))}})}});
    parts.materials = jsonObject({{"plain", plainMaterial()}});
    parts.instances =
        jsonObject({{name, jsonObject({{"mesh", jsonOf(name)}, {"material", jsonOf("plain")}})}});
    for (Vec3f const& p : mesh.positions)
        parts.bounds.add(p);
    return parts;
}

} // namespace zsi::host
