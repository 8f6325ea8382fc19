// SPDX-License-Identifier: Apache-2.0
#include "mesh/meshShapes.h"

#include <cmath>

namespace zsi::host {

namespace {

std::uint32_t addVertex(Mesh& mesh, Vec3f position, Vec3f normal, Vec3f tangent, Vec2f uv)
{
    mesh.positions.push_back(position);
    mesh.normals.push_back(normal);
    mesh.tangents.push_back(tangent);
    mesh.bitangents.push_back(cross(normal, tangent));
    mesh.uv.push_back(uv);
    return static_cast<std::uint32_t>(mesh.positions.size() - 1);
}

/// right x up points out of the face; all three are half edges of the box.
void addFace(Mesh& mesh, Vec3f out, Vec3f right, Vec3f up)
{
    auto const corner = [&](float x, float y) {
        return addVertex(mesh, out + right * x + up * y, normalize(cross(right, up)),
                         normalize(right), {0.5f + 0.5f * x, 0.5f + 0.5f * y});
    };
    std::uint32_t const a = corner(-1, -1), b = corner(1, -1), c = corner(1, 1), d = corner(-1, 1);
    mesh.triangles.push_back({a, b, c});
    mesh.triangles.push_back({a, c, d});
}

} // namespace

Mesh sphereMesh(float radius, int segments)
{
    constexpr double kPi = 3.14159265358979323846;
    int const rings = segments / 2 < 2 ? 2 : segments / 2;
    Mesh mesh;
    // A row of vertices for each circle of latitude; the date line and the poles have several, for
    // uv and tangents.
    for (int ring = 0; ring <= rings; ++ring) {
        bool const pole = ring == 0 || ring == rings;
        double const latitude = (static_cast<double>(ring) / rings - 0.5) * kPi;
        double const z = pole ? (ring == 0 ? -1.0 : 1.0) : std::sin(latitude);
        double const across = pole ? 0.0 : std::cos(latitude);
        for (int i = 0; i <= segments; ++i) {
            // At a pole, half a segment on: in the middle of the one triangle that uses it.
            double const turn = (i + (pole ? 0.5 : 0.0)) / segments;
            double const longitude = i == segments && !pole ? 0.0 : turn * 2 * kPi;
            auto const c = static_cast<float>(std::cos(longitude));
            auto const s = static_cast<float>(std::sin(longitude));
            auto const r = static_cast<float>(across);
            Vec3f const normal{c * r, s * r, static_cast<float>(z)};
            addVertex(
                mesh, normal * radius, normal, {-s, c, 0},
                {static_cast<float>(turn), static_cast<float>(ring) / static_cast<float>(rings)});
        }
    }
    auto const row = static_cast<std::uint32_t>(segments + 1);
    for (int ring = 0; ring < rings; ++ring)
        for (std::uint32_t i = 0; i + 1 < row; ++i) {
            std::uint32_t const a = static_cast<std::uint32_t>(ring) * row + i;
            if (ring > 0)
                mesh.triangles.push_back({a, a + 1, a + row});
            if (ring + 1 < rings)
                mesh.triangles.push_back({a + 1, a + row + 1, a + row});
        }
    return mesh;
}

Mesh boxMesh(Vec3f size)
{
    Vec3f const x{0.5f * size.x, 0, 0}, y{0, 0.5f * size.y, 0}, z{0, 0, 0.5f * size.z};
    Mesh mesh;
    addFace(mesh, x, y, z);
    addFace(mesh, -x, -y, z);
    addFace(mesh, y, -x, z);
    addFace(mesh, -y, x, z);
    addFace(mesh, z, x, y);
    addFace(mesh, -z, -x, y);
    return mesh;
}

Mesh planeMesh(Vec2f size)
{
    Mesh mesh;
    addFace(mesh, {0, 0, 0}, {0.5f * size.x, 0, 0}, {0, 0.5f * size.y, 0});
    return mesh;
}

Mesh sweepMesh(Vec3f size, float radius)
{
    constexpr int kArc = 64; // pieces
    constexpr float kQuarter = 1.57079633f;
    float const width = size.x, end = 0.5f * size.y;
    float const floor = size.y - radius, arc = kQuarter * radius, wall = size.z - radius;
    Mesh mesh;
    auto const add = [&](Vec3f at, Vec3f normal, float along) {
        for (float const side : {-0.5f, 0.5f})
            addVertex(mesh, {side * width, at.y, at.z}, normal, {1, 0, 0},
                      {side + 0.5f, along / (floor + arc + wall)});
    };
    add({0, -end, 0}, {0, 0, 1}, 0);
    for (int i = 0; i <= kArc; ++i) {
        float const share = static_cast<float>(i) / kArc;
        float const s = std::sin(kQuarter * share), c = std::cos(kQuarter * share);
        add({0, end - radius * (1 - s), radius * (1 - c)}, {0, -s, c}, floor + arc * share);
    }
    add({0, end, size.z}, {0, -1, 0}, floor + arc + wall);
    for (std::uint32_t i = 0; i + 2 < mesh.positions.size(); i += 2) {
        mesh.triangles.push_back({i, i + 1, i + 3});
        mesh.triangles.push_back({i, i + 3, i + 2});
    }
    return mesh;
}

Mesh discMesh(float radius)
{
    constexpr std::uint32_t kCorners = 128;
    constexpr float kStep = 6.28318531f / kCorners;
    float const r = radius * std::sqrt(kStep / std::sin(kStep));
    Mesh mesh;
    mesh.positions.push_back({0, 0, 0});
    mesh.uv.push_back({0.5f, 0.5f});
    for (std::uint32_t i = 0; i < kCorners; ++i) {
        float const c = std::cos(kStep * static_cast<float>(i));
        float const s = std::sin(kStep * static_cast<float>(i));
        mesh.positions.push_back({r * c, r * s, 0});
        mesh.uv.push_back({0.5f + 0.5f * c, 0.5f + 0.5f * s});
        mesh.triangles.push_back({0, i + 1, (i + 1) % kCorners + 1});
    }
    mesh.normals.assign(mesh.positions.size(), {0, 0, 1});
    mesh.tangents.assign(mesh.positions.size(), {1, 0, 0});
    mesh.bitangents.assign(mesh.positions.size(), {0, 1, 0});
    return mesh;
}

} // namespace zsi::host
