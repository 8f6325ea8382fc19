// SPDX-License-Identifier: Apache-2.0
// The utility materials.
#include "materials/utility/corvid_Mtl_AmbientOnly.h"
#include "materials/utility/corvid_Mtl_Mirror.h"
#include "materials/utility/corvid_Mtl_NormalsOnly.h"
#include "materials/utility/corvid_Mtl_ShadowPlane.h"
#include "materials/utility/corvid_Mtl_Solid.h"
#include "materials/utility/corvid_Mtl_Unlit.h"
#include "support/textTable.h"

namespace zsi {
namespace {

TEST(Solid, IsTheColourOfItsStateTimesTheCosineWhicheverWayTheNormalIsTurned)
{
    constexpr Vec3f kLilac(0.69f, 0.58f, 0.69f), kGrey(0.85f, 0.85f, 0.85f), kBlack(0, 0, 0);
    constexpr Vec3f kStates[] = {kBlack, kLilac, kLilac, kGrey, kBlack, kBlack}; // from -1 on
    for (int i = 0; i < 24; ++i) {
        test::Trial<corvid_Mtl_Solid> t;
        t.shader.patchState = i % 6 - 1;
        t.shader.reverseNormal = i / 6 & 1;
        t.shader.faceForward = i / 12;
        t.state.Ci.w = 7; // alpha is not its own
        for (float const along : {-0.5f, 0.5f, 3.0f}) { // a cosine above 1 brightens up to 1
            t.state.N = {0.8f, 0, along};
            Vec3f const want = clamp01(kStates[i % 6] * std::fabs(along));
            EXPECT_TRUE(test::near(t.shade(), withAlpha(want, 7), 1e-6)) << i;
        }
    }
}

TEST(Unlit, ShowsToCameraRaysOnlyAndLetsLightThrough)
{
    for (std::uint32_t const rayType : {0u, 1u, 2u, 4u, 5u, 16u, 32u}) {
        test::Trial<corvid_Mtl_Unlit> t;
        t.state.rayType = rayType;
        t.state.Ci = {7, 7, 7, 7};
        bool const seen = rayType == 1;
        EXPECT_TRUE(test::near(t.shade(), seen ? Vec4f(1, 1, 0, 7) : Vec4f(7, 7, 7, 7), 0));
        EXPECT_EQ(t.state.discardHit, !seen) << rayType;
        t.shader.transmission(nullptr, t.state);
        EXPECT_EQ(t.state.transmissionColor, Vec3f(1, 1, 1));
    }
}

TEST(NormalsOnly, ColoursBySideAndScheme)
{
    // reverse, face forward, face light, cosines of I with the normal and the geometric normal
    for (test::Line const& c : test::table(R"(
        front                       | | 0 0 0  -0.5 -1   0.025 0.025 0.4
        back                        | | 0 0 0   0.5 1    0.5 0.5 0
        back that leans to the eye  | | 0 0 0  -0.5 1    0 0 0
        front that leans away       | | 0 0 0   0.5 -1   0 0 0
        reversed front is a back    | | 1 0 0  -0.5 -1   0.5 0.5 0
        reversed back               | | 1 0 0   0.5 1    0.025 0.025 0.4
        faced                       | | 0 1 0   0.5 1    0.025 0.4 0.025
        faced goes before the light | | 1 1 1  -0.5 -1   0.025 0.4 0.025
        light                       | | 0 0 1   0.5 -1   0.225 0.325 0.175
        edge on: a front            | | 0 0 0  -1 0      0.05 0.05 0.8
        broken: a front             | | 0 0 0  -1 2      0.05 0.05 0.8)")) {
        test::Trial<corvid_Mtl_NormalsOnly> t;
        t.shader.reverseNormal = c.want[0] != 0;
        t.shader.faceForward = c.want[1] != 0;
        t.shader.faceLight = c.want[2] != 0;
        t.state.N = {0, 0.3f, -c.want[3]};
        t.state.Ng = {0, 0, c.want[4] > 1 ? std::nanf("") : -c.want[4]};
        EXPECT_TRUE(test::near(t.shade(), withAlpha(test::vec3(c.want, 5), 1), 1e-6)) << c.why;
    }
}

TEST(AmbientOnly, TakesOneSourceAndShowsItsDarkestChannel)
{
    // How much of the colour (0.5, 0, 1) there is: what is open, 1/2 of it. A baked 0.25 leaves
    // 1 - 3/8 of black; the host's (0.5, 0.75, 0.25) leave 1 - 1/4 * 1/2 of 0.5 and 1 - 1/8 of 0.
    // show, baked source on, rays on, mode: result, lookups, questions to the host
    for (test::Line const& c : test::table(R"(
        off: white                           | | 0 1 1 1  1     0 0
        texture goes before the host         | | 1 1 1 1  0.625 1 0
        vertex colour goes before the host   | | 1 1 1 2  0.625 0 0
        vertex colour                        | | 1 1 0 2  0.625 0 0
        an unknown baked mode: white         | | 1 1 0 3  1     0 0
        no baked mode: the host              | | 1 1 1 0  0.875 0 1
        an unknown baked mode: the host      | | 1 1 1 7  0.875 0 1
        baked source off: the host           | | 1 0 1 1  0.875 0 1
        baked source off, no rays: white     | | 1 0 0 2  1     0 0)"))
        for (float const side : {1.0f, -1.0f, 0.0f}) { // edge on, the normal is zero
            SCOPED_TRACE(c.why);
            test::Trial<corvid_Mtl_AmbientOnly> t;
            test::FunctionTexture<Vec2f> map([](Vec2f) { return Vec4f(0.25f, 0.1f, 0.2f, 0.3f); });
            corvid_Mtl_AmbientOnly& s = t.shader;
            s.showAmbientOnly = c.want[0] != 0;
            s.usePrecalcAO = c.want[1] != 0;
            s.usingRaytracedAO = c.want[2] != 0;
            s.ambientOcclusionMode = static_cast<int>(c.want[3]);
            s.ambientOcclusionFactor = 0.5f;
            s.ambientOcclusionColor = {0.5f, 0, 1};
            s.ambientOcclusionTexture.texture = &map;
            t.host.onOcclusion = [](Vec3f, Vec3f) { return Vec3f(0.5f, 0.75f, 0.25f); };
            t.state.P = {1, 2, 3};
            t.state.N = {0.6f, 0, 0.8f};
            t.state.Ng = {side == 0 ? 1.0f : 0.0f, 0, side};
            test::setAttribute(t.state, 0, Vec2f(0.25f, 0.75f));
            test::setAttribute(t.state, 8, Vec4f(0.25f, 0.1f, 0.2f, 0.3f));
            EXPECT_TRUE(test::near(t.shade(), withAlpha(grey(c.want[4]), 1), 1e-6));
            ASSERT_EQ(float(map.lookups.size()), c.want[5]);
            for (Vec2f const at : map.lookups)
                EXPECT_TRUE(at.x == 0.25f && at.y == 0.75f);
            std::vector<test::Call> asked;
            if (c.want[6] != 0)
                asked = {{"occlusion", {t.state.P, t.state.N * side}, {1}}};
            EXPECT_EQ(t.host.calls, asked);
        }
}

TEST(Mirror, ShadesTheTintedReflectionAndBlendsTheMask)
{
    constexpr float kF = 0.92f + 0.08f * 0.00032f; // 1 - cosine is 1/5
    for (float const side : {1.0f, -1.0f})
        for (Vec3f const mask : {Vec3f(0, 0, 0), Vec3f(1, 1, 1), Vec3f(1, 0.5f, 0.25f)}) {
            test::Trial<corvid_Mtl_Mirror> t;
            ShadeState& s = t.state;
            s.P = {1, 2, 3};
            s.I = {0.6f, 0, -0.8f};
            s.N = {0, 0, side};
            s.Ng = {0, 0.28f * side, 0.96f * side};
            s.Ci = {7, 7, 7, 7};
            t.shader.u_tintColor = {0.25f, 0.5f, 0.125f};
            t.shader.maskingColor = mask;
            t.host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 2, 4); };
            t.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(0.5f, 0.25f, 1, 0.375f); };
            t.shade();
            EXPECT_EQ(s.discardHit, mask.z == 1);
            if (s.discardHit) {
                EXPECT_TRUE(t.host.calls.empty());
                continue;
            }
            test::Call const& ray = t.host.calls.at(0);
            EXPECT_EQ(ray.service, "traceReflection");
            EXPECT_EQ(ray.vectors[0], s.P);
            EXPECT_TRUE(test::near(ray.vectors[1], {0.6f, 0, 0.8f}, 1e-6));
            EXPECT_NEAR(ray.scalars[0], kF * 0.5f, 1e-6f);
            bool const blended = mask.x == 1;
            ASSERT_EQ(t.host.calls.size(), blended ? 2u : 1u);
            if (blended) {
                EXPECT_EQ(t.host.calls[1], (test::Call{"traceThrough", {s.P, s.I}, {1}}));
            }
            Vec4f const want = blended
                ? Vec4f(0.5f, 0.5f * kF + 0.125f, 0.375f * kF + 0.25f, 0.375f)
                : Vec4f(0.25f * kF, kF, 0.5f * kF, 1);
            EXPECT_TRUE(test::near(s.Ci, want, 1e-6));
            // A normal that leans so far that its mirror image dips: kept above on either side.
            s.N = Vec3f(0.6f, 0, 0.8f) * side;
            t.shade();
            EXPECT_NEAR(dot(t.host.calls[0].vectors[1], s.Ng) * side, 0.05f, 1e-5f);
        }
}

