// SPDX-License-Identifier: Apache-2.0
/// Small scenes in memory, of things whose light is known.
#pragma once

#include "mesh/meshShapes.h"
#include "render/render.h"
#include "support/hostLibraries.h"

#include <cmath>
#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>
#include <zsi/vecmath.h>

namespace zsi::test {

constexpr Vec3f kWhite{1, 1, 1};

/// An environment picture as a function of the world direction (z up).
class Sky final : public HostTextureCube {
public:
    explicit Sky(std::function<Vec3f(Vec3f)> light)
        : light_(std::move(light))
    {
    }
    void reserved0() override { }
    void reserved1() override { }
    void lookup(Vec4f* result, Vec3f const* d) const override
    {
        *result = withAlpha(light_({d->x, -d->z, d->y}), 1.0f);
    }

private:
    std::function<Vec3f(Vec3f)> light_;
};

inline Sky const kWhiteSky([](Vec3f) { return kWhite; });

using EntryPointFunction = std::function<void(IShaderAPI*, ShadeState&)>;

/// A material whose entry points are functions; those that are not set are not declared. Bounds a
/// medium like glass where `ior` is not 0. Reads every attribute.
class Probe final : public MaterialShader {
public:
    struct Attributes {
        Vec2f uv, uv1;
        Vec3f tangent, bitangent;
        Vec4f color;
    };
    EntryPointFunction onShade, onTransmission, onTransfer, onSample;
    float u_ior = 0.0f;

    void registerShader(IShaderManager* manager) override
    {
        manager->declareEntryPoints(this,
                                    (onShade ? kShade : 0) | (onTransmission ? kTransmission : 0)
                                        | (onTransfer ? kTransfer : 0) | (onSample ? kSample : 0));
        if (u_ior > 0.0f)
            manager->registerFloat(this, "u_ior", &u_ior);
        manager->registerAttribute(this, kAttributeVec2f, "uv", 0);
        manager->registerAttribute(this, kAttributeVec2f, "uv1", 8);
        manager->registerAttribute(this, kAttributeVec3f, "tangent", 16);
        manager->registerAttribute(this, kAttributeVec3f, "bitangent", 28);
    }
    void copy(IShaderBase const*) override { }
    void shade(IShaderAPI* api, ShadeState& state) const override { onShade(api, state); }
    void transmission(IShaderAPI* api, ShadeState& state) const override
    {
        onTransmission(api, state);
    }
    void transfer(IShaderAPI* api, ShadeState& state) const override { onTransfer(api, state); }
    void sample(IShaderAPI* api, ShadeState& state) const override { onSample(api, state); }

    template <class Value>
    static Value attribute(ShadeState const& s, std::size_t offset)
    {
        Value value;
        std::memcpy(&value, s.attributes + offset, sizeof value);
        return value;
    }
};

inline Vec4f pixel(host::Picture const& p, int x, int y)
{
    float const* c = &p.rgba()[static_cast<std::size_t>(y * p.width() + x) * 4];
    return {c[0], c[1], c[2], c[3]};
}

/// A scene that grows: 8 x 8 pixels of one sample, which all see the origin from above.
struct Stage {
    host::Scene scene;

    Stage()
    {
        scene.film.width = scene.film.height = 8;
        scene.settings.samples = 1;
        watch({0, 0, 0}, {0, 0, 1});
    }

    /// Every pixel looks at `point` from `offset` beside it.
    void watch(Vec3f point, Vec3f offset)
    {
        scene.camera.verticalFov = 1e-3f;
        scene.camera.position = point + offset;
        scene.camera.target = point;
        scene.camera.up = offset.x == 0 && offset.y == 0 ? Vec3f(0, 1, 0) : Vec3f(0, 0, 1);
    }
    void sky(Sky const& sky, Vec3f background = {0, 0, 0})
    {
        HostTextureCube const* const cube = &sky;
        scene.environment = make("corvid_Env_Default",
                                 {{"globalIBLMatrix", Mat3f::identity()},
                                  {"reflectionCube", cube},
                                  {"diffuseCube", cube},
                                  {"backgroundColor", background}});
    }
    /// Neither distance nor angle dims it.
    host::ShaderLight& lamp(Vec3f position, Vec3f color = kWhite)
    {
        scene.lights.push_back(host::ShaderLight{
            make("voPointLight", {{"color", color}, {"attenuationFactors", Vec3f(1e9f, 1, 0)}}),
            position});
        return std::get<host::ShaderLight>(scene.lights.back());
    }

    // Materials; each gives its index.
    using Values = std::vector<std::pair<std::string, host::ParameterValue>>;
    int material(host::Shader shader)
    {
        scene.materials.push_back(std::move(shader));
        return static_cast<int>(scene.materials.size()) - 1;
    }
    int material(std::string const& className, Values const& values = {})
    {
        return material(make(className, values));
    }
    int probe(EntryPointFunction shade, EntryPointFunction transmission = {}, float ior = 0.0f)
    {
        auto p = std::make_unique<Probe>();
        p->onShade = std::move(shade);
        p->onTransmission = std::move(transmission);
        p->u_ior = ior;
        return probe(std::move(p));
    }
    int probe(std::unique_ptr<Probe> p) { return material(host::Shader("probe", std::move(p))); }
    /// Nothing but a white diffuse layer.
    int matte(bool withOcclusion = false)
    {
        return material("corvid_Mtl_Ward",
                        {{"u_diffuseColor", kWhite},
                         {"u_brdf00Reflectivity", 0.0f},
                         {"u_brdf90Reflectivity", 0.0f},
                         {"usePrecalcAO", false},
                         {"usingRaytracedAO", withOcclusion}});
    }
    int mirror(float tint, Vec3f mask = {0, 0, 0})
    {
        return material("corvid_Mtl_Mirror", {{"u_tintColor", grey(tint)}, {"maskingColor", mask}});
    }

    void add(host::Mesh mesh, int material, Vec3f at)
    {
        Mat4f toWorld = Mat4f::identity();
        toWorld.m[12] = at.x, toWorld.m[13] = at.y, toWorld.m[14] = at.z;
        scene.instances.push_back({static_cast<int>(scene.meshes.size()), material, toWorld});
        scene.meshes.push_back(std::move(mesh));
    }
    /// A level square around the z axis, facing up.
    void card(int material, float z = 0, float half = 1)
    {
        add(host::planeMesh({2 * half, 2 * half}), material, {0, 0, z});
    }
    /// A level slab around the z axis.
    void slab(int material, float top, float thickness, float half)
    {
        add(host::boxMesh({2 * half, 2 * half, thickness}), material, {0, 0, top - thickness / 2});
    }

    host::Picture render(int threads = 2, host::RenderReport* report = nullptr) const
    {
        host::RenderOptions options;
        options.threads = threads;
        return host::render(scene, options, report);
    }
    Vec4f middle() const { return pixel(render(1), 4, 4); }

private:
    static host::Shader make(std::string const& className, Values const& values)
    {
        host::Shader shader = libraries().create(className);
        for (auto const& [name, value] : values)
            shader.set(name, value);
        return shader;
    }
};

/// Mean over a picture.
inline Vec4f mean(host::Picture const& p)
{
    double sum[4] = {};
    for (std::size_t i = 0; i < p.rgba().size(); ++i)
        sum[i % 4] += static_cast<double>(p.rgba()[i]) / (static_cast<double>(p.rgba().size()) / 4);
    return {static_cast<float>(sum[0]), static_cast<float>(sum[1]), static_cast<float>(sum[2]),
            static_cast<float>(sum[3])};
}

} // namespace zsi::test
