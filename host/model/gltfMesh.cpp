// SPDX-License-Identifier: Apache-2.0
#include "model/gltfMesh.h"

#include "mesh/meshJoin.h"
#include "model/gltfAccessor.h"
#include "model/gltfTexture.h"

#include <fmt/format.h>

namespace zsi::host {
namespace {

enum Mode { kTriangles = 4, kStrip = 5, kFan = 6 };

int modeOf(JsonReader const& primitive)
{
    auto const mode = primitive.find("mode");
    return mode ? mode->toInt(0, 6) : kTriangles;
}

/// An attribute as long as there are vertices; without any where the primitive has none.
AccessorValues attribute(GltfFile const& file, JsonReader const& attributes,
                         std::string const& name, std::size_t vertices,
                         std::initializer_list<std::size_t> components)
{
    auto const index = attributes.find(name);
    if (!index)
        return {};
    AccessorValues values = readAccessor(file, *index, components);
    if (values.count != vertices)
        index->fail(fmt::format("has {} elements; POSITION has {}", values.count, vertices));
    return values;
}

std::vector<Vec3f> toVec3f(AccessorValues const& read)
{
    std::vector<Vec3f> result(read.count);
    for (std::size_t i = 0; i < read.count; ++i) {
        float const* const v = read.values.data() + i * read.components;
        result[i] = {v[0], v[1], v[2]};
    }
    return result;
}

/// v of the file runs downwards.
std::vector<Vec2f> toUv(AccessorValues const& read)
{
    std::vector<Vec2f> result(read.count);
    for (std::size_t i = 0; i < read.count; ++i)
        result[i] = {read.values[2 * i], 1.0f - read.values[2 * i + 1]};
    return result;
}

std::vector<std::array<std::uint32_t, 3>> triangles(std::vector<std::uint32_t> const& corners,
                                                    int mode)
{
    std::vector<std::array<std::uint32_t, 3>> result;
    if (mode == kTriangles)
        for (std::size_t i = 0; i + 2 < corners.size(); i += 3)
            result.push_back({corners[i], corners[i + 1], corners[i + 2]});
    else
        for (std::size_t i = 0; i + 2 < corners.size(); ++i)
            if (mode == kFan)
                result.push_back({corners[i + 1], corners[i + 2], corners[0]});
            else // every other one of a strip is wound the other way
                result.push_back({corners[i], corners[i + 1 + i % 2], corners[i + 2 - i % 2]});
    return result;
}

std::vector<std::uint32_t> cornersOf(GltfFile const& file, JsonReader const& primitive,
                                     std::size_t vertices)
{
    std::vector<std::uint32_t> corners;
    auto const index = primitive.find("indices");
    if (!index) {
        for (std::uint32_t i = 0; i < vertices; ++i)
            corners.push_back(i);
        return corners;
    }
    corners = readIndices(file, *index);
    for (std::uint32_t const corner : corners)
        if (corner >= vertices)
            index->fail(
                fmt::format("vertex {} is out of range; POSITION has {}", corner, vertices));
    return corners;
}

Mesh readPrimitive(GltfFile const& file, JsonReader const& primitive)
{
    JsonReader const attributes = primitive.at("attributes");
    Mesh mesh;
    mesh.positions = toVec3f(readAccessor(file, attributes.at("POSITION"), {3}));
    std::size_t const vertices = mesh.positions.size();
    mesh.normals = toVec3f(attribute(file, attributes, "NORMAL", vertices, {3}));
    AccessorValues const tangents = attribute(file, attributes, "TANGENT", vertices, {4});
    if (!mesh.normals.empty() && tangents.count > 0) {
        mesh.tangents = toVec3f(tangents);
        for (std::size_t i = 0; i < vertices; ++i)
            mesh.bitangents.push_back(cross(mesh.normals[i], mesh.tangents[i])
                                      * tangents.values[4 * i + 3]);
    }
    UvSets const sets = uvSetsOf(file, primitive);
    auto const uv = [&](int set) {
        return toUv(attribute(file, attributes, fmt::format("TEXCOORD_{}", set), vertices, {2}));
    };
    mesh.uv = uv(sets.uv);
    mesh.uv1 = uv(sets.uv1);
    for (Vec2f& at : mesh.uv1)
        at = transformUv(sets.uv1Transform, at);
    AccessorValues const colors = attribute(file, attributes, "COLOR_0", vertices, {3, 4});
    for (std::size_t i = 0; i < colors.count; ++i) {
        float const* const c = colors.values.data() + i * colors.components;
        mesh.colors.emplace_back(c[0], c[1], c[2], colors.components == 4 ? c[3] : 1.0f);
    }
    mesh.triangles = triangles(cornersOf(file, primitive, vertices), modeOf(primitive));
    return mesh;
}

std::string materialName(GltfFile const& file, JsonReader const& primitive)
{
    auto const index = primitive.find("material");
    if (!index)
        return {};
    auto const name = file.element("materials", *index).find("name");
    return name ? name->toString() : std::string();
}

} // namespace

bool hasTriangles(JsonReader const& primitive)
{
    int const mode = modeOf(primitive);
    return mode == kTriangles || mode == kStrip || mode == kFan;
}

Mesh readGltfMesh(GltfFile const& file, std::size_t index)
{
    std::vector<Mesh> parts;
    std::vector<JsonReader> const primitives =
        file.element("meshes", index).at("primitives").items();
    for (std::size_t i = 0; i < primitives.size(); ++i)
        if (hasTriangles(primitives[i])) {
            parts.push_back(readPrimitive(file, primitives[i]));
            parts.back().parts = {{std::to_string(i), materialName(file, primitives[i])}};
        }
    return joined(parts);
}

} // namespace zsi::host
