/// A host for tests: answers every service from values that the test sets, and logs each call.
#pragma once

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
};

/// Services return the neutral value unless the test sets a function. Random numbers come from
/// `randoms` in order and then repeat.
class ScriptedHost final : public IShaderAPI {
public:
    std::vector<LightSample> lights; ///< linked in order by `getLightSamples`
    std::vector<float> randoms{0.5f};
    std::function<Vec3f(Vec3f P, Vec3f N)> onAmbient;
    std::function<Vec3f(Vec3f from, Vec3f to)> onShadow;
    std::function<Vec3f(Vec3f origin, Vec3f direction)> onTrace; ///< all rays but traceThrough
    std::function<Vec4f(Vec3f P, Vec3f I)> onThrough;
    std::function<Vec3f(Vec3f P, Vec3f N)> onOcclusion;
    std::function<Vec3f(Vec3f P, Vec3f N)> onIndirect;
    std::function<float(Vec4f)> onNoise; ///< every scalar noise; unused components are 0
    std::function<Vec3f(Vec3f)> onCellNoise;
    std::vector<Call> calls; ///< lights, rays, occlusion, ambient and indirect light
    int randomCalls = 0;
    int noiseCalls = 0;

    int count(char const* service) const
    {
        int n = 0;
        for (Call const& c : calls)
            n += c.service == service;
        return n;
    }

    void addLight(Vec3f L, Vec3f color, Vec3f shadow = {1, 1, 1}, float weight = 1.0f)
    {
        LightSample s;
        std::memset(static_cast<void*>(&s), 0, sizeof s);
        s.L = L;
        s.color = color;
        s.shadow = shadow;
        s.weight = weight;
        lights.push_back(s);
    }

    LightSample* getLightSamples(int category, Vec3f const* P, Vec3f const* normal) override
    {
        log("getLightSamples", {*P, *normal}, {static_cast<float>(category)});
        for (std::size_t i = 0; i < lights.size(); ++i)
            lights[i].next = i + 1 < lights.size() ? &lights[i + 1] : nullptr;
        return lights.empty() ? nullptr : lights.data();
    }
    Vec3f ambientLight(Vec3f const* P, Vec3f const* N) override
    {
        log("ambientLight", {*P, *N}, {});
        return onAmbient ? onAmbient(*P, *N) : Vec3f{};
    }
    Vec3f shadowTransmission(Vec3f const* from, Vec3f const* to) override
    {
        log("shadowTransmission", {*from, *to}, {});
        return onShadow ? onShadow(*from, *to) : Vec3f(1, 1, 1);
    }
    Vec3f traceContinue(int rayType, Vec3f const* origin, Vec3f const* direction,
                        float importance) override
    {
        log("traceContinue", {*origin, *direction}, {static_cast<float>(rayType), importance});
        return onTrace ? onTrace(*origin, *direction) : Vec3f{};
    }
    Vec3f traceReflection(Vec3f const* origin, Vec3f const* direction, float importance) override
    {
        log("traceReflection", {*origin, *direction}, {importance});
        return onTrace ? onTrace(*origin, *direction) : Vec3f{};
    }
    Vec4f traceThrough(Vec3f const* P, Vec3f const* I, float importance) override
    {
        log("traceThrough", {*P, *I}, {importance});
        return onThrough ? onThrough(*P, *I) : Vec4f{};
    }
    Vec3f traceSpecular(Vec3f const* origin, Vec3f const* direction, float spread,
                        float importance) override
    {
        log("traceSpecular", {*origin, *direction}, {spread, importance});
        return onTrace ? onTrace(*origin, *direction) : Vec3f{};
    }
    Vec3f traceRefraction(Vec3f const* origin, Vec3f const* direction, float spread,
                          float importance) override
    {
        log("traceRefraction", {*origin, *direction}, {spread, importance});
        return onTrace ? onTrace(*origin, *direction) : Vec3f{};
    }
    Vec3f occlusion(Vec3f const* P, Vec3f const* N, float importance) override
    {
        log("occlusion", {*P, *N}, {importance});
        return onOcclusion ? onOcclusion(*P, *N) : Vec3f(1, 1, 1);
    }
    Vec3f indirectDiffuse(Vec3f const* P, Vec3f const* N, float importance) override
    {
        log("indirectDiffuse", {*P, *N}, {importance});
        return onIndirect ? onIndirect(*P, *N) : Vec3f{};
    }
    float random() override { return nextRandom(); }
    Vec2f random2D() override
    {
        float const a = nextRandom();
        return {a, nextRandom()};
    }
    float cellNoise1D(float x) override { return noise({x, 0, 0, 0}); }
    float noise2D(Vec2f const* p) override { return noise({p->x, p->y, 0, 0}); }
    float noise3DPoint(Vec3f const* p) override { return noise({p->x, p->y, p->z, 0}); }
    float noise3D(Vec4f const* p) override { return noise(*p); }
    float noise3DRecord(Vec3f const* p) override { return noise({p->x, p->y, p->z, 0}); }
    Vec3f cellNoise3D(Vec3f const* p) override
    {
        ++noiseCalls;
        return onCellNoise ? onCellNoise(*p) : Vec3f(0.5f, 0.5f, 0.5f);
    }

private:
    void log(char const* service, std::vector<Vec3f> vectors, std::vector<float> scalars)
    {
        calls.push_back({service, std::move(vectors), std::move(scalars)});
    }
    float nextRandom() { return randoms[static_cast<std::size_t>(randomCalls++) % randoms.size()]; }
    float noise(Vec4f p)
    {
        ++noiseCalls;
        return onNoise ? onNoise(p) : 0.5f;
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

} // namespace zsi::test