TEST(Mirror, SamplesTheMirrorDirectionForTheThirdSwitchOnly)
{
    corvid_Mtl_Mirror mirror;
    mirror.u_tintColor = {0.5f, 0.25f, 1};
    for (float const side : {1.0f, -1.0f}) {
        ShadeState s = test::plainHit();
        s.I = {0.6f, 0, -0.8f};
        s.N = s.Ng = {0, 0, side};
        s.allowReflection[0] = s.allowReflection[1] = s.allowTransmission[2] = 1;
        ShadeState const before = s;
        mirror.transfer(nullptr, s);
        EXPECT_EQ(std::memcmp(&before, &s, sizeof s), 0) << "a perfect mirror scatters nothing";
        s.sampleType = 77;
        mirror.sample(nullptr, s);
        EXPECT_EQ(s.sampleType, 0u);
        s.allowReflection[2] = 1;
        mirror.sample(nullptr, s);
        EXPECT_EQ(s.sampleType, 4u);
        EXPECT_EQ(s.sampleInvPdf, 1);
        EXPECT_NEAR(s.sampleCosine, 0.8f, 1e-6f);
        EXPECT_TRUE(test::near(s.sampleDirection, {0.6f, 0, 0.8f}, 1e-6));
        EXPECT_TRUE(test::near(s.outBrdf * 0.8f, mirror.u_tintColor, 1e-6)) << "times the cosine";
    }
    // Along the surface nothing is faced: straight on, with a value that divides by a zero. Of
    // I.(-0 N) only three terms of -0 sum to -0; what is negated then is the cosine.
    for (float x : {1.0f, -1.0f}) {
        ShadeState s = test::plainHit();
        s.I = {x, 0, 0};
        s.allowReflection[2] = 1;
        mirror.sample(nullptr, s);
        EXPECT_EQ(s.sampleDirection, s.I);
        EXPECT_EQ(s.outBrdf.x, x * std::numeric_limits<float>::infinity());
    }
}

