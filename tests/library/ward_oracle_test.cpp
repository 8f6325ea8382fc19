// Every entry point of the Ward material against the same model in double precision.
#include "support/wardOracle.h"
#include "support/wardSetup.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

using test::D3;
using test::seenAlong;
using test::WardOracle;

/// Single precision meets double: the exponent of the lobe reaches about 20 where it still
/// counts, which turns a rounding of 1e-6 in a direction into 1e-4 of the value.
void expectNear(double got, double want, char const* what)
{
    EXPECT_NEAR(got, want, 4e-4 * std::fabs(want) + 2e-5) << what;
}
void expectNear(Vec3f got, D3 want, char const* what)
{
    expectNear(got.x, want.x, what);
    expectNear(got.y, want.y, what);
    expectNear(got.z, want.z, what);
}

/// Runs `check(material, hit, random)` on random material and hits, until something fails.
template <class Check>
void forRandom(int rounds, Check const& check)
{
    test::Random random;
    test::WardTextures textures;
    for (int i = 0; i < rounds && !testing::Test::HasFailure(); ++i) {
        corvid_Mtl_Ward m;
        test::randomize(m, random, textures);
        ShadeState const s = test::randomHit(random);
        SCOPED_TRACE(i);
        check(m, s, random);
    }
}

TEST(WardOracle, TransferGivesBothLobes)
{
    int lit = 0;
    forRandom(4000, [&](corvid_Mtl_Ward const& m, ShadeState s, test::Random& random) {
        // Towards the mirror direction, where the lobe is.
        D3 const mirror = WardOracle(m, s).N * (-2 * WardOracle(m, s).N.dot(s.I)) + s.I;
        s.sampleDirection = (mirror + D3(random.unit()) * random.in(0, 2)).unit().single();
        WardOracle const oracle(m, s);
        double cosine = 0;
        D3 const want = oracle.transfer(s.sampleDirection, cosine);
        test::ScriptedHost host;
        m.transfer(&host, s);
        lit += cosine > 0;
        expectNear(s.sampleCosine, cosine, "cosine");
        expectNear(s.outBrdf, want, "value");
    });
    EXPECT_GT(lit, 2000);
}

TEST(WardOracle, SampleTakesEveryBranch)
{
    int types[5] = {};
    forRandom(8000, [&](corvid_Mtl_Ward& m, ShadeState s, test::Random& random) {
        s.allowReflection[0] = random.in(0, 2) < 1;
        if (int const lobe = static_cast<int>(random.in(0, 8)); lobe < 2)
            (lobe == 0 ? m.u_reflectivity : m.u_diffuseAmount) = 0; // one lobe only
        float const u[] = {random.in(0, 1), random.in(0, 1), random.in(0, 1)};
        bool const mixture = s.allowReflection[0];
        WardOracle::Drawn const want = WardOracle(m, s).sample(u[0], u[1], u[2]);
        test::ScriptedHost host;
        host.randoms =
            mixture ? std::vector<float>{u[0], u[1], u[2]} : std::vector<float>{u[1], u[2]};
        m.sample(&host, s);
        ASSERT_EQ(s.sampleType, want.type);
        ++types[s.sampleType];
        if (s.sampleType == kSampleNone)
            return;
        expectNear(s.sampleDirection, want.direction, "direction");
        // Towards grazing the value goes with 1/sqrt(l.z), which magnifies the direction's
        // rounding.
        auto const levelled = [&](D3 value, D3 direction) {
            return value * std::sqrt(WardOracle(m, s).local(direction).z);
        };
        expectNear(levelled(s.outBrdf, s.sampleDirection).single(),
                   levelled(want.brdf, want.direction), "value");
        expectNear(s.sampleCosine, want.cosine, "cosine");
        expectNear(1 / s.sampleInvPdf, 1 / want.invPdf, "density");
    });
    for (int const type : {0, 2, 4})
        EXPECT_GT(types[type], 400) << type;
}

TEST(WardOracle, SampleAtTheEdgesOfItsBranches)
{
    struct Case {
        char const* why;
        Vec3f I;
        bool mixture;
        std::vector<float> randoms;
        std::uint32_t type;
    };
    float const h = std::sqrt(0.5f);
    Case const cases[] = {
        {"edge on: v.z is 0", {1, 0, 0}, true, {0, 0.5f, 0.5f}, kSampleNone},
        {"the middle of the disk, where both coordinates are 0",
         {0, 0, -1},
         true,
         {0, 0.5f, 0.5f},
         kSampleMixture},
        {"a half vector that mirrors into the surface",
         {h, 0, -h},
         true,
         {0.9f, 0, 0.9999f},
         kSampleNone},
        {"the same, glossy only", {h, 0, -h}, false, {0, 0.9999f}, kSampleNone},
    };
    for (Case const& c : cases) {
        corvid_Mtl_Ward m;
        test::plainWard(m);
        ShadeState s = test::plainWardHit();
        s.I = c.I;
        std::memset(s.allowReflection, c.mixture, 3);
        test::ScriptedHost host;
        host.randoms = c.randoms;
        m.sample(&host, s);
        EXPECT_EQ(s.sampleType, c.type) << c.why;
    }
}

