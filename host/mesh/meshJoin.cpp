// SPDX-License-Identifier: Apache-2.0
#include "mesh/meshJoin.h"

#include "mesh/meshCompletion.h"

#include <algorithm>

namespace zsi::host {
namespace {

template <class Value>
void append(std::vector<Value>& to, std::vector<Value> const& from, std::size_t vertices)
{
    // A hole is zero: for a normal or a tangent that means missing.
    to.resize(vertices, Value{});
    to.insert(to.end(), from.begin(), from.end());
}

} // namespace

Mesh joined(std::vector<Mesh>& parts)
{
    auto const any = [&](auto Mesh::*array) {
        return std::any_of(parts.begin(), parts.end(),
                           [&](Mesh const& part) { return !(part.*array).empty(); });
    };
    bool const hasUv = any(&Mesh::uv), hasUv1 = any(&Mesh::uv1), hasColors = any(&Mesh::colors);
    bool const hasNormals = any(&Mesh::normals);
    bool const hasTangents = any(&Mesh::tangents) && any(&Mesh::bitangents);
    Mesh mesh;
    for (Mesh& part : parts) {
        if (hasUv && part.uv.empty())
            projectUv(part);
        if (hasUv1 && part.uv1.empty())
            part.uv1 = part.uv;
        if (hasColors && part.colors.empty())
            part.colors.assign(part.positions.size(), Vec4f(1, 1, 1, 1));
        mesh.partOf.insert(mesh.partOf.end(), part.triangles.size(),
                           static_cast<std::uint32_t>(mesh.parts.size()));
        mesh.parts.push_back(part.parts.front());
        std::size_t const before = mesh.positions.size();
        std::size_t const after = before + part.positions.size();
        append(mesh.positions, part.positions, before);
        if (hasUv)
            append(mesh.uv, part.uv, before);
        if (hasUv1)
            append(mesh.uv1, part.uv1, before);
        if (hasColors)
            append(mesh.colors, part.colors, before);
        if (hasNormals) {
            append(mesh.normals, part.normals, before);
            mesh.normals.resize(after, Vec3f{});
        }
        // Tangents of some parts only are made anew for all.
        if (hasTangents && parts.size() == 1) {
            mesh.tangents = part.tangents;
            mesh.bitangents = part.bitangents;
        }
        for (auto const& t : part.triangles) {
            auto const shift = static_cast<std::uint32_t>(before);
            mesh.triangles.push_back({t[0] + shift, t[1] + shift, t[2] + shift});
        }
    }
    return mesh;
}

} // namespace zsi::host