constexpr Vec3f kBehind(0.5f, 1.0f, 2.0f);

struct Catcher : test::Trial<corvid_Mtl_ShadowPlane> {
    Vec3f open{1, 1, 1};

    Catcher()
    {
        host.onOcclusion = [this](Vec3f, Vec3f) { return open; };
        host.onTrace = [](Vec3f, Vec3f) { return kBehind; };
        state.P = {1, 2, 3};
        state.I = {0, 0.6f, -0.8f};
        state.N = {0, 1, 0};
        state.Ci = {7, 7, 7, 7};
    }
};

TEST(ShadowPlane, IsNotThereWhereNothingIsDarkened)
{
    for (int lights = 0; lights < 3; ++lights) {
        Catcher c;
        for (int i = 0; i < lights; ++i)
            c.host.addLight({0, 0, 1}, i ? Vec3f(0.1f, 0.7f, 0.3f) : Vec3f(3, 0.2f, 0.1f));
        EXPECT_TRUE(test::near(c.shade(), {7, 7, 7, 7}, 0));
        EXPECT_EQ(c.state.discardHit, 1);
        EXPECT_EQ(c.host.count("traceContinue"), 0) << "a ray spent on nothing";
    }
    // A broken light or occlusion shows instead of vanishing.
    Catcher light, occlusion;
    light.host.addLight({0, 0, 1}, {1, 1, 1}, {1, std::nanf(""), 1});
    light.shade();
    EXPECT_EQ(light.state.discardHit, 0);
    occlusion.open.y = std::nanf("");
    occlusion.shade();
    EXPECT_EQ(occlusion.state.discardHit, 0);
}

