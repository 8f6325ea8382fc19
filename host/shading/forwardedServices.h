// SPDX-License-Identifier: Apache-2.0
/// Services that stand before a context's own.
#pragma once

#include "shading/shadingContext.h"

namespace zsi::host {

/// Hands every query on to the context; those that differ are overridden.
class ForwardedServices : public IShaderAPI {
public:
    explicit ForwardedServices(ShadingContext& context)
        : context_(context)
    {
    }
    LightSample* getLightSamples(int category, Vec3f const* P, Vec3f const* normal) override
    {
        return context_.getLightSamples(category, P, normal);
    }
    Vec3f ambientLight(Vec3f const* P, Vec3f const* N) override
    {
        return context_.ambientLight(P, N);
    }
    Vec3f shadowTransmission(Vec3f const* from, Vec3f const* to) override
    {
        return context_.shadowTransmission(from, to);
    }
    Vec3f traceContinue(int rayType, Vec3f const* origin, Vec3f const* direction,
                        float importance) override
    {
        return context_.traceContinue(rayType, origin, direction, importance);
    }
    Vec3f traceReflection(Vec3f const* origin, Vec3f const* direction, float importance) override
    {
        return context_.traceReflection(origin, direction, importance);
    }
    Vec4f traceThrough(Vec3f const* P, Vec3f const* I, float importance) override
    {
        return context_.traceThrough(P, I, importance);
    }
    Vec3f traceSpecular(Vec3f const* origin, Vec3f const* direction, float spread,
                        float importance) override
    {
        return context_.traceSpecular(origin, direction, spread, importance);
    }
    Vec3f traceRefraction(Vec3f const* origin, Vec3f const* direction, float spread,
                          float importance) override
    {
        return context_.traceRefraction(origin, direction, spread, importance);
    }
    Vec3f occlusion(Vec3f const* P, Vec3f const* N, float importance) override
    {
        return context_.occlusion(P, N, importance);
    }
    Vec3f indirectDiffuse(Vec3f const* P, Vec3f const* N, float importance) override
    {
        return context_.indirectDiffuse(P, N, importance);
    }
    float random() override { return context_.random(); }
    Vec2f random2D() override { return context_.random2D(); }
    float cellNoise1D(float x) override { return context_.cellNoise1D(x); }
    float noise2D(Vec2f const* p) override { return context_.noise2D(p); }
    float noise3DPoint(Vec3f const* p) override { return context_.noise3DPoint(p); }
    float noise3D(Vec4f const* pointAndPhase) override { return context_.noise3D(pointAndPhase); }
    float noise3DRecord(Vec3f const* p) override { return context_.noise3DRecord(p); }
    Vec3f cellNoise3D(Vec3f const* p) override { return context_.cellNoise3D(p); }

protected:
    ~ForwardedServices() = default;

    ShadingContext& context_;
};

} // namespace zsi::host
