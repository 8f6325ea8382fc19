// SPDX-License-Identifier: Apache-2.0
#include "base/names.h"
#include "mesh/meshFile.h"
#include "model/gltfMaterial.h"
#include "model/modelParts.h"
#include "model/mtlFile.h"
#include "json/jsonText.h"

#include <cmath>
#include <fmt/format.h>
#include <set>

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

/// Roughness whose square is the width of facets' slopes nearest to a Blinn-Phong exponent's:
/// Walter et al. 2007, "Microfacet Models for Refraction through Rough Surfaces", section 5.2.
float roughnessOf(float exponent) { return std::pow(2.0f / (maxOf(exponent, 0.0f) + 2.0f), 0.25f); }

/// A material of an OBJ file in the terms of glTF.
GltfSurface surfaceOf(MtlMaterial const& mtl, LeftOut& leftOut)
{
    GltfSurface s;
    s.name = mtl.name;
    auto const number = [&](char const* word, float otherwise) {
        auto const found = mtl.numbers.find(word);
        return found == mtl.numbers.end() ? otherwise : found->second;
    };
    auto const color = [&](char const* word, Vec3f otherwise) {
        auto const found = mtl.colors.find(word);
        return found == mtl.colors.end() ? otherwise : found->second;
    };
    auto const picture = [&](char const* word) -> std::optional<GltfTexture> {
        auto const found = mtl.pictures.find(word);
        if (found == mtl.pictures.end())
            return {};
        GltfTexture texture;
        texture.ownFile = found->second;
        return texture;
    };
    s.base.factor = color("Kd", {0.6f, 0.6f, 0.6f});
    s.base.texture = picture("map_Kd");
    if (s.base.texture && s.base.factor == Vec3f(0, 0, 0)) // many exporters leave it so
        s.base.factor = {1, 1, 1};
    s.emission = {color("Ke", {0, 0, 0}), picture("map_Ke")};
    s.metallic = {clamp01(number("Pm", 0)), 0, picture("map_Pm")};
    if (s.metallic.texture)
        s.metallic.factor = 1;
    s.roughness = {clamp01(number("Pr", roughnessOf(number("Ns", 30)))), 0, picture("map_Pr")};
    if (s.roughness.texture)
        s.roughness.factor = 1;
    Vec3f const shine = color("Ks", {0.5f, 0.5f, 0.5f});
    s.specular.factor = shine == Vec3f(0, 0, 0) && !mtl.numbers.contains("Pr") ? 0.0f : 1.0f;
    s.ior = number("Ni", 1.5f) > 1.0f ? number("Ni", 1.5f) : 1.5f;
    float const opacity = clamp01(number("d", 1));
    bool const refracts = number("illum", 2) >= 6 && number("illum", 2) <= 7;
    if (refracts) {
        s.transmission.factor = 1;
        s.hasVolume = true;
        s.base.factor = color("Tf", {1, 1, 1});
    } else if (opacity < 1.0f || mtl.pictures.contains("map_d")) {
        s.alphaMode = AlphaMode::Blend;
        s.alpha = {opacity, 0, picture("map_d")};
    }
    for (auto const& [word, file] : mtl.pictures) {
        static std::set<std::string> const kKnown{"map_Kd", "map_Ke", "map_Pm", "map_Pr", "map_d"};
        if (word == "norm") {
            s.normal = picture("norm");
        } else if (!kKnown.contains(word)) {
            leftOut.add("pictures of " + printable(word) + " are left out", mtl.name);
        }
    }
    return s;
}

} // namespace

ModelParts plainParts(std::filesystem::path const& file, PicturePlaces const& places,
                      LeftOut& leftOut)
{
    Mesh mesh = readMeshFile(file);
    // The format does not say; most programs write OBJ with y up, and the others with z.
    bool const isObj = lowered(file.extension().string()) == ".obj";
    ModelParts parts;
    parts.lights = jsonObject();
    parts.materials = jsonObject();
    std::string const name = file.stem().string();
    JsonValue shape = jsonObject({{"file", jsonOf(nameFrom(places.folder, file))}});
    if (isObj) {
        turnYUp(mesh);
        shape.members.push_back({"up", jsonOf("y")});
    }
    parts.meshes = jsonObject({{name, std::move(shape)}});
    JsonValue instance = jsonObject({{"mesh", jsonOf(name)}});

    GltfPictures pictures(places);
    std::set<std::string> used, known;
    for (MeshPart const& part : mesh.parts)
        used.insert(part.material);
    std::vector<JsonMember> chosen;
    if (isObj)
        for (MtlMaterial const& mtl : readMtlOf(file, leftOut))
            if (used.contains(mtl.name) && known.insert(mtl.name).second) {
                parts.materials.members.push_back(
                    {mtl.name, gltfMaterial(surfaceOf(mtl, leftOut), pictures, leftOut)});
                chosen.push_back({mtl.name, jsonOf(mtl.name)});
            }
    if (known.size() < used.size() || used.empty()) {
        std::string plain = "plain";
        while (known.contains(plain))
            plain += " ";
        parts.materials.members.push_back({plain, plainMaterial()});
        chosen.push_back({"*", jsonOf(plain)});
    }
    if (chosen.size() == 1)
        instance.members.push_back({"material", chosen.front().value});
    else
        instance.members.push_back({"materials", jsonObject(std::move(chosen))});
    parts.instances = jsonObject({{name, std::move(instance)}});
    for (auto const& triangle : mesh.triangles)
        for (std::uint32_t const corner : triangle)
            parts.bounds.add(mesh.positions[corner]);
    return parts;
}

} // namespace zsi::host
