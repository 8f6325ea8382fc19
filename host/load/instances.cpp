// SPDX-License-Identifier: Apache-2.0
#include "load/instances.h"

#include "base/names.h"
#include "load/placing.h"

#include <algorithm>
#include <fmt/format.h>

namespace zsi::host {
namespace {

/// An instance of each part of the mesh; `chosen`: scene materials by the parts' names.
void readParts(JsonReader const& reader, JsonReader const& chosen, int mesh, Mat4f const& toWorld,
               SceneBuilder& builder)
{
    std::vector<MeshPart> const parts = builder.scene.meshes[static_cast<std::size_t>(mesh)].parts;
    if (parts.empty())
        chosen.fail("the mesh has no parts; give it a \"material\"");
    std::vector<std::string> names, known;
    for (MeshPart const& part : parts) {
        names.push_back(fmt::format("{} ({})", printable(part.node), printable(part.material)));
        known.insert(known.end(), {part.node, part.material});
    }
    std::map<std::string, int> materials;
    for (auto const& [name, material] : chosen.members()) {
        if (name != "*" && std::find(known.begin(), known.end(), name) == known.end())
            material.fail(fmt::format("no part and no material of the file has this name; its "
                                      "parts, with their materials: {}",
                                      fmt::join(names, ", ")));
        materials[name] = builder.materials.indexOf(material);
    }
    std::vector<int> const& meshes = builder.splitMesh(mesh);
    for (std::size_t i = 0; i < parts.size(); ++i) {
        auto found = materials.find(parts[i].node);
        for (std::string const& other : {parts[i].material, std::string("*")})
            if (found == materials.end())
                found = materials.find(other);
        if (found == materials.end())
            chosen.fail(fmt::format("no material for the part {}; name it, its material, or "
                                    "\"*\" for all others",
                                    names[i]));
        if (meshes[i] >= 0)
            builder.addInstance(reader, {meshes[i], found->second, toWorld}, parts[i].node);
    }
}

} // namespace

void readInstance(JsonReader const& reader, SceneBuilder& builder)
{
    reader.expectKeys({"mesh", "material", "materials", "transform"});
    int const mesh = builder.meshes.indexOf(reader.at("mesh"));
    JsonReader const material = reader.onlyOf({"material", "materials"});
    Mat4f const toWorld = readPlacing(reader);
    if (reader.find("material"))
        builder.addInstance(reader, {mesh, builder.materials.indexOf(material), toWorld});
    else
        readParts(reader, material, mesh, toWorld, builder);
}

} // namespace zsi::host
