/// Ward materials and hits for tests: random, and a plain one to vary.
#pragma once

#include "materials/ward/corvid_Mtl_Ward.h"
#include "support/record.h"
#include "support/scriptedHost.h"

#include <memory>

namespace zsi::test {

/// Smooth textures that every map of a material is bound to, each map another one.
struct WardTextures {
    std::vector<std::unique_ptr<FunctionTexture<Vec2f>>> maps;

    /// Texels within 0.1..0.9, slopes below 1.
    TextureSampler2D next()
    {
        float const k = static_cast<float>(maps.size());
        auto const wave = [](float phase) { return 0.5f + 0.4f * std::sin(phase); };
        maps.push_back(std::make_unique<FunctionTexture<Vec2f>>([=](Vec2f p) {
            return Vec4f(wave(k + 2 * p.x), wave(2 * k + p.y), wave(3 * k + p.x - p.y),
                         wave(4 * k + p.x));
        }));
        TextureSampler2D sampler;
        sampler.texture = maps.back().get();
        return sampler;
    }
};

/// Fills a parameter by its type; colours and amounts within 0.2..0.9, one switch in three on.
struct WardRandomizer {
    Random& random;
    WardTextures& textures;

    void parameter(char const*, bool& f, auto, bool) { f = random.in(0, 3) < 1; }
    void parameter(char const*, int& f, auto, bool) { f = 0; }
    void parameter(char const*, float& f, auto, bool) { f = random.in(0.2f, 0.9f); }
    void parameter(char const*, Vec3f& f, auto, bool) { f = random.color() * 0.7f + grey(0.2f); }
    void parameter(char const*, TextureSampler1D&, auto, bool) { }
    void parameter(char const*, TextureSampler2D& f, auto, bool) { f = textures.next(); }
    void parameter(char const*, Mat3f& f, auto, bool)
    {
        for (float& e : f.m)
            e = random.in(-1, 1);
    }
    void parameter(char const*, Mat4f& f, auto, bool) { f = Mat4f::identity(); }
    template <class T>
    void attribute(char const*, std::size_t)
    {
    }
};

/// A material of random parameters, without mask and procedural bump.
inline void randomize(corvid_Mtl_Ward& m, Random& random, WardTextures& textures)
{
    textures.maps.clear();
    corvid_Mtl_Ward::visit(m, WardRandomizer{random, textures});
    m.maskingMode = -1;
    m.u_imageFadeEnable = static_cast<int>(random.in(0, 6));
    m.u_roughValue = random.in(0.06f, 0.6f);
    m.u_brdfCurvePower = random.in(0, 6);
    m.u_ior = random.in(1.1f, 1.8f);
    m.u_anisotropyValue = random.in(0.4f, 2.5f);
    m.u_anisotropyAmount = random.in(0.5f, 2.5f);
}

/// A hit with random frame and tangent, seen from either side at 0.25 or more above the surface;
/// the shading normal strays a little from the geometric one.
inline ShadeState randomHit(Random& random)
{
    ShadeState s = plainHit();
    s.Ng = random.unit();
    s.N = normalize(s.Ng + random.unit() * 0.1f);
    do
        s.I = random.unit();
    while (std::fabs(dot(s.I, s.Ng)) < 0.25f);
    s.P = random.color();
    s.Pref = random.color();
    for (float& e : s.objectToWorld.m)
        e += random.in(-0.4f, 0.4f);
    using W = corvid_Mtl_Ward;
    setAttribute(s, offsetof(W::Attributes, tangent), random.unit());
    setAttribute(s, offsetof(W::Attributes, uv), Vec2f(random.in(-1, 1), random.in(-1, 1)));
    s.incomingIor = random.in(1, 1.5f);
    s.beyondIor = random.in(1, 1.5f);
    return s;
}

/// Opaque, half diffuse, half glossy at every angle; plain hit with a tangent along x.
inline void plainWard(corvid_Mtl_Ward& m)
{
    for (Mat3f* t : {&m.u_diffuseTransform, &m.u_roughTransform, &m.u_normal0Transform})
        *t = Mat3f::identity();
    m.u_diffuseColor = {0.6f, 0.5f, 0.4f};
    m.u_specularColor = {0.9f, 0.8f, 0.7f};
    m.u_brdf90Reflectivity = m.u_brdf00Reflectivity = 0.5f;
    m.u_roughValue = 0.2f;
}
inline ShadeState plainWardHit()
{
    ShadeState s = plainHit();
    setAttribute(s, offsetof(corvid_Mtl_Ward::Attributes, tangent), Vec3f(1, 0, 0));
    std::memset(s.allowReflection, 1, sizeof s.allowReflection);
    return s;
}

/// Makes the host answer rays and queries by direction, so that a wrong argument shows.
inline Vec3f seenAlong(Vec3f d) { return grey(0.5f) + d * 0.4f; }
inline void answerByDirection(ScriptedHost& host)
{
    host.onTrace = host.onAmbient = host.onIndirect =
        host.onOcclusion = [](Vec3f, Vec3f d) { return seenAlong(d); };
}

} // namespace zsi::test
