// SPDX-License-Identifier: Apache-2.0
// The panes reflect R = 0.75^2 / 2.25 = 1/4 by facets of squared width 1/4.
#include "materials/physical/corvid_Mtl_Glazing.h"
#include "support/textTable.h"

namespace zsi {
namespace {

constexpr Vec3f kFront(0.6f, 0, -0.8f), kBack(0.6f, 0, 0.8f);

struct Pane : test::Trial<corvid_Mtl_Glazing> {
    explicit Pane(Vec3f I = kFront)
    {
        shader.u_reflectance = 0.75f;
        shader.u_level = 2.25f;
        shader.u_rough = 0.25f;
        shader.u_reflectColor = {0.25f, 0.5f, 0};
        shader.u_refractColor = {0.5f, 0.125f, 0};
        state.I = I;
        state.P = {1, 2, 3};
        state.Ng = {0, 0.28f, 0.96f};
        test::setAttribute(state, 36, Vec3f(0, 1, 0));
        test::setAttribute(state, 48, Vec2f(0.25f, 0.5f));
    }
};

TEST(Glazing, TransferIsTheFacetLobeAndItsMirrorImageThroughThePane)
{
    // I, direction: Walter et al. 2007, eq. 20, 33, 34, in double, times 1/4 or
    // 3/4
    for (test::Line const& c : test::table(R"(
        mirror             | | 0.6,0,-0.8 0.6,0,0.8  0.1162971
        from behind        | | 0.6,0,0.8  0.6,0,-0.8 0.1162971
        straight on        | | 0.6,0,-0.8 0.6,0,-0.8 0.3488913
        through, scattered | | 0.6,0,0.8  0,0.6,0.8  0.1268353)")) {
        Pane p(test::vec3(c.want));
        p.state.sampleDirection = test::vec3(c.want, 3);
        p.shader.transfer(&p.host, p.state);
        EXPECT_TRUE(test::near(p.state.outBrdf, grey(c.want[6]), 1e-6)) << c.why;
        EXPECT_NEAR(p.state.sampleCosine, 0.8f, 1e-6f) << c.why;
    }
}

TEST(Glazing, SamplesMirrorOrStraightOnBySwitchAndChance)
{
    // reflection, transmission, random number (-1: none): type, what is left in
    // the value
    for (test::Line const& c : test::table(R"(
        nothing allowed | | 0 0 -1        0 0
        reflection      | | 1 0 -1        4 0.25
        transmission    | | 0 1 -1        32 0.75
        a tie reflects  | | 1 1 0.25      4 1
        chance          | | 1 1 0.2500001 32 1)"))
        for (int which : {0, 1, 2})
            for (Vec3f I : {kFront, kBack}) {
                SCOPED_TRACE(c.why);
                Pane p(I);
                p.host.randoms = {c.want[2]};
                p.state.allowReflection[which] = c.want[0] != 0;
                p.state.allowTransmission[2 - which] = c.want[1] != 0;
                p.state.sampleType = 9;
                p.shader.sample(&p.host, p.state);
                EXPECT_EQ(p.host.randomCalls, c.want[2] >= 0);
                ASSERT_EQ(float(p.state.sampleType), c.want[3]);
                if (c.want[3] == 0)
                    continue;
                bool const through = c.want[3] == 32;
                Vec3f const tint = through ? p.shader.u_refractColor : p.shader.u_reflectColor;
                float const cosine = through ? -0.8f : 0.8f; // value and cosine turn together
                EXPECT_EQ(p.state.sampleInvPdf, 1);
                EXPECT_NEAR(p.state.sampleCosine, cosine, 1e-6f);
                EXPECT_TRUE(test::near(p.state.outBrdf, tint * (c.want[4] / cosine), 1e-6));
                Vec3f const mirrored(I.x, 0, -I.z);
                EXPECT_TRUE(test::near(p.state.sampleDirection, through ? I : mirrored,
                                       through ? 0 : 1e-6));
            }
}

TEST(Glazing, ShadesHighlightsReflectionAndWhatLiesBehind)
{
    // I, black, mapped, bound: tint
    for (test::Line const& c : test::table(R"(
        front                                | | 0.6,0,-0.8 0 0 1  0.5 0.125 0
        behind                               | | 0.6,0,0.8  0 0 1  0.5 0.125 0
        black costs no ray                   | | 0.6,0,-0.8 1 0 1  0 0 0
        the map's colour to the power 1/2.25 | | 0.6,0,-0.8 0 1 1  0.5400299 1 0
        no map lets nothing through          | | 0.6,0,-0.8 0 1 0  0 0 0)")) {
        Vec3f const I = test::vec3(c.want), tint = test::vec3(c.want, 6);
        bool const black = c.want[3] != 0, mapped = c.want[4] != 0, bound = c.want[5] != 0;
        SCOPED_TRACE(c.why);
        Pane p(I);
        test::FunctionTexture<Vec2f> map([](Vec2f) { return Vec4f(0.5f, 2, 0, 1); });
        if (black)
            p.shader.u_reflectColor = p.shader.u_refractColor = {0, 0, 0};
        p.shader.u_transmittanceMapEnable = mapped;
        p.shader.u_transmittanceMap.texture = bound ? &map : nullptr;
        p.shader.u_transmittanceAmount = 0.5f;
        p.shader.u_transmittanceTransform = Mat3f(0, 2, 0, 1, 0, 0, 0.5f, 0.25f, 1);
        p.host.addLight(kBack, {2, 1, 4}, {0.5f, 1, 0.25f}, 0.75f);
        p.host.addLight({0, 0.8f, -0.6f}, {9, 9, 9}); // below the geometric surface
        p.host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 2, 4); };
        p.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(4, 2, 1, 0.1f); };
        Vec3f const lit = grey(I.z < 0 ? 0.1162971f * 0.75f : 0);
        Vec3f const want =
            lit + p.shader.u_reflectColor * Vec3f(0.25f, 0.5f, 1) + tint * Vec3f(3, 1.5f, 0.75f);
        EXPECT_TRUE(test::near(p.shade(), withAlpha(want, 1), 2e-6));

