// SPDX-License-Identifier: Apache-2.0
#include "load/objectLengths.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>
#include <map>

namespace zsi::host {
namespace {

/// Of the mesh's box.
Vec3f sidesOf(Mesh const& mesh)
{
    if (mesh.positions.empty())
        return {0, 0, 0};
    Vec3f low = mesh.positions.front(), high = low;
    for (Vec3f const& p : mesh.positions) {
        low = {minOf(low.x, p.x), minOf(low.y, p.y), minOf(low.z, p.z)};
        high = {maxOf(high.x, p.x), maxOf(high.y, p.y), maxOf(high.z, p.z)};
    }
    return high - low;
}

/// Longest side of a box where the instance stands, turned with it.
float sizeOf(Instance const& instance, Vec3f sides)
{
    Vec3f const along[] = {{sides.x, 0, 0}, {0, sides.y, 0}, {0, 0, sides.z}};
    float longest = 0.0f;
    for (Vec3f const& side : along)
        longest = maxOf(longest, length(transformDirection(instance.objectToWorld, side)));
    return longest;
}

} // namespace

void suitOpenLengths(SceneBuilder& builder)
{
    Scene& scene = builder.scene;
    std::map<int, Vec3f> boxes; // by mesh
    auto const boxOf = [&](int mesh) {
        auto const [box, isNew] = boxes.try_emplace(mesh);
        if (isNew)
            box->second = sidesOf(scene.meshes[static_cast<std::size_t>(mesh)]);
        return box->second;
    };
    for (SceneBuilder::OpenLength const& open : builder.openLengths) {
        std::vector<float> sizes;
        for (Instance const& i : scene.instances)
            if (i.light < 0 && static_cast<std::size_t>(i.material) == open.material)
                sizes.push_back(sizeOf(i, boxOf(i.mesh)));
        if (sizes.empty())
            continue;
        auto const middle = sizes.begin() + static_cast<std::ptrdiff_t>((sizes.size() - 1) / 2);
        std::nth_element(sizes.begin(), middle, sizes.end());
        Shader& shader = scene.materials[open.material];
        float const length = *static_cast<float const*>(shader.find(open.parameter)->field)
            * *middle / static_cast<float>(open.objectSize);
        if (!(length > 0.0f) || !std::isfinite(length))
            continue;
        shader.set(open.parameter, length);
        scene.notes.push_back(fmt::format("materials.{}: {} is {:.4g}, for objects {:.4g} in size",
                                          scene.materialNames[open.material], open.parameter,
                                          length, *middle));
    }
}

} // namespace zsi::host
