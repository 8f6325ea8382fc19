// SPDX-License-Identifier: Apache-2.0
/// An in-memory host: four lights, constant rays, random numbers from the caller.
#pragma once

#include <cstring>
#include <zsi/zsi.h>

namespace bench {

class NeutralHost final : public zsi::IShaderAPI {
public:
    float const* u = nullptr; ///< three numbers: `random` takes the first, `random2D` the others

    explicit NeutralHost(int lightCount = 4) { setLights(lightCount); }
    void setLights(int count)
    {
        constexpr zsi::Vec3f kDirections[] = {
            {0, 0, 1}, {0.6f, 0, 0.8f}, {0, -0.8f, 0.6f}, {-0.6f, 0.64f, 0.48f}};
        for (int i = 0; i < kMaxLights; ++i) {
            std::memset(static_cast<void*>(&lights_[i]), 0, sizeof lights_[i]);
            lights_[i].L = kDirections[i % 4];
            lights_[i].color = {1, 0.9f, 0.8f};
            lights_[i].shadow = {1, 1, 0.9f};
            lights_[i].weight = lights_[i].L.z;
            lights_[i].next = i + 1 < count ? &lights_[i + 1] : nullptr;
        }
        head_ = count > 0 ? lights_ : nullptr;
    }
    void aimLights(zsi::Vec3f direction)
    {
        for (zsi::LightSample* l = head_; l; l = l->next)
            l->L = direction;
    }

    using V = zsi::Vec3f const*;
    zsi::LightSample* getLightSamples(int, V, V) override { return head_; }
    zsi::Vec3f ambientLight(V, V) override { return {0.1f, 0.1f, 0.1f}; }
    zsi::Vec3f shadowTransmission(V, V) override { return {1, 1, 1}; }
    zsi::Vec3f traceContinue(int, V, V, float) override { return {0.5f, 0.5f, 0.5f}; }
    zsi::Vec3f traceReflection(V, V d, float) override { return {d->x, 0.5f, 0.5f}; }
    zsi::Vec4f traceThrough(V, V, float) override { return {0.5f, 0.5f, 0.5f, 1}; }
    zsi::Vec3f traceSpecular(V, V d, float, float) override { return {d->x, 0.5f, 0.5f}; }
    zsi::Vec3f traceRefraction(V, V d, float, float) override { return {d->x, 0.5f, 0.5f}; }
    zsi::Vec3f occlusion(V, V, float) override { return {0.9f, 0.8f, 0.9f}; }
    zsi::Vec3f indirectDiffuse(V, V, float k) override { return {0.1f * k, 0.2f, 0.3f}; }
    float random() override { return u[0]; }
    zsi::Vec2f random2D() override { return {u[1], u[2]}; }
    float cellNoise1D(float x) override { return x * 0.5f; }
    float noise2D(zsi::Vec2f const* p) override { return p->x * 0.5f; }
    float noise3DPoint(V p) override { return p->x * 0.5f; }
    float noise3D(zsi::Vec4f const* p) override { return p->x * 0.5f; }
    float noise3DRecord(V p) override { return p->x * 0.5f; }
    zsi::Vec3f cellNoise3D(V p) override { return *p; }

private:
    static constexpr int kMaxLights = 16;
    zsi::LightSample lights_[kMaxLights];
    zsi::LightSample* head_ = nullptr;
};

/// A texture that returns one value.
template <class Coordinate>
class ConstantTexture final : public zsi::HostTexture<Coordinate> {
public:
    void reserved0() override { }
    void reserved1() override { }
    void lookup(zsi::Vec4f* result, Coordinate const*) const override
    {
        *result = {0.4f, 0.5f, 0.6f, 1};
    }
};

/// A head-on hit with neutral surroundings; the caller fills direction and normal.
inline zsi::ShadeState neutralRecord()
{
    zsi::ShadeState s;
    std::memset(static_cast<void*>(&s), 0, sizeof s);
    s.E = {0, 0, 1};
    s.I = {0, 0, -1};
    s.N = s.Ng = s.Nref = {0, 0, 1};
    s.incomingIor = s.beyondIor = 1;
    s.objectToWorld = {0, 1, 0, 0, -1, 0, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1};
    s.rayType = zsi::kRayCamera;
    s.maxRayDepth = 8;
    std::memset(s.allowReflection, 1, sizeof s.allowReflection);
    std::memset(s.allowTransmission, 1, sizeof s.allowTransmission);
    return s;
}

} // namespace bench
