// SPDX-License-Identifier: Apache-2.0
#include "base/names.h"
#include "model/gltfLights.h"
#include "model/gltfMaterial.h"
#include "model/gltfMesh.h"
#include "model/modelParts.h"
#include "json/jsonText.h"

#include <fmt/format.h>

namespace zsi::host {
namespace {

/// Puts the parts together, node by node; meshes and materials that no node shows stay out.
class Maker {
public:
    Maker(std::shared_ptr<GltfFile const> const& file, PicturePlaces const& places,
          LeftOut& leftOut)
        : file_(*file)
        , places_(places)
        , leftOut_(leftOut)
        , pictures_(file, places)
    {
        for (JsonValue* const section :
             {&parts_.meshes, &parts_.materials, &parts_.instances, &parts_.lights})
            *section = jsonObject();
    }

    ModelParts made()
    {
        std::vector<GltfNode> const nodes = gltfNodes(file_);
        for (GltfNode const& node : nodes)
            addNode(node);
        for (GltfNode const& node : nodes)
            addView(node);
        tellLeftOut();
        parts_.pictures = pictures_.embedded();
        return std::move(parts_);
    }

private:
    struct KnownMesh {
        std::string name;
        std::vector<Vec3f> corners; ///< vertices of triangles, z up
        std::vector<MeshPart> parts;
    };

    void addNode(GltfNode const& node)
    {
        JsonReader const place = file_.element("nodes", node.index);
        auto const index = place.find("mesh");
        if (!index)
            return;
        std::size_t const meshIndex = file_.indexOf("meshes", *index);
        KnownMesh const& mesh = meshOf(meshIndex);
        if (mesh.parts.empty())
            return;
        std::vector<Matrix> const places = placesOf(file_, node);
        for (Matrix const& at : places) {
            Matrix const toWorld = turnedUp(at);
            if (toWorld.volume() == 0.0 || !toWorld.isFinite()) {
                leftOut_.add("what is flattened to nothing by its node is left out", node.name);
                continue;
            }
            for (Vec3f const& corner : mesh.corners)
                parts_.bounds.add(toWorld.point(corner));
            JsonValue instance = jsonObject({{"mesh", jsonOf(mesh.name)}});
            addMaterials(meshIndex, mesh, instance);
            if (JsonValue transform = transformValue(toWorld);
                transform.kind != JsonValue::Kind::Null)
                instance.members.push_back({"transform", std::move(transform)});
            parts_.instances.members.push_back(
                {uniqueName(node.name, instanceNames_), std::move(instance)});
        }
    }

    void addMaterials(std::size_t meshIndex, KnownMesh const& mesh, JsonValue& instance)
    {
        std::vector<JsonReader> const primitives =
            file_.element("meshes", meshIndex).at("primitives").items();
        auto const material = [&](MeshPart const& part) {
            auto const index = primitives[std::stoul(part.node)].find("material");
            return materialName(index ? std::optional(file_.indexOf("materials", *index))
                                      : std::nullopt);
        };
        if (mesh.parts.size() == 1) {
            instance.members.push_back({"material", jsonOf(material(mesh.parts.front()))});
            return;
        }
        std::vector<JsonMember> materials;
        for (MeshPart const& part : mesh.parts)
            materials.push_back({part.node, jsonOf(material(part))});
        instance.members.push_back({"materials", jsonObject(std::move(materials))});
    }

    KnownMesh const& meshOf(std::size_t index)
    {
        auto const [known, isNew] = meshes_.try_emplace(index);
        if (!isNew)
            return known->second;
        KnownMesh& mesh = known->second;
        JsonReader const place = file_.element("meshes", index);
        Mesh read = readGltfMesh(file_, index);
        mesh.parts = read.parts;
        if (read.triangles.empty()) {
            leftOut_.add("points and lines are left out", nameOf(place, "mesh", index));
            mesh.parts.clear();
            return mesh;
        }
        std::vector<bool> used(read.positions.size());
        for (auto const& triangle : read.triangles)
            for (std::uint32_t const corner : triangle)
                used[corner] = true;
        for (std::size_t i = 0; i < used.size(); ++i)
            if (Vec3f const p = read.positions[i]; used[i])
                mesh.corners.emplace_back(p.x, -p.z, p.y);
        if (!read.colors.empty())
            leftOut_.add("vertex colours are left out", nameOf(place, "mesh", index));
        if (place.at("primitives").items().front().find("targets"))
            leftOut_.add("morph targets are left out", nameOf(place, "mesh", index));
        mesh.name = uniqueName(nameOf(place, "mesh", index), meshNames_);
        parts_.meshes.members.push_back(
            {mesh.name,
             jsonObject({{"file", jsonOf(nameFrom(places_.folder, file_.file()))},
                         {"mesh", jsonOf(static_cast<int>(index))}})});
        return mesh;
    }

    std::string const& materialName(std::optional<std::size_t> index)
    {
        auto const [known, isNew] = materials_.try_emplace(index ? *index + 1 : 0);
        if (isNew) {
            known->second = uniqueName(
                index ? nameOf(file_.element("materials", *index), "material", *index) : "default",
                materialNames_);
            parts_.materials.members.push_back(
                {known->second,
                 gltfMaterial(gltfSurface(file_, index, leftOut_), pictures_, leftOut_)});
        }
        return known->second;
    }

    void addView(GltfNode const& node)
    {
        if (JsonValue light = gltfLight(file_, node, leftOut_); light.kind != JsonValue::Kind::Null)
            parts_.lights.members.push_back({node.name, std::move(light)});
        Vec3f const centre = parts_.bounds.isEmpty() ? Vec3f(0, 0, 0) : parts_.bounds.centre();
        float aspect = 0;
        JsonValue camera = gltfCamera(file_, node, centre, aspect, leftOut_);
        if (camera.kind == JsonValue::Kind::Null)
            return;
        if (parts_.camera.kind != JsonValue::Kind::Null) {
            leftOut_.add("of several cameras the first is taken");
            return;
        }
        parts_.camera = std::move(camera);
        parts_.aspect = aspect;
    }

    void tellLeftOut()
    {
        if (file_.count("skins") > 0)
            leftOut_.add("skins are left out; meshes stand as they were bound");
        if (file_.count("animations") > 0)
            leftOut_.add("animations are left out");
        if (auto const used = file_.root().find("extensionsUsed"))
            for (JsonReader const& name : used->items())
                if (!isKnownExtension(name.toString()))
                    leftOut_.add(fmt::format("the extension {} is not known here and is left out",
                                             printable(name.toString())));
        if (findPath(file_.root(), {"extensions", "KHR_materials_variants"}))
            leftOut_.add("variants of materials are left out");
    }

    static std::string nameOf(JsonReader const& element, char const* kind, std::size_t index)
    {
        auto const name = element.find("name");
        return name && !name->toString().empty() ? name->toString()
                                                 : fmt::format("{} {}", kind, index);
    }

    GltfFile const& file_;
    PicturePlaces const& places_;
    LeftOut& leftOut_;
    GltfPictures pictures_;
    ModelParts parts_;
    std::map<std::size_t, KnownMesh> meshes_;
    std::map<std::size_t, std::string> materials_; ///< by index + 1; 0: the format's default
    std::unordered_set<std::string> meshNames_, materialNames_, instanceNames_;
};

} // namespace

ModelParts gltfParts(std::filesystem::path const& file, PicturePlaces const& places,
                     LeftOut& leftOut)
{
    return Maker(GltfFile::open(file), places, leftOut).made();
}

} // namespace zsi::host
