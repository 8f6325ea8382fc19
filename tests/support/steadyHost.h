// SPDX-License-Identifier: Apache-2.0
/// Requests and a host for tests that hold for any shader: random or hostile, repeatable, and
/// without allocation, so that the tests can count the allocations of the shader alone.
#pragma once

#include "support/loadedLibrary.h"

#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <zsi/vecmath.h>

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

/// Between 0.75 and 1.25, by every number given: what an answer owes to its question.
template <class... Numbers>
float wave(Numbers const&... numbers)
{
    float phase = 0.0f, k = 3.0f;
    ((phase += k * numbers, k += 2.0f), ...);
    return 1.0f + 0.25f * std::sin(phase);
}
inline float waveOf(Vec3f const* a, Vec3f const* b, float s = 0.0f)
{
    return wave(a->x, a->y, a->z, b->x, b->y, b->z, s);
}

/// Answers depend on the seed, on how many calls came before and on the question; equal hosts give
/// equal answers.
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
    Vec3f ambientLight(V p, V n) override { return answer(p, n); }
    Vec3f shadowTransmission(V from, V to) override { return answer(from, to); }
    Vec3f traceContinue(int, V o, V d, float) override { return answer(o, d); }
    Vec3f traceReflection(V o, V d, float) override { return answer(o, d); }
    Vec4f traceThrough(V o, V d, float) override
    {
        return withAlpha(answer(o, d), supply_.value());
    }
    Vec3f traceSpecular(V o, V d, float spread, float) override { return answer(o, d, spread); }
    Vec3f traceRefraction(V o, V d, float spread, float) override { return answer(o, d, spread); }
    Vec3f occlusion(V p, V n, float) override { return answer(p, n); }
    Vec3f indirectDiffuse(V p, V n, float) override { return answer(p, n); }
    float random() override { return supply_.uniform(); }
    Vec2f random2D() override
    {
        float const a = supply_.uniform();
        return {a, supply_.uniform()};
    }
    float cellNoise1D(float x) override { return 0.8f * supply_.uniform() * wave(x); }
    float noise2D(Vec2f const* p) override { return supply_.value() * wave(p->x, p->y); }
    float noise3DPoint(V p) override { return supply_.value() * waveOf(p, p); }
    float noise3D(Vec4f const* p) override
    {
        return supply_.value() * wave(p->x, p->y, p->z, p->w);
    }
    float noise3DRecord(V p) override { return supply_.value() * waveOf(p, p); }
    Vec3f cellNoise3D(V p) override { return answer(p, p); }

private:
    Vec3f answer(V a, V b, float scalar = 0) { return supply_.vector() * waveOf(a, b, scalar); }

    Supply supply_;
    std::array<LightSample, 3> lights_;
};

/// A texture without state: colours by the coordinate, NaN, or nothing written at all.
template <class Coordinate>
class SteadyTexture final : public HostTexture<Coordinate> {
public:
    explicit SteadyTexture(int mood)
        : mood_(mood)
    {
    }
    void reserved0() override { }
    void reserved1() override { }
    void lookup(Vec4f* result, Coordinate const* coordinate) const override
    {
        float c[3] = {};
        std::memcpy(c, coordinate, sizeof *coordinate);
        float const w = wave(c[0], c[1], c[2]);
        if (mood_ == 0)
            *result = {0.4f * w, 0.5f * w, 0.7f - 0.2f * w, 0.5f * w};
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
        else if (row.type == "texture1D")
            put(steadyTexture<float>(supply, hostile));
        else if (row.type == "texture2D")
            put(steadyTexture<Vec2f>(supply, hostile));
        else if (row.type == "textureCube")
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
