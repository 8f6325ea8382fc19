// SPDX-License-Identifier: Apache-2.0
#include "light/lightCheck.h"

#include "light/lights.h"

#include <cmath>

namespace zsi::host {
namespace {

/// The services of an empty, unlit world.
class NoServices final : public IShaderAPI {
public:
    LightSample* getLightSamples(int, Vec3f const*, Vec3f const*) override { return nullptr; }
    Vec3f ambientLight(Vec3f const*, Vec3f const*) override { return {0, 0, 0}; }
    Vec3f shadowTransmission(Vec3f const*, Vec3f const*) override { return {1, 1, 1}; }
    Vec3f traceContinue(int, Vec3f const*, Vec3f const*, float) override { return {0, 0, 0}; }
    Vec3f traceReflection(Vec3f const*, Vec3f const*, float) override { return {0, 0, 0}; }
    Vec4f traceThrough(Vec3f const*, Vec3f const*, float) override { return {0, 0, 0, 0}; }
    Vec3f traceSpecular(Vec3f const*, Vec3f const*, float, float) override { return {0, 0, 0}; }
    Vec3f traceRefraction(Vec3f const*, Vec3f const*, float, float) override { return {0, 0, 0}; }
    Vec3f occlusion(Vec3f const*, Vec3f const*, float) override { return {1, 1, 1}; }
    Vec3f indirectDiffuse(Vec3f const*, Vec3f const*, float) override { return {0, 0, 0}; }
    float random() override { return 0.5f; }
    Vec2f random2D() override { return {0.5f, 0.5f}; }
    float cellNoise1D(float) override { return 0.5f; }
    float noise2D(Vec2f const*) override { return 0.5f; }
    float noise3DPoint(Vec3f const*) override { return 0.5f; }
    float noise3D(Vec4f const*) override { return 0.5f; }
    float noise3DRecord(Vec3f const*) override { return 0.5f; }
    Vec3f cellNoise3D(Vec3f const*) override { return {0.5f, 0.5f, 0.5f}; }
};

bool shaderLightsAnything(ShaderLight const& light)
{
    NoServices services;
    constexpr int kSteps = 16; // of a decade
    for (int i = -3 * kSteps; i <= 6 * kSteps; ++i) {
        float const distance = std::pow(10.0f, static_cast<float>(i) / kSteps);
        ShadeState record{};
        LightSample sample;
        if (askLight(light, {0, 0, 0}, light.axis * distance, -light.axis, &services, record,
                     sample))
            return true;
    }
    return false;
}

} // namespace

bool lightsAnything(Light const& light)
{
    struct Visitor {
        bool operator()(ShaderLight const& l) const { return shaderLightsAnything(l); }
        bool operator()(PointLight const& l) const { return l.color != Vec3f(0, 0, 0); }
        bool operator()(SunLight const& l) const { return l.color != Vec3f(0, 0, 0); }
        bool operator()(SurfaceLight const& l) const { return l.emission != Vec3f(0, 0, 0); }
    };
    return std::visit(Visitor(), light);
}

} // namespace zsi::host
