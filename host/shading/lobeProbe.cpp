// SPDX-License-Identifier: Apache-2.0
#include "shading/lobeProbe.h"

#include "shading/forwardedServices.h"
#include "shading/shadingContext.h"

#include <algorithm>
#include <cmath>

namespace zsi::host {
namespace {

constexpr float kPi = 3.14159265f;
constexpr int kLights = 48, kFurnaces = 64;

/// One light in the list, and the same radiance along every ray.
class Surroundings final : public ForwardedServices {
public:
    using ForwardedServices::ForwardedServices;

    LightSample light = {};
    bool isLit = false;
    Vec3f radiance{0, 0, 0};
    bool gathered = false, occluded = false;

    LightSample* getLightSamples(int, Vec3f const*, Vec3f const* normal) override
    {
        light.weight = dot(light.L, *normal);
        return isLit && light.weight > 0.0f ? &light : nullptr;
    }
    Vec3f indirectDiffuse(Vec3f const*, Vec3f const*, float) override
    {
        gathered = true;
        return radiance;
    }
    Vec3f occlusion(Vec3f const*, Vec3f const*, float) override
    {
        occluded = true;
        return {1, 1, 1};
    }
    Vec3f ambientLight(Vec3f const*, Vec3f const*) override { return {0, 0, 0}; }
    Vec3f shadowTransmission(Vec3f const*, Vec3f const*) override { return {1, 1, 1}; }
    Vec3f traceContinue(int, Vec3f const*, Vec3f const*, float) override { return radiance; }
    Vec3f traceReflection(Vec3f const*, Vec3f const*, float) override { return radiance; }
    Vec4f traceThrough(Vec3f const*, Vec3f const*, float) override
    {
        return withAlpha(radiance, 1.0f);
    }
    Vec3f traceSpecular(Vec3f const*, Vec3f const*, float, float) override { return radiance; }
    Vec3f traceRefraction(Vec3f const*, Vec3f const*, float, float) override { return radiance; }
};

/// What `sample` makes of the record when it may draw anything.
void draw(PreparedMaterial const& material, IShaderAPI& numbers, ShadeState& state)
{
    std::fill_n(state.allowReflection, 3, std::uint8_t(1));
    std::fill_n(state.allowTransmission, 3, std::uint8_t(1));
    state.sampleType = kSampleNone;
    material.shader->sample(&numbers, state);
}

} // namespace

float meanWeight(PreparedMaterial const& material, IShaderAPI& numbers, TrialRecord const& record)
{
    Vec3f sum{0, 0, 0};
    int drawn = 0;
    for (int i = 0; i < kFurnaces; ++i) {
        ShadeState state = record(kRayReflection);
        draw(material, numbers, state);
        if (state.sampleType != kSampleMixture)
            continue;
        ++drawn;
        Vec3f const weight = state.outBrdf * (state.sampleCosine * state.sampleInvPdf);
        sum += isFinite(weight) ? weight : Vec3f(0, 0, 0);
    }
    float const mean = maxComponent(sum) / static_cast<float>(std::max(drawn, 1));
    return mean > 0.0f ? mean : 1.0f;
}

SharedLobes probeLobes(PreparedMaterial const& material, std::uint32_t rayType, IShaderAPI& numbers,
                       TrialRecord const& record)
{
    Surroundings around(numbers);
    auto const shown = [&](ShadeState state) {
        material.shader->shade(&around, state);
        return state.discardHit ? Vec3f(-1, -1, -1) : rgb(state.Ci);
    };

    // Light from a list, of any brightness and shadow, shows as `transfer` says, and nothing else
    // does.
    around.isLit = true;
    for (int i = 0; i < kLights; ++i) {
        ShadeState state = record(rayType);
        Vec3f const mirrored = state.I - state.N * (2.0f * dot(state.I, state.N));
        Vec2f const u = numbers.random2D(), v = numbers.random2D();
        // Every other one near where the surface mirrors.
        Vec3f const aside{u.x - 0.5f, u.y - 0.5f, v.x - 0.5f};
        state.sampleDirection = normalize(mirrored * (i & 1 ? 3.0f : 0.0f) + aside);
        around.light.L = state.sampleDirection;
        around.light.color = Vec3f(1, 0.5f, 0.25f) * std::exp2(12.0f * v.y - 6.0f);
        around.light.shadow = {0.25f, 0.5f, 1};
        state.outBrdf = {0, 0, 0};
        state.sampleCosine = 0.0f;
        ShadeState told = state;
        material.shader->transfer(&around, told);
        bool const isListed = dot(told.sampleDirection, state.N) > 0.0f;
        Vec3f const want = isListed
            ? told.outBrdf * (told.sampleCosine * kPi) * around.light.color * around.light.shadow
            : Vec3f(0, 0, 0);
        Vec3f const error = shown(state) - want;
        float const most = std::max({std::fabs(error.x), std::fabs(error.y), std::fabs(error.z)});
        if (!(most <= 1e-3f * maxComponent(want) + 1e-6f) || around.occluded)
            return {};
    }

    // Among surroundings of 1 its rays bring what `sample` draws in the mean, all of it from lobes.
    around.isLit = false;
    around.radiance = {1, 1, 1};
    double sum = 0, squares = 0;
    for (int i = 0; i < kFurnaces; ++i) {
        ShadeState const state = record(rayType);
        ShadeState drawn = state;
        draw(material, around, drawn);
        bool const none = drawn.sampleType == kSampleNone;
        if (!none && drawn.sampleType != kSampleMixture && !(drawn.sampleDirection == state.I))
            return {};
        Vec3f const weight = drawn.outBrdf * (drawn.sampleCosine * drawn.sampleInvPdf);
        Vec3f const difference = shown(state) - (none ? Vec3f(0, 0, 0) : weight);
        auto const d = static_cast<double>(difference.x + difference.y + difference.z) / 3;
        sum += d / kFurnaces;
        squares += d * d / kFurnaces;
    }
    double const error = std::sqrt(std::max(0.0, squares - sum * sum) / kFurnaces);
    return {std::fabs(sum) <= 4 * error + 0.01, around.gathered};
}

} // namespace zsi::host
