#include "materials/physical/corvid_Mtl_Glazing.h"
#include "support/reference.h"
#include "support/scriptedHost.h"

namespace zsi {
namespace {

using test::D3;
using test::minus;
using test::plus;
using test::times;

corvid_Mtl_Glazing randomPane(test::Random& random)
{
    corvid_Mtl_Glazing pane;
    pane.u_reflectance = random.in(0.1f, 0.9f);
    pane.u_reflectColor = random.color();
    pane.u_refractColor = random.color();
    pane.u_rough = random.in(0.01f, 0.8f);
    pane.u_level = random.in(1, 3);
    return pane;
}
double reflectanceOf(corvid_Mtl_Glazing const& pane)
{
    return double(pane.u_reflectance) * double(pane.u_reflectance) / double(pane.u_level);
}

TEST(Glazing, TransferIsTheFacetLobeAndItsMirrorImageThroughThePane)
{
    test::Random random;
    test::ScriptedHost host;
    for (int i = 0; i < 4000; ++i) {
        corvid_Mtl_Glazing const pane = randomPane(random);
        ShadeState s = test::randomHit(random, i % 2);
        s.sampleDirection = random.unit();
        test::DFrame const frame = test::frameOf(s, i % 2 ? 1 : -1);
        D3 const v = frame.in(times(s.I, -1)), l = frame.in(s.sampleDirection);
        if (std::fabs(l.z) < 1e-3)
            continue;
        pane.transfer(&host, s);
        double const a2 = double(pane.u_rough), R = reflectanceOf(pane);
        D3 const m(l.x, l.y, -l.z), hr = test::unitOf(plus(v, l)), ht = test::unitOf(plus(v, m));
        // Index 1 on both sides: |i.h| |o.h| / (i.h + o.h)^2 for the mirrored direction.
        double const jacobian =
            std::fabs(inner(v, ht) * inner(m, ht)) / std::pow(inner(v, ht) + inner(m, ht), 2);
        double const through = smithG1(a2, v, ht) * smithG1(a2, m, ht) * test::ggxOf(a2, ht.z)
            * jacobian / std::fabs(v.z * l.z);
        double const want = R * reflectedOf(a2, v, l, hr) + (1 - R) * through;
        // 1e-7 of rounding in h over the width of the lobe, 0.1 at least, and over |cos l|.
        EXPECT_NEAR(double(s.outBrdf.x), want, 3e-4 * want + 1e-7);
        EXPECT_EQ(s.outBrdf, grey(s.outBrdf.x));
        EXPECT_NEAR(double(s.sampleCosine), std::fabs(l.z), 1e-4);
    }
}

TEST(Glazing, SamplesMirrorOrStraightOnBySwitchAndChance)
{
    test::Random random;
    for (int i = 0; i < 2000; ++i) {
        corvid_Mtl_Glazing const pane = randomPane(random);
        ShadeState s = test::randomHit(random, i % 2);
        int const reflection = random.in(0, 4) > 1 ? int(random.in(0, 3)) : -1;
        int const transmission = random.in(0, 4) > 1 ? int(random.in(0, 3)) : -1;
        if (reflection >= 0)
            s.allowReflection[reflection] = 1;
        if (transmission >= 0)
            s.allowTransmission[transmission] = 1;
        test::ScriptedHost host;
        double const R = reflectanceOf(pane);
        host.randoms = {random.in(0, 1)};
        if (i % 50 == 0)
            host.randoms = {pane.u_reflectance * pane.u_reflectance / pane.u_level}; // a tie
        s.sampleType = 9;
        pane.sample(&host, s);
        EXPECT_EQ(host.randomCalls, reflection >= 0 && transmission >= 0);
        if (reflection < 0 && transmission < 0) {
            EXPECT_EQ(s.sampleType, 0u);
            continue;
        }
        bool const both = reflection >= 0 && transmission >= 0;
        bool const through = both ? i % 50 && double(host.randoms[0]) > R : transmission >= 0;
        double const d = test::dotOf(s.I, s.N), cosine = std::fabs(d) * (through ? -1 : 1);
        EXPECT_NEAR(double(s.sampleCosine), cosine, 1e-6);
        double const chance = both ? 1 : through ? 1 - R : R;
        Vec3f const tint = through ? pane.u_refractColor : pane.u_reflectColor;
        EXPECT_NEAR(double(s.outBrdf.y) * cosine, double(tint.y) * chance, 1e-5);
        EXPECT_EQ(s.sampleInvPdf, 1);
        EXPECT_EQ(s.sampleType, through ? 32u : 4u);
        if (through)
            EXPECT_EQ(s.sampleDirection, s.I) << "to the bit";
        else
            EXPECT_LT(test::distance(s.sampleDirection, minus(s.I, times(s.N, 2 * d))), 1e-6);
    }
}

TEST(Glazing, ShadesHighlightsReflectionAndWhatLiesBehind)
{
    test::Random random;
    for (int i = 0; i < 1000; ++i) {
        corvid_Mtl_Glazing pane = randomPane(random);
        bool const front = i % 2, mapped = i % 3 == 0;
        pane.maskingMode = -1;
        pane.u_rough = random.in(0.1f, 0.8f);
        if (i % 7 == 0)
            pane.u_reflectColor = {0, 0, 0};
        if (i % 11 == 0)
            pane.u_refractColor = {0, 0, 0};
        Vec3f const texel = random.color();
        test::FunctionTexture<Vec2f> map([&](Vec2f) { return withAlpha(texel, 1); });
        pane.u_transmittanceMapEnable = mapped;
        pane.u_transmittanceMap.texture = i % 2 ? &map : nullptr;
        pane.u_transmittanceAmount = 0.5f;
        pane.u_transmittanceTransform = Mat3f(0, 2, 0, 1, 0, 0, 0.5f, 0.25f, 1);

        ShadeState s = test::randomHit(random, front);
        test::ScriptedHost host;
        Vec3f const mirrored = random.color(), behind = random.color(), color = random.color();
        Vec3f const L = random.unit();
        host.addLight(L, color, {0.5f, 1, 0.25f}, 0.75f);
        host.onTrace = [&](Vec3f, Vec3f) { return mirrored; };
        host.onThrough = [&](Vec3f, Vec3f) { return withAlpha(behind, 0.1f); };
        pane.shade(&host, s);

        double const side = front ? 1 : -1, R = reflectanceOf(pane), a2 = double(pane.u_rough);
        ASSERT_EQ(host.calls[0].service, "getLightSamples");
        EXPECT_EQ(host.calls[0].vectors[1], s.N) << "asked with the normal as it is";
        EXPECT_EQ(host.calls[0].scalars[0], 0);
        test::DFrame const frame = test::frameOf(s, 1);
        D3 const v = frame.in(times(s.I, -1)), l = frame.in(L);
        double const lit = 0.75 * test::fadeOf(test::dotOf(L, s.Ng)) * R
            * reflectedOf(a2, v, l, test::unitOf(plus(v, l)));

        Vec3f const kBlack(0, 0, 0);
        ASSERT_EQ(host.count("traceReflection"), !(pane.u_reflectColor == kBlack));
        if (host.count("traceReflection")) {
            test::Call const& ray = host.calls[1];
            EXPECT_NEAR(double(ray.scalars[0]), R * double(maxComponent(pane.u_reflectColor)),
                        1e-6);
            EXPECT_GT(side * test::dotOf(ray.vectors[1], s.Ng), 0.0499) << "on the ray's side";
        }
        Vec3f tint = pane.u_refractColor;
        if (mapped && i % 2) {
            float uv[2];
            std::memcpy(uv, s.attributes + 48, sizeof uv);
            EXPECT_NEAR(map.lookups.at(0).x, uv[1] + 0.5f, 1e-6f);
            EXPECT_NEAR(map.lookups.at(0).y, 2 * uv[0] + 0.25f, 1e-6f);
        }
        if (mapped) {
            auto const root = [&](float t) {
                return i % 2 ? std::pow(t * 0.5f, 1 / pane.u_level) : 0.0f; // unbound: nothing
            };
            tint = {root(texel.x), root(texel.y), root(texel.z)};
        }
        EXPECT_EQ(host.count("traceThrough"), !(tint == kBlack));
        if (host.count("traceThrough")) {
            EXPECT_NEAR(double(host.calls.back().scalars[0]), (1 - R) * double(maxComponent(tint)),
                        1e-6);
            EXPECT_EQ(host.calls.back().vectors[1], s.I);
        }
        double const want = lit * double(color.x * 0.5f)
            + R * double(pane.u_reflectColor.x * mirrored.x) + (1 - R) * double(tint.x * behind.x);
        EXPECT_NEAR(double(s.Ci.x), want, 1e-4 * want + 1e-6);
        EXPECT_EQ(s.Ci.w, 1);

        pane.transmission(&host, s);
        EXPECT_NEAR(double(s.transmissionColor.z), (1 - R) * double(pane.u_refractColor.z), 1e-6)
            << "shadow rays know neither map nor angle";
    }
}

/// From behind, lights meet the frame of the normal as it is: a normal that leans to the viewer has
/// highlights, one that leans away has none.
TEST(Glazing, LightsMeetTheNormalAsItIs)
{
    struct Lean {
        Vec3f I, N, L;
        bool lit;
    };
    for (Lean const& lean : {Lean{{0.6f, 0, 0.8f}, {-0.6f, 0, 0.8f}, {0.96f, 0, 0.28f}, false},
                             Lean{{0.8f, 0, 0.6f}, {-0.8f, 0, 0.6f}, {-0.6f, 0, 0.8f}, true}}) {
        test::Trial<corvid_Mtl_Glazing> t;
        t.shader.u_reflectance = 0.5f;
        t.shader.u_rough = 0.3f;
        t.shader.u_reflectColor = t.shader.u_refractColor = {0, 0, 0};
        t.state.I = lean.I;
        t.state.N = lean.N;
        test::setAttribute(t.state, 36, Vec3f(0, 1, 0));
        t.host.addLight(lean.L, {1, 1, 1});
        D3 const v = times(lean.I, -1), h = test::unitOf(plus(v, lean.L)), n = lean.N;
        double const want = lean.lit ? 0.25 * smithG1(0.3, D3(0, 0, inner(v, n)), D3(0, 0, 1))
                * smithG1(0.3, D3(0, 0, inner(lean.L, n)), D3(0, 0, 1))
                * test::ggxOf(0.3, inner(h, n)) / (4 * inner(v, n) * inner(lean.L, n))
                                     : 0;
        EXPECT_NEAR(double(t.shade().x), want, 1e-5);
    }
}

/// The skeleton that all physical materials share: only light from the light list is occluded, by
/// as much as the pane is opaque.
TEST(Glazing, OccludesTheLightsAloneAndOnlyWhereOpaque)
{
    test::FunctionTexture<Vec2f> map([](Vec2f) { return Vec4f(0.75f, 9, 9, 9); });
    for (int source : {0, 1, 2}) { // the host, texture, vertex colour
        test::Trial<corvid_Mtl_Glazing> t;
        corvid_Mtl_Glazing& pane = t.shader;
        pane.u_reflectance = pane.u_rough = 0.5f;
        pane.u_reflectColor = {0, 0, 0};
        pane.u_refractColor = {0.5f, 0.125f, 0};
        pane.usingRaytracedAO = true;
        pane.ambientOcclusionMode = source;
        pane.ambientOcclusionTexture.texture = &map;
        pane.ambientOcclusionFactor = 0.5f;
        pane.ambientOcclusionColor = {0.25f, 0, 1};
        test::setAttribute(t.state, 8, Vec4f(0.75f, 9, 9, 9));
        test::setAttribute(t.state, 36, Vec3f(1, 0, 0));
        t.host.onOcclusion = [](Vec3f, Vec3f) { return Vec3f(0.75f, 0.75f, 0.75f); };
        t.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 1, 1, 1); };
        t.host.addLight({0, 0, 1}, {1, 1, 1});
        // R = 1/4, head-on: D = 1/(pi r), G = 1; transmission weight 3/8, 3/32, 0.
        double const lit = 0.25 / (4 * std::numbers::pi * 0.5), k = 0.25 * 0.5 * (1 - 0.375);
        D3 const want(lit * (1 - k + 0.25 * k) + 0.375, lit * (1 - k) + 0.09375, lit);
        EXPECT_TRUE(test::near(rgb(t.shade()), want, 1e-6)) << source;
        EXPECT_EQ(t.host.count("occlusion"), source == 0);
    }
}

} // namespace
} // namespace zsi
