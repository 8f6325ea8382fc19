// SPDX-License-Identifier: Apache-2.0
/// Services that stand before others.
#pragma once

#include <zsi/shaderApi.h>

namespace zsi::host {

/// Hands every query on; those that differ are overridden.
class ForwardedServices : public IShaderAPI {
public:
    explicit ForwardedServices(IShaderAPI& services)
        : services_(services)
    {
    }
    LightSample* getLightSamples(int category, Vec3f const* P, Vec3f const* normal) override
    {
        return services_.getLightSamples(category, P, normal);
    }
    Vec3f ambientLight(Vec3f const* P, Vec3f const* N) override
    {
        return services_.ambientLight(P, N);
    }
    Vec3f shadowTransmission(Vec3f const* from, Vec3f const* to) override
    {
        return services_.shadowTransmission(from, to);
    }
    Vec3f traceContinue(int rayType, Vec3f const* origin, Vec3f const* direction,
                        float importance) override
    {
        return services_.traceContinue(rayType, origin, direction, importance);
    }
    Vec3f traceReflection(Vec3f const* origin, Vec3f const* direction, float importance) override
    {
        return services_.traceReflection(origin, direction, importance);
    }
    Vec4f traceThrough(Vec3f const* P, Vec3f const* I, float importance) override
    {
        return services_.traceThrough(P, I, importance);
    }
    Vec3f traceSpecular(Vec3f const* origin, Vec3f const* direction, float spread,
                        float importance) override
    {
        return services_.traceSpecular(origin, direction, spread, importance);
    }
    Vec3f traceRefraction(Vec3f const* origin, Vec3f const* direction, float spread,
                          float importance) override
    {
        return services_.traceRefraction(origin, direction, spread, importance);
    }
    Vec3f occlusion(Vec3f const* P, Vec3f const* N, float importance) override
    {
        return services_.occlusion(P, N, importance);
    }
    Vec3f indirectDiffuse(Vec3f const* P, Vec3f const* N, float importance) override
    {
        return services_.indirectDiffuse(P, N, importance);
    }
    float random() override { return services_.random(); }
    Vec2f random2D() override { return services_.random2D(); }
    float cellNoise1D(float x) override { return services_.cellNoise1D(x); }
    float noise2D(Vec2f const* p) override { return services_.noise2D(p); }
    float noise3DPoint(Vec3f const* p) override { return services_.noise3DPoint(p); }
    float noise3D(Vec4f const* pointAndPhase) override { return services_.noise3D(pointAndPhase); }
    float noise3DRecord(Vec3f const* p) override { return services_.noise3DRecord(p); }
    Vec3f cellNoise3D(Vec3f const* p) override { return services_.cellNoise3D(p); }

protected:
    ~ForwardedServices() = default;

private:
    IShaderAPI& services_;
};

} // namespace zsi::host
