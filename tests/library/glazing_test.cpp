// The panes reflect R = 0.75^2 / 2.25 = 1/4 by facets of squared width 1/4.
#include "materials/physical/corvid_Mtl_Glazing.h"
#include "support/scriptedHost.h"

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
    struct Case {
        char const* why;
        Vec3f I, L;
        float want; ///< Walter et al. 2007, eq. 20, 33, 34, in double, times 1/4 or 3/4
    };
    constexpr Case kCases[] = {
        {"mirror", kFront, kBack, 0.1162971f},
        {"from behind", kBack, kFront, 0.1162971f},
        {"straight on", kFront, kFront, 0.3488913f},
        {"through, scattered", kBack, {0, 0.6f, 0.8f}, 0.1268353f},
    };
    for (Case const& c : kCases) {
        Pane p(c.I);
        p.state.sampleDirection = c.L;
        p.shader.transfer(&p.host, p.state);
        EXPECT_TRUE(test::near(p.state.outBrdf, grey(c.want), 1e-6)) << c.why;
        EXPECT_NEAR(p.state.sampleCosine, 0.8f, 1e-6f) << c.why;
    }
}

TEST(Glazing, SamplesMirrorOrStraightOnBySwitchAndChance)
{
    struct Case {
        char const* why;
        bool reflection, transmission;
        float random;
        std::uint32_t type;
        float chance; ///< left in the value
    };
    constexpr Case kCases[] = {
        {"nothing allowed", false, false, -1, 0, 0},  {"reflection", true, false, -1, 4, 0.25f},
        {"transmission", false, true, -1, 32, 0.75f}, {"a tie reflects", true, true, 0.25f, 4, 1},
        {"chance", true, true, 0.2500001f, 32, 1},
    };
    for (Case const& c : kCases)
        for (int which : {0, 1, 2})
            for (Vec3f I : {kFront, kBack}) {
                SCOPED_TRACE(c.why);
                Pane p(I);
                p.host.randoms = {c.random};
                p.state.allowReflection[which] = c.reflection;
                p.state.allowTransmission[2 - which] = c.transmission;
                p.state.sampleType = 9;
                p.shader.sample(&p.host, p.state);
                EXPECT_EQ(p.host.randomCalls, c.random >= 0);
                ASSERT_EQ(p.state.sampleType, c.type);
                if (c.type == 0)
                    continue;
                bool const through = c.type == 32;
                Vec3f const tint = through ? p.shader.u_refractColor : p.shader.u_reflectColor;
                float const cosine = through ? -0.8f : 0.8f; // value and cosine turn together
                EXPECT_EQ(p.state.sampleInvPdf, 1);
                EXPECT_NEAR(p.state.sampleCosine, cosine, 1e-6f);
                EXPECT_TRUE(test::near(p.state.outBrdf, tint * (c.chance / cosine), 1e-6));
                Vec3f const mirrored(I.x, 0, -I.z);
                EXPECT_TRUE(test::near(p.state.sampleDirection, through ? I : mirrored,
                                       through ? 0 : 1e-6));
            }
}

TEST(Glazing, ShadesHighlightsReflectionAndWhatLiesBehind)
{
    struct Case {
        char const* why;
        Vec3f I;
        bool black, mapped, bound;
        Vec3f tint;
    };
    constexpr Case kCases[] = {
        {"front", kFront, false, false, true, {0.5f, 0.125f, 0}},
        {"behind", kBack, false, false, true, {0.5f, 0.125f, 0}},
        {"black costs no ray", kFront, true, false, true, {0, 0, 0}},
        {"the map's colour to the power 1/2.25", kFront, true, true, true, {0.5400299f, 1, 0}},
        {"no map lets nothing through", kFront, false, true, false, {0, 0, 0}},
    };
    for (Case const& c : kCases) {
        SCOPED_TRACE(c.why);
        Pane p(c.I);
        test::FunctionTexture<Vec2f> map([](Vec2f) { return Vec4f(0.5f, 2, 0, 1); });
        if (c.black)
            p.shader.u_reflectColor = p.shader.u_refractColor = {0, 0, 0};
        p.shader.u_transmittanceMapEnable = c.mapped;
        p.shader.u_transmittanceMap.texture = c.bound ? &map : nullptr;
        p.shader.u_transmittanceAmount = 0.5f;
        p.shader.u_transmittanceTransform = Mat3f(0, 2, 0, 1, 0, 0, 0.5f, 0.25f, 1);
        p.host.addLight(kBack, {2, 1, 4}, {0.5f, 1, 0.25f}, 0.75f);
        p.host.addLight({0, 0.8f, -0.6f}, {9, 9, 9}); // below the geometric surface
        p.host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 2, 4); };
        p.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(4, 2, 1, 0.1f); };
        Vec3f const lit = grey(c.I.z < 0 ? 0.1162971f * 0.75f : 0);
        Vec3f const want =
            lit + p.shader.u_reflectColor * Vec3f(0.25f, 0.5f, 1) + c.tint * Vec3f(3, 1.5f, 0.75f);
        EXPECT_TRUE(test::near(p.shade(), withAlpha(want, 1), 2e-6));

        std::vector<test::Call> calls{{"getLightSamples", {p.state.P, p.state.N}, {0}}};
        if (!c.black)
            calls.push_back({"traceReflection", {p.state.P, {c.I.x, 0, -c.I.z}}, {0.125f}});
        if (!(c.tint == Vec3f(0, 0, 0)))
            calls.push_back({"traceThrough", {p.state.P, c.I}, {0.75f * maxComponent(c.tint)}});
        ASSERT_EQ(p.host.calls.size(), calls.size());
        for (std::size_t i = 0; i < calls.size(); ++i) {
            EXPECT_EQ(p.host.calls[i].service, calls[i].service);
            EXPECT_TRUE(test::near(p.host.calls[i].vectors[1], calls[i].vectors[1], 1e-6));
            EXPECT_NEAR(p.host.calls[i].scalars[0], calls[i].scalars[0], 1e-6f);
        }
        ASSERT_EQ(map.lookups.size(), c.mapped && c.bound);
        for (Vec2f const at : map.lookups)
            EXPECT_TRUE(at.x == 1 && at.y == 0.75f);
        p.shader.transmission(&p.host, p.state);
        EXPECT_EQ(p.state.transmissionColor, p.shader.u_refractColor * 0.75f)
            << "shadow rays know neither map nor angle";
    }
}

/// From behind, lights meet the frame of the normal as it is: a normal that leans to the viewer has
/// highlights, one that leans away has none.
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

/// The skeleton that all physical materials share: only light from the light list is occluded, by
/// as much as the pane is opaque.
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
