// SPDX-License-Identifier: Apache-2.0
#include "model/gltfNodes.h"

#include "model/gltfAccessor.h"
#include "model/gltfTexture.h"

#include <algorithm>
#include <fmt/format.h>

namespace zsi::host {
namespace {

struct Open {
    JsonReader index; ///< where the file names it
    Matrix toWorld; ///< of its parent
};

/// Of the scene that the file shows, which is the first where it does not say; a file without
/// scenes is a library of things, none of which stands anywhere.
std::vector<JsonReader> roots(GltfFile const& file)
{
    if (file.count("scenes") > 0) {
        auto const shown = file.root().find("scene");
        JsonReader const scene = shown ? file.element("scenes", *shown) : file.element("scenes", 0);
        auto const nodes = scene.find("nodes");
        return nodes ? nodes->items() : std::vector<JsonReader>();
    }
    return {};
}

} // namespace

std::string uniqueName(std::string const& name, std::unordered_set<std::string>& taken)
{
    std::string unique = name;
    for (int i = 2; !taken.insert(unique).second; ++i)
        unique = fmt::format("{} {}", name, i);
    return unique;
}

std::vector<GltfNode> gltfNodes(GltfFile const& file)
{
    std::vector<bool> reached(file.count("nodes"));
    std::unordered_set<std::string> names;
    std::vector<GltfNode> nodes;
    std::vector<Open> open;
    auto const push = [&](std::vector<JsonReader> const& indices, Matrix const& toWorld) {
        for (auto index = indices.rbegin(); index != indices.rend(); ++index)
            open.push_back({*index, toWorld}); // the first is taken next
    };
    push(roots(file), {});
    while (!open.empty()) {
        Open const next = open.back();
        open.pop_back();
        std::size_t const index = file.indexOf("nodes", next.index);
        if (reached[index])
            next.index.fail(fmt::format("nodes[{}] is in the scene already; a node has one parent, "
                                        "and none of its children above it",
                                        index));
        reached[index] = true;
        JsonReader const node = file.element("nodes", index);
        GltfNode placed{index, {}, nodeMatrix(node) * next.toWorld};
        if (!placed.toWorld.isFinite())
            node.fail("stands farther out than rays go");
        auto const name = node.find("name");
        placed.name = uniqueName(name && !name->toString().empty() ? name->toString()
                                                                   : fmt::format("node {}", index),
                                 names);
        if (auto const children = node.find("children"))
            push(children->items(), placed.toWorld);
        nodes.push_back(std::move(placed));
    }
    return nodes;
}

std::vector<Matrix> placesOf(GltfFile const& file, GltfNode const& node)
{
    auto const attributes = findPath(file.element("nodes", node.index),
                                     {"extensions", "EXT_mesh_gpu_instancing", "attributes"});
    if (!attributes)
        return {node.toWorld};
    std::size_t count = 0;
    auto const read = [&](char const* name, std::size_t components) {
        auto const index = attributes->find(name);
        AccessorValues values;
        if (index)
            values = readAccessor(file, *index, {components});
        if (index && count > 0 && values.count != count)
            index->fail(
                fmt::format("has {} elements; another attribute has {}", values.count, count));
        count = std::max(count, values.count);
        return values.values;
    };
    std::vector<float> const t = read("TRANSLATION", 3), r = read("ROTATION", 4),
                             s = read("SCALE", 3);
    std::vector<Matrix> places;
    for (std::size_t i = 0; i < count; ++i) {
        std::array<double, 3> translation{0, 0, 0}, scale{1, 1, 1};
        std::array<double, 4> rotation{0, 0, 0, 1};
        if (!t.empty())
            std::copy_n(t.begin() + static_cast<std::ptrdiff_t>(3 * i), 3, translation.begin());
        if (!r.empty())
            std::copy_n(r.begin() + static_cast<std::ptrdiff_t>(4 * i), 4, rotation.begin());
        if (!s.empty())
            std::copy_n(s.begin() + static_cast<std::ptrdiff_t>(3 * i), 3, scale.begin());
        places.push_back(matrixOf(translation, rotation, scale) * node.toWorld);
    }
    return places;
}

} // namespace zsi::host
