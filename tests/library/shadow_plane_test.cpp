#include "materials/utility/corvid_Mtl_ShadowPlane.h"
#include "support/record.h"
#include "support/scriptedHost.h"

#include <algorithm>
#include <gtest/gtest.h>

namespace zsi {
namespace {

constexpr Vec3f kBehind(0.5f, 1.0f, 2.0f);
constexpr Vec4f kUntouched(7, 7, 7, 7);

struct Catcher {
    corvid_Mtl_ShadowPlane shader;
    test::ScriptedHost host;
    Vec3f open{1, 1, 1};
    std::uint32_t rayType = kRayCamera;

    ShadeState shade()
    {
        host.onOcclusion = [this](Vec3f, Vec3f) { return open; };
        host.onTrace = [](Vec3f, Vec3f) { return kBehind; };
        ShadeState state = test::plainHit();
        state.P = {1, 2, 3};
        state.I = {0, 0.6f, -0.8f};
        state.N = {0, 1, 0};
        state.rayType = rayType;
        state.Ci = kUntouched;
        shader.shade(&host, state);
        return state;
    }
};

void expectDiscarded(ShadeState const& state, Catcher const& catcher)
{
    EXPECT_EQ(state.discardHit, 1);
    EXPECT_EQ(rgb(state.Ci), Vec3f(7, 7, 7));
    EXPECT_EQ(state.Ci.w, 7.0f);
    EXPECT_EQ(catcher.host.count("traceContinue"), 0) << "a ray spent on nothing";
}

TEST(ShadowPlane, IsNotThereWhereNothingIsDarkened)
{
    Catcher noLights;
    expectDiscarded(noLights.shade(), noLights);
    Catcher lit;
    lit.host.addLight({0, 0, 1}, {0.1f, 0.7f, 0.3f});
    lit.host.addLight({0, 0, 1}, {3, 0.2f, 0.1f});
    expectDiscarded(lit.shade(), lit);
}

TEST(ShadowPlane, DarkensWhatLiesBehind)
{
    struct Case {
        char const* why;
        bool light;
        Vec3f shadow, open, shadowColor;
        Vec3f want; ///< factor on what lies behind
    };
    constexpr Vec3f kBlack(0, 0, 0), kOpen(1, 1, 1);
    constexpr Case kCases[] = {
        {"full shadow, intensity 0.7", true, kBlack, kOpen, kBlack, {0.3f, 0.3f, 0.3f}},
        {"full red shadow: 0.7 c + 0.3", true, kBlack, kOpen, {1, 0, 0}, {1, 0.3f, 0.3f}},
        {"occlusion takes no intensity",
         false,
         kOpen,
         {0.5f, 0.5f, 0.5f},
         kBlack,
         {0.5f, 0.5f, 0.5f}},
        {"occlusion tends to the colour",
         false,
         kOpen,
         {0, 0.5f, 1},
         {0.5f, 0, 0},
         {0.5f, 0.5f, 1}},
        // q = 0.5, S = b q = (0.25, 0.125, 0) of U = 1; 0.3 (1 - R) + R.
        {"coloured shadow", true, {0.5f, 0.25f, 0}, kOpen, kBlack, {0.475f, 0.3875f, 0.3f}},
        {"shadow times occlusion", true, kBlack, {0.5f, 1, 1}, kBlack, {0.15f, 0.3f, 0.3f}},
    };
    for (Case const& c : kCases) {
        SCOPED_TRACE(c.why);
        Catcher catcher;
        catcher.shader.shadowColor = c.shadowColor;
        catcher.open = c.open;
        if (c.light)
            catcher.host.addLight({0, 0, 1}, {1, 1, 1}, c.shadow);
        ShadeState const state = catcher.shade();
        EXPECT_FLOAT_EQ(state.Ci.x, kBehind.x * c.want.x);
        EXPECT_FLOAT_EQ(state.Ci.y, kBehind.y * c.want.y);
        EXPECT_FLOAT_EQ(state.Ci.z, kBehind.z * c.want.z);
        EXPECT_NEAR(state.Ci.w, 1 - std::min({c.want.x, c.want.y, c.want.z}), 1e-7f);
        EXPECT_EQ(state.discardHit, 0);
    }
}

TEST(ShadowPlane, AsksTheHostOnceForEachThing)
{
    for (std::uint32_t const rayType : {1u, 2u, 4u, 32u}) {
        Catcher catcher;
        catcher.rayType = rayType;
        catcher.open = {0.5f, 0.5f, 0.5f};
        catcher.shade();
        auto const& calls = catcher.host.calls;
        ASSERT_EQ(calls.size(), 3u);
        EXPECT_EQ(calls[0].service, "getLightSamples");
        EXPECT_EQ(calls[0].scalars[0], 0.0f) << "category";
        EXPECT_EQ(calls[1].service, "occlusion");
        EXPECT_EQ(calls[1].scalars[0], 1.0f) << "importance";
        EXPECT_EQ(calls[2].service, "traceContinue");
        EXPECT_EQ(calls[2].scalars[0], rayType == 1 ? 4.0f : static_cast<float>(rayType));
        EXPECT_EQ(calls[2].scalars[1], 1.0f) << "importance";
        for (test::Call const& call : calls)
            EXPECT_EQ(call.vectors[0], Vec3f(1, 2, 3)) << "P";
        EXPECT_EQ(calls[0].vectors[1], Vec3f(0, 1, 0)) << "N, not turned to the viewer";
        EXPECT_EQ(calls[1].vectors[1], Vec3f(0, 1, 0));
        EXPECT_EQ(calls[2].vectors[1], Vec3f(0, 0.6f, -0.8f)) << "straight on";
    }
}

TEST(ShadowPlane, AgreesWithTheFormulaInDouble)
{
    test::Random random;
    for (int i = 0; i < 1000; ++i) {
        Catcher catcher;
        catcher.shader.shadowColor = random.color();
        catcher.shader.shadowIntensity = random.in(0, 1);
        catcher.open = random.color();
        double u = 0, s[3] = {};
        for (int l = 0; l < i % 4; ++l) {
            Vec3f const a = random.color() * 3.0f, b = random.color();
            catcher.host.addLight({0, 0, 1}, a, b);
            double const q = std::max(
                {double(a.x) * double(b.x), double(a.y) * double(b.y), double(a.z) * double(b.z)});
            u += double(std::max({a.x, a.y, a.z}));
            s[0] += double(b.x) * q, s[1] += double(b.y) * q, s[2] += double(b.z) * q;
        }
        ShadeState const state = catcher.shade();
        auto const factor = [&](double c, double shadowed, double open) {
            double const k = double(catcher.shader.shadowIntensity), r = u == 0 ? 1 : shadowed / u;
            return ((c * k + 1 - k) * (1 - r) + r) * (open + (1 - open) * c);
        };
        Vec3f const c = catcher.shader.shadowColor;
        double const x[3] = {factor(double(c.x), s[0], double(catcher.open.x)),
                             factor(double(c.y), s[1], double(catcher.open.y)),
                             factor(double(c.z), s[2], double(catcher.open.z))};
        // A dozen roundings of numbers up to 2.
        EXPECT_NEAR(double(state.Ci.x), double(kBehind.x) * x[0], 3e-6);
        EXPECT_NEAR(double(state.Ci.y), double(kBehind.y) * x[1], 3e-6);
        EXPECT_NEAR(double(state.Ci.z), double(kBehind.z) * x[2], 3e-6);
        EXPECT_NEAR(double(state.Ci.w), 1 - std::min({x[0], x[1], x[2]}), 3e-6);
    }
}

TEST(ShadowPlane, ABrokenLightOrOcclusionShowsInsteadOfVanishing)
{
    Catcher light, occlusion;
    light.host.addLight({0, 0, 1}, {1, 1, 1}, {1, std::nanf(""), 1});
    EXPECT_EQ(light.shade().discardHit, 0);
    occlusion.open.y = std::nanf("");
    EXPECT_EQ(occlusion.shade().discardHit, 0);
    EXPECT_EQ(occlusion.host.count("traceContinue"), 1);
}

TEST(ShadowPlane, BlocksShadowRaysOnlyAndPassesPathsOn)
{
    corvid_Mtl_ShadowPlane const plane;
    for (std::uint32_t const rayType : {1u, 2u, 4u, 16u, 17u, 32u}) {
        ShadeState state = test::plainHit();
        state.rayType = rayType;
        plane.transmission(nullptr, state);
        EXPECT_EQ(state.transmissionColor, rayType == 16 ? Vec3f(0, 0, 0) : Vec3f(1, 1, 1));
    }
    ShadeState state = test::plainHit();
    state.I = {0.6f, 0, -0.8f};
    plane.sample(nullptr, state);
    EXPECT_EQ(state.sampleDirection, state.I);
    EXPECT_EQ(state.outBrdf, Vec3f(1, 1, 1));
    EXPECT_EQ(state.sampleCosine, 1.0f);
    EXPECT_EQ(state.sampleInvPdf, 1.0f);
    EXPECT_EQ(state.sampleType, 4u);
}

} // namespace
} // namespace zsi
