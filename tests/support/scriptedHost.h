// SPDX-License-Identifier: Apache-2.0
/// A host for tests: answers every service from values that the test sets, and logs each call.
#pragma once

#include "support/record.h"

#include <algorithm>
#include <cstring>
#include <functional>
#include <string>
#include <vector>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi::test {

/// One service call: name, the vector arguments in order, and the scalar arguments in order.
struct Call {
    std::string service;
    std::vector<Vec3f> vectors;
    std::vector<float> scalars;

    bool operator==(Call const&) const = default;
};

/// Services return the neutral value unless the test sets a function. Random numbers come from
/// `randoms` in order and then repeat.
class ScriptedHost final : public IShaderAPI {
    using V = Vec3f const*;
    static constexpr Vec3f kBlack{0, 0, 0}, kWhite{1, 1, 1};
    template <class Result, class... Scalars>
    Result ask(std::function<Result(Vec3f, Vec3f)> const& on, Result neutral, char const* service,
               V a, V b, Scalars... scalars)
    {
        calls.push_back({service, {*a, *b}, {static_cast<float>(scalars)...}});
        return on ? on(*a, *b) : neutral;
    }

public:
    using Answer = std::function<Vec3f(Vec3f, Vec3f)>; ///< of the service's two vectors
    std::vector<LightSample> lights; ///< linked in order by `getLightSamples`
    std::vector<float> randoms{0.5f};
    Answer onAmbient, onShadow, onOcclusion, onIndirect;
    Answer onTrace; ///< all rays but traceThrough
    std::function<Vec4f(Vec3f, Vec3f)> onThrough;
    /// Every scalar noise; unused components are 0.
    std::function<float(Vec4f)> onNoise = [](Vec4f) { return 0.5f; };
    std::function<Vec3f(Vec3f)> onCellNoise = [](Vec3f) { return Vec3f(0.5f, 0.5f, 0.5f); };
    std::vector<Call> calls; ///< lights, rays, occlusion, ambient and indirect light
    int randomCalls = 0;
    int noiseCalls = 0;

    int count(char const* service) const
    {
        return static_cast<int>(std::count_if(calls.begin(), calls.end(),
                                              [&](Call const& c) { return c.service == service; }));
    }

    void addLight(Vec3f L, Vec3f color, Vec3f shadow = {1, 1, 1}, float weight = 1.0f)
    {
        LightSample& s = lights.emplace_back();
        std::memset(static_cast<void*>(&s), 0, sizeof s);
        s.L = L;
        s.color = color;
        s.shadow = shadow;
        s.weight = weight;
    }

    LightSample* getLightSamples(int category, V P, V normal) override
    {
        ask(Answer(), kBlack, "getLightSamples", P, normal, category);
        for (std::size_t i = 0; i < lights.size(); ++i)
            lights[i].next = i + 1 < lights.size() ? &lights[i + 1] : nullptr;
        return lights.empty() ? nullptr : lights.data();
    }
    Vec3f ambientLight(V P, V N) override { return ask(onAmbient, kBlack, "ambientLight", P, N); }
    Vec3f shadowTransmission(V from, V to) override
    {
        return ask(onShadow, kWhite, "shadowTransmission", from, to);
    }
    Vec3f traceContinue(int rayType, V o, V d, float importance) override
    {
        return ask(onTrace, kBlack, "traceContinue", o, d, rayType, importance);
    }
    Vec3f traceReflection(V o, V d, float importance) override
    {
        return ask(onTrace, kBlack, "traceReflection", o, d, importance);
    }
    Vec4f traceThrough(V P, V I, float importance) override
    {
        return ask(onThrough, Vec4f(0, 0, 0, 0), "traceThrough", P, I, importance);
    }
    Vec3f traceSpecular(V o, V d, float spread, float importance) override
    {
        return ask(onTrace, kBlack, "traceSpecular", o, d, spread, importance);
    }
    Vec3f traceRefraction(V o, V d, float spread, float importance) override
    {
        return ask(onTrace, kBlack, "traceRefraction", o, d, spread, importance);
    }
    Vec3f occlusion(V P, V N, float importance) override
    {
        return ask(onOcclusion, kWhite, "occlusion", P, N, importance);
    }
    Vec3f indirectDiffuse(V P, V N, float importance) override
    {
        return ask(onIndirect, kBlack, "indirectDiffuse", P, N, importance);
    }
    float random() override { return nextRandom(); }
    Vec2f random2D() override
    {
        float const a = nextRandom();
        return {a, nextRandom()};
    }
    float cellNoise1D(float x) override { return noise({x, 0, 0, 0}); }
    float noise2D(Vec2f const* p) override { return noise({p->x, p->y, 0, 0}); }
    float noise3DPoint(V p) override { return noise({p->x, p->y, p->z, 0}); }
    float noise3D(Vec4f const* p) override { return noise(*p); }
    float noise3DRecord(V p) override { return noise({p->x, p->y, p->z, 0}); }
    Vec3f cellNoise3D(V p) override
    {
        ++noiseCalls;
        return onCellNoise(*p);
    }

private:
    float nextRandom() { return randoms[static_cast<std::size_t>(randomCalls++) % randoms.size()]; }
    float noise(Vec4f p)
    {
        ++noiseCalls;
        return onNoise(p);
    }
};

/// A texture that returns what a function says, and counts its lookups.
template <class Coordinate>
class FunctionTexture final : public HostTexture<Coordinate> {
public:
    std::function<Vec4f(Coordinate)> texel;
    mutable std::vector<Coordinate> lookups;

    explicit FunctionTexture(std::function<Vec4f(Coordinate)> f)
        : texel(std::move(f))
    {
    }
    void reserved0() override { }
    void reserved1() override { }
    void lookup(Vec4f* result, Coordinate const* coordinate) const override
    {
        lookups.push_back(*coordinate);
        *result = texel(*coordinate);
    }
};

/// A shader, the host that it asks and the hit that it shades.
template <class Shader>
struct Trial {
    Shader shader;
    ScriptedHost host;
    ShadeState state = plainHit();

    Vec4f shade()
    {
        host.calls.clear();
        shader.shade(&host, state);
        return state.Ci;
    }
};

} // namespace zsi::test