/// Two lights of strength 2 and 1: the shadow leaves (0.75, 0.5, 2) of 3.
TEST(ShadowPlane, DarkensWhatLiesBehindByShadowAndOcclusion)
{
    // lights, colour, intensity, open: factors on what lies behind
    for (test::Line const& c : test::table(R"(
        black shadow           | | 1 0 0 0 1 1 1 1  0.25 0.1666667 0.6666667
        half of it             | | 1 0 0 0 0.5 1 1 1  0.625 0.5833333 0.8333333
        coloured               | | 1 0.5 0 1 1 1 1 1  0.625 0.1666667 1
        occlusion alone        | | 0 0 0 0 1 0.5 0.25 1  0.5 0.25 1
        occlusion, intensity 0 | | 1 0.5 0 0 0 0.5 0.25 1  0.75 0.25 1
        both                   | | 1 0.5 0 1 0.5 0.5 0.25 0.75  0.609375 0.1458333 1)")) {
        Catcher p;
        p.shader.shadowColor = test::vec3(c.want, 1);
        p.shader.shadowIntensity = c.want[4];
        p.open = test::vec3(c.want, 5);
        if (c.want[0] != 0) {
            p.host.addLight({0, 0, 1}, {2, 1, 0.5f}, {0.5f, 0, 1}); // the brightest passes 1
            p.host.addLight({0, 0, 1}, {0.5f, 1, 1}, {0.25f, 0.5f, 1}); // 1
        }
        p.shade();
        Vec3f const x = test::vec3(c.want, 8);
        EXPECT_TRUE(test::near(p.state.Ci, withAlpha(kBehind * x, 1 - minComponent(x)), 3e-6))
            << c.why;
        EXPECT_EQ(p.state.discardHit, 0);
    }
}

TEST(ShadowPlane, AsksTheHostOnceForEachThing)
{
    for (std::uint32_t const rayType : {1u, 2u, 4u, 32u}) {
        Catcher c;
        c.state.rayType = rayType;
        c.open = {0.5f, 0.5f, 0.5f};
        c.shade();
        Vec3f const P = c.state.P, N = c.state.N; // not turned to the viewer
        float const onward = rayType == 1 ? 4.0f : static_cast<float>(rayType);
        test::Call const want[] = {{"getLightSamples", {P, N}, {0}},
                                   {"occlusion", {P, N}, {1}},
                                   {"traceContinue", {P, c.state.I}, {onward, 1}}};
        ASSERT_EQ(c.host.calls.size(), 3u);
        for (std::size_t i = 0; i < 3; ++i)
            EXPECT_EQ(c.host.calls[i], want[i]) << want[i].service;
    }
}

TEST(ShadowPlane, BlocksShadowRaysOnlyAndPassesPathsOn)
{
    corvid_Mtl_ShadowPlane const plane;
    ShadeState state = test::plainHit();
    for (std::uint32_t const rayType : {1u, 2u, 4u, 16u, 17u, 32u}) {
        state.rayType = rayType;
        plane.transmission(nullptr, state);
        EXPECT_EQ(state.transmissionColor, rayType == 16 ? Vec3f(0, 0, 0) : Vec3f(1, 1, 1));
    }
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