TEST(WardOracle, TransmissionIsHoleOrTransparency)
{
    forRandom(2000, [](corvid_Mtl_Ward& m, ShadeState s, test::Random&) {
        D3 const want = WardOracle(m, s).transmission();
        test::ScriptedHost host;
        m.transmission(&host, s);
        expectNear(s.transmissionColor, want, "transmission");
    });
}

/// The mirror direction of I about N; where it dips below 0.05 above Ng, the unit vector of that
/// height between it and N.
D3 mirrorAbove(D3 I, D3 Ng, D3 N)
{
    D3 const R = I - N * (2 * N.dot(I));
    if (R.dot(Ng) >= 0.05)
        return R;
    D3 const across = (I - N * N.dot(I)).unit();
    double const a = Ng.dot(N), b = Ng.dot(across);
    double const angle = std::atan2(b, a) + std::acos(0.05 / std::hypot(a, b));
    return N * std::cos(angle) + across * std::sin(angle);
}

D3 shadeOracle(corvid_Mtl_Ward const& m, ShadeState const& s, test::ScriptedHost& host)
{
    WardOracle const o(m, s);
    bool const far = o.side < 0;
    D3 const N = m.u_normal1AsShadingNormal ? o.N : o.Nf;
    WardOracle::Colors const c = o.front();
    WardOracle::Colors back;
    if (far)
        back = o.colors(false, false, 0);
    D3 const translucent = far ? back.diffuse * back.filter : D3();
    D3 const transmit = far ? back.transmit : c.transmit;

    D3 lit, shine;
    for (LightSample const& light : host.lights) {
        D3 const L = light.L, color = D3(light.color) * light.shadow * light.weight;
        auto const fade = [&](D3 n) {
            double const t = (std::fmin(0.25, std::fmax(0.05, L.dot(n))) - 0.05) / 0.2;
            return t * t * (3 - 2 * t);
        };
        lit = lit + color * (c.diffuse * fade(N) + translucent * fade(-N));
        D3 const l = o.local(L);
        if (c.specular.max() > 1e-5 && l.z > 0)
            shine = shine + color * c.specular * (fade(N) * o.glossy(l));
    }
    double const w = 1 - transmit.max();
    D3 const occlusion = D3(1)
        - (D3(1) - D3(seenAlong(o.Nf.single()))) * (m.ambientOcclusionFactor * w)
            * (D3(1) - D3(m.ambientOcclusionColor));

    D3 reflection, refraction;
    if (!far && !m.u_reflectionHighlightOnly && c.specular.max() > 1e-5)
        reflection = c.specular * D3(seenAlong(mirrorAbove(s.I, D3(s.Ng) * o.side, o.N).single()));
    if (m.u_transparency) {
        double const eta = far ? double(m.u_ior) / s.beyondIor : double(s.incomingIor) / m.u_ior;
        double const ci = -N.dot(s.I), k = 1 - eta * eta * (1 - ci * ci);
        D3 const T = k > 1e-6 ? D3(s.I) * eta + N * (eta * ci - std::sqrt(k))
                              : mirrorAbove(s.I, D3(s.Ng) * o.side, N);
        refraction = transmit * D3(seenAlong(T.single()));
    }
    auto const indirect = [&](D3 n) {
        return (D3(seenAlong(n.single())) * 2) * D3(seenAlong(n.single()));
    };
    D3 const around = c.diffuse * indirect(N) + translucent * indirect(-N);
    D3 extra = m.u_additionalColor;
    if (m.u_additionalMapEnable) {
        Vec4f const t = o.texel(m.u_additionalMap, m.u_additionalMapTransform);
        extra = extra * D3(t.x, t.y, t.z) * m.u_additionalAmount;
    }
    return lit * (m.usingRaytracedAO ? occlusion : D3(1)) + shine + reflection + refraction + around
        + extra;
}

TEST(WardOracle, ShadeSumsLightsRaysAndIndirectLight)
{
    forRandom(4000, [](corvid_Mtl_Ward& m, ShadeState s, test::Random& random) {
        m.u_cutoutMapEnable = false;
        m.usePrecalcAO = false;
        test::ScriptedHost host;
        for (int i = 0; i < 4; ++i)
            host.addLight(random.unit(), random.color(), random.color(), random.in(0, 1));
        test::answerByDirection(host);
        D3 const want = shadeOracle(m, s, host);
        m.shade(&host, s);
        expectNear(rgb(s.Ci), want, "colour");
        EXPECT_EQ(s.Ci.w, 1.0f);
    });
}

} // namespace
} // namespace zsi
