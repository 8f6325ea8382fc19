// SPDX-License-Identifier: Apache-2.0
/// Services of a shading call where there is a surface and nothing else.
#pragma once

#include "sampling/sampler.h"
#include "shading/noiseServices.h"

#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi::host {

/// Random numbers and noise as in a rendering; no lights but one that is switched on, and every ray
/// sees black and is free.
class BareServices final : public NoiseServices {
public:
    /// A light that is on every list, while not null; its `weight` is written.
    LightSample* light = nullptr;

    /// Random numbers come from `sampler`, which must outlive this.
    explicit BareServices(Sampler& sampler)
        : sampler_(sampler)
    {
    }

    using V = Vec3f const*;
    LightSample* getLightSamples(int, V, V normal) override
    {
        if (!light)
            return nullptr;
        light->weight = dot(light->L, *normal);
        return light->weight > 0.0f ? light : nullptr;
    }
    Vec3f ambientLight(V, V) override { return {0, 0, 0}; }
    Vec3f shadowTransmission(V, V) override { return {1, 1, 1}; }
    Vec3f traceContinue(int, V, V, float) override { return {0, 0, 0}; }
    Vec3f traceReflection(V, V, float) override { return {0, 0, 0}; }
    Vec4f traceThrough(V, V, float) override { return {0, 0, 0, 0}; }
    Vec3f traceSpecular(V, V, float, float) override { return {0, 0, 0}; }
    Vec3f traceRefraction(V, V, float, float) override { return {0, 0, 0}; }
    Vec3f occlusion(V, V, float) override { return {1, 1, 1}; }
    Vec3f indirectDiffuse(V, V, float) override { return {0, 0, 0}; }
    float random() override { return sampler_.next(); }
    Vec2f random2D() override { return sampler_.next2D(); }

private:
    Sampler& sampler_;
};

} // namespace zsi::host
