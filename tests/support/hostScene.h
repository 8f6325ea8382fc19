/// Scenes in memory for tests of the renderer.
#pragma once

#include "integrate/render.h"

#include <cmath>
#include <memory>
#include <string>
#include <utility>
#include <vector>
#include <zsi/vecmath.h>

namespace zsi::test {

/// A material whose entry points are what a test needs them to be.
class ProbeMaterial : public MaterialShader {
public:
    explicit ProbeMaterial(int entryPoints)
        : entryPoints_(entryPoints)
    {
    }
    void registerShader(IShaderManager* manager) override
    {
        manager->declareEntryPoints(this, entryPoints_);
    }
    void copy(IShaderBase const*) override { }

private:
    int entryPoints_;
};

struct SceneBuilder {
    host::Scene scene;

    SceneBuilder()
    {
        scene.film.width = scene.film.height = 8;
        scene.settings.samples = 16;
        scene.camera.verticalFov = 20.0f;
    }

    static host::ShaderLibraries const& library()
    {
        static host::ShaderLibraries const libraries = [] {
            host::ShaderLibraries l;
            l.load(ZSI_SHADER_LIBRARY);
            return l;
        }();
        return libraries;
    }

    using Values = std::vector<std::pair<std::string, host::ParameterValue>>;
    static host::Shader make(std::string const& className, Values const& values = {})
    {
        host::Shader shader = library().create(className);
        for (auto const& [name, value] : values)
            shader.set(name, value);
        return shader;
    }

    int material(host::Shader shader)
    {
        scene.materials.push_back(std::move(shader));
        return static_cast<int>(scene.materials.size()) - 1;
    }
    int material(std::string const& className, Values const& values = {})
    {
        return material(make(className, values));
    }
    template <class Probe, class... Arguments>
    int probe(Arguments&&... arguments)
    {
        return material(
            host::Shader("probe", std::make_unique<Probe>(std::forward<Arguments>(arguments)...)));
    }

    void add(host::Mesh mesh, int material, Mat4f const& objectToWorld = Mat4f::identity())
    {
        scene.meshes.push_back(std::move(mesh));
        scene.instances.push_back(
            {static_cast<int>(scene.meshes.size()) - 1, material, objectToWorld});
    }

    host::Light& light(std::string const& className, Vec3f position, Values const& values = {})
    {
        scene.lights.push_back({make(className, values), position});
        return scene.lights.back();
    }

    void lookAt(Vec3f from, Vec3f to, Vec3f up = {0, 0, 1})
    {
        scene.camera.position = from;
        scene.camera.target = to;
        scene.camera.up = up;
    }

    host::Picture render(int threads = 2, host::RenderReport* report = nullptr) const
    {
        host::RenderOptions options;
        options.threads = threads;
        return host::render(scene, options, report);
    }
};

/// Mean over a picture.
inline Vec4f mean(host::Picture const& p)
{
    double sum[4] = {};
    for (std::size_t i = 0; i < p.rgba.size(); ++i)
        sum[i % 4] += static_cast<double>(p.rgba[i]) / (static_cast<double>(p.rgba.size()) / 4);
    return {static_cast<float>(sum[0]), static_cast<float>(sum[1]), static_cast<float>(sum[2]),
            static_cast<float>(sum[3])};
}

inline Vec4f pixel(host::Picture const& p, int x, int y)
{
    float const* c = &p.rgba[static_cast<std::size_t>(y * p.width + x) * 4];
    return {c[0], c[1], c[2], c[3]};
}

/// A square of the given half size, facing +z, uv over it.
inline host::Mesh square(float half)
{
    host::Mesh m;
    m.positions = {{-half, -half, 0}, {half, -half, 0}, {half, half, 0}, {-half, half, 0}};
    m.normals.assign(4, {0, 0, 1});
    m.uv = {{0, 0}, {1, 0}, {1, 1}, {0, 1}};
    m.tangents.assign(4, {1, 0, 0});
    m.bitangents.assign(4, {0, 1, 0});
    m.triangles = {{0, 1, 2}, {0, 2, 3}};
    return m;
}

/// A ball with smooth normals.
inline host::Mesh ball(float radius, int segments)
{
    host::Mesh m;
    int const rings = segments / 2;
    for (int j = 0; j <= rings; ++j)
        for (int i = 0; i <= segments; ++i) {
            float const theta = 3.14159265f * static_cast<float>(j) / static_cast<float>(rings);
            float const phi = 6.28318531f * static_cast<float>(i) / static_cast<float>(segments);
            Vec3f const n{std::sin(theta) * std::cos(phi), std::sin(theta) * std::sin(phi),
                          std::cos(theta)};
            m.positions.push_back(n * radius);
            m.normals.push_back(n);
            m.uv.push_back({phi / 6.28318531f, 1 - theta / 3.14159265f});
            m.tangents.push_back({-std::sin(phi), std::cos(phi), 0});
            m.bitangents.push_back(cross(n, m.tangents.back()));
        }
    auto const row = static_cast<std::uint32_t>(segments + 1);
    for (std::uint32_t j = 0; j < static_cast<std::uint32_t>(rings); ++j)
        for (std::uint32_t i = 0; i + 1 < row; ++i) {
            std::uint32_t const a = j * row + i, b = a + row;
            m.triangles.push_back({a, b, b + 1});
            m.triangles.push_back({a, b + 1, a + 1});
        }
    return m;
}

inline Mat4f translation(float x, float y, float z)
{
    Mat4f m = Mat4f::identity();
    m.m[12] = x, m.m[13] = y, m.m[14] = z;
    return m;
}

} // namespace zsi::test
