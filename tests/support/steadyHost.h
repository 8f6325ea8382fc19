/// Requests and a host for tests that hold for any shader: random or hostile, repeatable, and
/// without allocation, so that the tests can count the allocations of the shader alone.
#pragma once

#include "support/loadedLibrary.h"

#include <array>
#include <cstring>
#include <limits>
#include <random>

namespace zsi::test {

/// Numbers that a request is filled with: ordinary ones, or among them those that break formulas.
class Supply {
public:
    Supply(unsigned seed, bool hostile)
        : engine_(seed)
        , hostile_(hostile)
    {
    }

    unsigned bits() { return static_cast<unsigned>(engine_()); }
    bool chance(unsigned oneIn) { return bits() % oneIn == 0; }
    /// In [0, 1), hostile or not: what a host's random numbers are.
    float uniform() { return static_cast<float>(bits() >> 8) * 0x1p-24f; }
    float value()
    {
        constexpr float kInfinity = std::numeric_limits<float>::infinity();
        constexpr std::array<float, 12> kEvil{
            0.0f,      -0.0f,      1.0f,  -1.0f,  std::numeric_limits<float>::quiet_NaN(),
            kInfinity, -kInfinity, 1e38f, -1e38f, 1e-40f,
            3e9f,      0.5f};
        if (hostile_ && chance(3))
            return kEvil[bits() % kEvil.size()];
        return 2.0f * uniform() - 0.5f;
    }
    int integer()
    {
        constexpr std::array<int, 4> kEvil{std::numeric_limits<int>::min(),
                                           std::numeric_limits<int>::max(), -1000000007, 0};
        if (hostile_ && chance(3))
            return kEvil[bits() % kEvil.size()];
        return static_cast<int>(bits() % 7) - 1;
    }
    Vec3f vector() { return {value(), value(), value()}; }
    Vec3f direction()
    {
        if (hostile_ && chance(3))
            return chance(2) ? Vec3f{0, 0, 0} : vector();
        float const z = 2.0f * uniform() - 1.0f, phi = 6.2831853f * uniform();
        float const r = std::sqrt(1.0f - z * z);
        return {r * std::cos(phi), r * std::sin(phi), z};
    }

private:
    std::mt19937 engine_;
    bool hostile_;
};

/// Answers depend on the seed and on how many calls came before; equal hosts give equal answers.
class SteadyHost final : public IShaderAPI {
public:
    SteadyHost(unsigned seed, bool hostile)
        : supply_(seed, hostile)
    {
        for (LightSample& l : lights_) {
            std::memset(static_cast<void*>(&l), 0xA5, sizeof l);
            l.L = supply_.direction();
            l.color = supply_.vector();
            l.shadow = supply_.vector();
            l.weight = supply_.value();
            l.next = &l == &lights_.back() ? nullptr : &l + 1;
        }
    }