        std::vector<test::Call> calls{{"getLightSamples", {p.state.P, p.state.N}, {0}}};
        if (!black)
            calls.push_back({"traceReflection", {p.state.P, {I.x, 0, -I.z}}, {0.125f}});
        if (!(tint == Vec3f(0, 0, 0)))
            calls.push_back({"traceThrough", {p.state.P, I}, {0.75f * maxComponent(tint)}});
        ASSERT_EQ(p.host.calls.size(), calls.size());
        for (std::size_t i = 0; i < calls.size(); ++i) {
            EXPECT_EQ(p.host.calls[i].service, calls[i].service);
            EXPECT_TRUE(test::near(p.host.calls[i].vectors[1], calls[i].vectors[1], 1e-6));
            EXPECT_NEAR(p.host.calls[i].scalars[0], calls[i].scalars[0], 1e-6f);
        }
        ASSERT_EQ(map.lookups.size(), mapped && bound);
        for (Vec2f const at : map.lookups)
            EXPECT_TRUE(at.x == 1 && at.y == 0.75f);
        p.shader.transmission(&p.host, p.state);
        EXPECT_EQ(p.state.transmissionColor, p.shader.u_refractColor * 0.75f)
            << "shadow rays know neither map nor angle";
    }
}

/// From behind, lights meet the frame of the normal as it is: a normal that
/// leans to the viewer has highlights, one that leans away has none.
TEST(Glazing, LightsMeetTheNormalAsItIs)
{
    struct Lean {
        Vec3f I, N, L;
        float lit;
    };
    for (Lean const& lean :
         {Lean{kBack, {-0.6f, 0, 0.8f}, {0.96f, 0, 0.28f}, 0},
          Lean{{0.8f, 0, 0.6f}, {-0.8f, 0, 0.6f}, {-0.6f, 0, 0.8f}, 0.06879979f}}) {
        Pane p(lean.I);
        p.state.N = lean.N;
        p.state.Ng = {0, 0, 1};
        p.shader.u_reflectColor = p.shader.u_refractColor = {0, 0, 0};
        p.host.addLight(lean.L, {1, 1, 1});
        EXPECT_NEAR(p.shade().x, lean.lit, 1e-6f);
    }
}

/// The skeleton that all physical materials share: only light from the light
/// list is occluded, by as much as the pane is opaque.
TEST(Glazing, OccludesTheLightsAloneAndOnlyWhereOpaque)
{
    test::FunctionTexture<Vec2f> map([](Vec2f) { return Vec4f(0.75f, 9, 9, 9); });
    for (int source : {0, 1, 2}) { // the host, texture, vertex colour
        Pane p({0, 0, -1});
        corvid_Mtl_Glazing& pane = p.shader;
        pane.u_reflectColor = {0, 0, 0};
        pane.usingRaytracedAO = true;
        pane.ambientOcclusionMode = source;
        pane.ambientOcclusionTexture.texture = &map;
        pane.ambientOcclusionFactor = 0.5f;
        pane.ambientOcclusionColor = {0.25f, 0, 1};
        test::setAttribute(p.state, 8, Vec4f(0.75f, 9, 9, 9));
        p.host.onOcclusion = [](Vec3f, Vec3f) { return Vec3f(0.75f, 0.75f, 0.75f); };
        p.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 1, 1, 1); };
        p.host.addLight({0, 0, 1}, {1, 1, 1});
        // Head-on: R D G / 4 = 1/(4 pi); transmission weight 3/8, 3/32, 0.
        float const lit = 0.07957747f, k = 0.25f * 0.5f * (1 - 0.375f);
        Vec3f const want(lit * (1 - 0.75f * k) + 0.375f, lit * (1 - k) + 0.09375f, lit);
        EXPECT_TRUE(test::near(rgb(p.shade()), want, 1e-6)) << source;
        EXPECT_EQ(p.host.count("occlusion"), source == 0);
    }
}

} // namespace
} // namespace zsi
