// SPDX-License-Identifier: Apache-2.0
#include "load/sceneBuilder.h"

#include "base/names.h"
#include "mesh/meshCompletion.h"

#include <cmath>
#include <fmt/format.h>
#include <set>

namespace zsi::host {

void Names::add(std::string const& name)
{
    indices_.emplace(name, static_cast<int>(names_.size()));
    names_.push_back(name);
}

int Names::indexOf(JsonReader const& reader) const
{
    std::string const& name = reader.toString();
    auto const found = indices_.find(name);
    if (found == indices_.end())
        reader.fail(
            fmt::format("unknown {} \"{}\"{}", what_, printable(name), suggestion(name, names_)));
    return found->second;
}

void SceneBuilder::begin(JsonReader const& reader) const
{
    if (options_.progress)
        options_.progress(reader.path());
}

int SceneBuilder::addMesh(Mesh mesh)
{
    scene.meshes.push_back(std::move(mesh));
    return static_cast<int>(scene.meshes.size()) - 1;
}

void SceneBuilder::addInstance(JsonReader const& reader, Instance const& instance,
                               std::string const& part)
{
    Mat4f const& m = instance.objectToWorld;
    float const largest = largestCoordinate(static_cast<std::size_t>(instance.mesh));
    for (int i = 0; i < 3; ++i) {
        float const scale = std::fabs(m.m[i]) + std::fabs(m.m[4 + i]) + std::fabs(m.m[8 + i]);
        if (!(scale * largest + std::fabs(m.m[12 + i]) <= kFarthest))
            reader.fail(fmt::format("reaches farther out than rays go, which is {}", kFarthest));
    }
    scene.instances.push_back(instance);
    std::string const name = reader.path().substr(reader.path().find('.') + 1);
    scene.instanceNames.push_back(part.empty() ? name : name + '/' + part);
}

float SceneBuilder::largestCoordinate(std::size_t mesh)
{
    while (largest_.size() <= mesh) {
        float& largest = largest_.emplace_back(0.0f);
        for (Vec3f const& p : scene.meshes[largest_.size() - 1].positions)
            largest = maxOf(largest, maxOf(std::fabs(p.x), maxOf(std::fabs(p.y), std::fabs(p.z))));
    }
    return largest_[mesh];
}

std::vector<int> const& SceneBuilder::splitMesh(int whole)
{
    auto const [split, isNew] = split_.try_emplace(whole);
    if (!isNew)
        return split->second;
    Mesh const& mesh = scene.meshes[static_cast<std::size_t>(whole)];
    std::vector<Mesh> parts = partsOf(mesh);
    for (std::size_t i = 0; i < parts.size(); ++i) {
        bool const isThere = !parts[i].triangles.empty();
        split->second.push_back(isThere ? static_cast<int>(scene.meshes.size()) : -1);
        if (isThere) {
            Mesh const& from = scene.meshes[static_cast<std::size_t>(whole)];
            parts[i].name = from.name + '/' + from.parts[i].node;
            scene.meshes.push_back(std::move(parts[i]));
        }
    }
    return split->second;
}

void SceneBuilder::dropWholeMeshes()
{
    std::set<int> used;
    for (Instance const& instance : scene.instances)
        used.insert(instance.mesh);
    for (auto const& [whole, parts] : split_)
        if (!used.contains(whole)) {
            Mesh& mesh = scene.meshes[static_cast<std::size_t>(whole)];
            Mesh empty;
            empty.name = mesh.name;
            mesh = std::move(empty);
        }
}

} // namespace zsi::host