    using V = Vec3f const*;
    LightSample* getLightSamples(int, V, V) override
    {
        return supply_.chance(4) ? nullptr : lights_.data();
    }
    Vec3f ambientLight(V, V) override { return supply_.vector(); }
    Vec3f shadowTransmission(V, V) override { return supply_.vector(); }
    Vec3f traceContinue(int, V, V, float) override { return supply_.vector(); }
    Vec3f traceReflection(V, V, float) override { return supply_.vector(); }
    Vec4f traceThrough(V, V, float) override
    {
        Vec3f const c = supply_.vector();
        return {c.x, c.y, c.z, supply_.value()};
    }
    Vec3f traceSpecular(V, V, float, float) override { return supply_.vector(); }
    Vec3f traceRefraction(V, V, float, float) override { return supply_.vector(); }
    Vec3f occlusion(V, V, float) override { return supply_.vector(); }
    Vec3f indirectDiffuse(V, V, float) override { return supply_.vector(); }
    float random() override { return supply_.uniform(); }
    Vec2f random2D() override
    {
        float const a = supply_.uniform();
        return {a, supply_.uniform()};
    }
    float cellNoise1D(float) override { return supply_.uniform(); }
    float noise2D(Vec2f const*) override { return supply_.value(); }
    float noise3DPoint(V) override { return supply_.value(); }
    float noise3D(Vec4f const*) override { return supply_.value(); }
    float noise3DRecord(V) override { return supply_.value(); }
    Vec3f cellNoise3D(V) override { return supply_.vector(); }

private:
    Supply supply_;
    std::array<LightSample, 3> lights_;
};

/// A texture without state: ordinary colours, NaN, or nothing written at all.
template <class Coordinate>
class SteadyTexture final : public HostTexture<Coordinate> {
public:
    explicit SteadyTexture(int mood)
        : mood_(mood)
    {
    }
    void reserved0() override { }
    void reserved1() override { }
    void lookup(Vec4f* result, Coordinate const*) const override
    {
        if (mood_ == 0)
            *result = {0.4f, 0.5f, 0.6f, 0.7f};
        else if (mood_ == 1)
            result->x = result->w = std::numeric_limits<float>::quiet_NaN();
    }

private:
    int mood_;
};

template <class Coordinate>
HostTexture<Coordinate> const* steadyTexture(Supply& supply, bool hostile)
{
    static SteadyTexture<Coordinate> const textures[]{
        SteadyTexture<Coordinate>(0), SteadyTexture<Coordinate>(1), SteadyTexture<Coordinate>(2)};
    return supply.chance(3) ? nullptr : &textures[hostile ? supply.bits() % 3 : 0];
}

/// Fills every registered parameter.
inline void fillParameters(RecordingManager const& registered, Supply& supply, bool hostile)
{
    for (Registered const& row : registered.rows) {
        auto const put = [&](auto value) { std::memcpy(row.field, &value, sizeof value); };
        if (row.type == "bool")
            put(supply.chance(2));
        else if (row.type == "int")
            put(supply.integer());
        else if (row.type == "Texture1D")
            put(steadyTexture<float>(supply, hostile));
        else if (row.type == "Texture2D")
            put(steadyTexture<Vec2f>(supply, hostile));
        else if (row.type == "TextureCube")
            put(steadyTexture<Vec3f>(supply, hostile));
        else
            for (std::size_t at = 0; at < row.size; at += sizeof(float)) {
                float const v = supply.value();
                std::memcpy(row.field + at, &v, sizeof v);
            }
    }
}

/// A request of random content; host spans and results are random bytes.
inline ShadeState fillRecord(Supply& supply)
{
    ShadeState s;
    auto* const bytes = reinterpret_cast<unsigned char*>(&s);
    for (std::size_t i = 0; i < sizeof s; ++i)
        bytes[i] = static_cast<unsigned char>(supply.bits());
    for (Vec3f* v : {&s.E, &s.P, &s.Pref, &s.lightPosition})
        *v = supply.vector();
    for (Vec3f* v : {&s.I, &s.N, &s.Ng, &s.Nref, &s.lightAxis, &s.lightToPoint, &s.sampleDirection})
        *v = supply.direction();
    for (float* f : {&s.rasterX, &s.rasterY, &s.incomingIor, &s.beyondIor, &s.lightDistance})
        *f = supply.value();
    for (float& f : s.objectToWorld.m)
        f = supply.value();
    for (std::size_t at = 0; at < sizeof s.attributes; at += sizeof(float)) {
        float const v = supply.value();
        std::memcpy(s.attributes + at, &v, sizeof v);
    }
    constexpr std::array<std::uint32_t, 5> kRays{1, 2, 4, 16, 32};
    s.rayType = supply.chance(8) ? supply.bits() : kRays[supply.bits() % kRays.size()];
    s.rayDepth = supply.bits() % 4;
    s.maxRayDepth = 2;
    for (int i = 0; i < 3; ++i) {
        s.allowReflection[i] = supply.chance(2);
        s.allowTransmission[i] = supply.chance(2);
    }
    s.sampleType = 0xA5A5A5A5u;
    s.discardHit = 0xA5;
    return s;
}

} // namespace zsi::test
