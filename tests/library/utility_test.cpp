// The utility materials.
#include "materials/utility/corvid_Mtl_AmbientOnly.h"
#include "materials/utility/corvid_Mtl_Mirror.h"
#include "materials/utility/corvid_Mtl_NormalsOnly.h"
#include "materials/utility/corvid_Mtl_ShadowPlane.h"
#include "materials/utility/corvid_Mtl_Solid.h"
#include "materials/utility/corvid_Mtl_Unlit.h"
#include "support/reference.h"
#include "support/scriptedHost.h"

namespace zsi {
namespace {

using test::D3;
using test::minus;
using test::times;

D3 clamped(D3 c) { return {test::clampUnit(c.x), test::clampUnit(c.y), test::clampUnit(c.z)}; }
double darkest(D3 c) { return std::min({c.x, c.y, c.z}); }
/// Per channel; the factors of a colour.
D3 filter(D3 a, D3 b) { return {a.x * b.x, a.y * b.y, a.z * b.z}; }
D3 blend(D3 a, D3 b, D3 t) { return plus(a, filter(t, minus(b, a))); }

TEST(Solid, IsTheColourOfItsStateTimesTheCosineWhicheverWayTheNormalIsTurned)
{
    constexpr D3 kLilac(0.69, 0.58, 0.69), kGrey(0.85, 0.85, 0.85), kBlack(0, 0, 0);
    constexpr std::pair<int, D3> kStates[] = {{-1, kBlack}, {0, kLilac}, {1, kLilac},
                                              {2, kGrey},   {3, kBlack}, {5, kBlack}};
    test::Random random;
    for (auto const& [patchState, base] : kStates)
        for (int i = 0; i < 200; ++i) {
            corvid_Mtl_Solid solid;
            solid.patchState = patchState;
            solid.reverseNormal = i & 1;
            solid.faceForward = i & 2;
            ShadeState state = test::randomHit(random, true);
            state.Ci.w = 7;
            if (i < 20)
                state.N = state.I * 3.0f; // a cosine above 1 must not brighten beyond 1
            solid.shade(nullptr, state);
            double const d = std::fabs(test::dotOf(state.I, state.N));
            EXPECT_TRUE(test::near(rgb(state.Ci), clamped(times(base, d)), 1e-6)) << patchState;
            EXPECT_EQ(state.Ci.w, 7.0f) << "alpha is not its own";
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
    test::Random random;
    int disagree = 0;
    for (int i = 0; i < 4000; ++i) {
        corvid_Mtl_NormalsOnly shader;
        shader.reverseNormal = i & 1;
        shader.faceForward = i & 2;
        shader.faceLight = i & 4;
        ShadeState state = test::plainHit();
        state.I = random.unit();
        state.N = random.unit();
        state.Ng = i % 16 >= 8 ? state.N : random.unit();
        shader.shade(nullptr, state);

        double const sign = shader.reverseNormal ? -1 : 1;
        double const d = sign * test::dotOf(state.I, state.N),
                     side = sign * test::dotOf(state.I, state.Ng);
        // Back faces whose shading normal leans to the viewer are black, and so are such fronts.
        D3 const want = shader.faceForward ? times({0.05, 0.8, 0.05}, std::fabs(d))
            : shader.faceLight             ? times({0.45, 0.65, 0.35}, std::fabs(d))
            : side > 0                     ? clamped({d, d, 0})
                                           : clamped(times({0.05, 0.05, 0.8}, -d));
        EXPECT_TRUE(test::near(state.Ci, {float(want.x), float(want.y), float(want.z), 1}, 1e-6));
        disagree += side > 0 && d < 0;
    }
    EXPECT_GT(disagree, 50);
    for (float const x : {1.0f, std::nanf("")}) { // edge on and broken: a front
        test::Trial<corvid_Mtl_NormalsOnly> t;
        t.state.Ng = {x, 0, 0};
        EXPECT_TRUE(test::near(t.shade(), {0.05f, 0.05f, 0.8f, 1}, 1e-6));
    }
}

TEST(AmbientOnly, TakesOneSourceAndShowsItsDarkestChannel)
{
    enum Source { kNone, kTexture, kVertex, kHost };
    struct Case {
        char const* why;
        bool show, precalc, raytraced;
        int mode;
        Source source; ///< which one is asked
    };
    constexpr Case kCases[] = {
        {"off: white", false, true, true, 1, kNone},
        {"texture goes before the host", true, true, true, 1, kTexture},
        {"vertex colour goes before the host", true, true, true, 2, kVertex},
        {"vertex colour", true, true, false, 2, kVertex},
        {"an unknown baked mode: white", true, true, false, 3, kNone},
        {"no baked mode: the host", true, true, true, 0, kHost},
        {"an unknown baked mode: the host", true, true, true, 7, kHost},
        {"baked source switched off: the host", true, false, true, 1, kHost},
        {"baked source switched off, no rays: white", true, false, false, 2, kNone},
    };
    test::Random random;
    for (Case const& c : kCases)
        for (int i = 0; i < 50; ++i) {
            SCOPED_TRACE(c.why);
            test::Trial<corvid_Mtl_AmbientOnly> t;
            corvid_Mtl_AmbientOnly& s = t.shader;
            s.showAmbientOnly = c.show;
            s.usePrecalcAO = c.precalc;
            s.usingRaytracedAO = c.raytraced;
            s.ambientOcclusionMode = c.mode;
            s.ambientOcclusionFactor = random.in(0, 1);
            s.ambientOcclusionColor = random.color();
            Vec3f const open = random.color();
            Vec4f const baked(open.x, 0.1f, 0.2f, 0.3f);
            test::FunctionTexture<Vec2f> map([&](Vec2f) { return baked; });
            s.ambientOcclusionTexture.texture = &map;
            t.host.onOcclusion = [&](Vec3f, Vec3f) { return open; };
            t.state.P = {1, 2, 3};
            t.state.N = {0.6f, 0, 0.8f};
            // Edge on, the normal is zero.
            t.state.Ng = i ? Vec3f(0, 0, i % 2 ? 1.0f : -1.0f) : Vec3f(1, 0, 0);
            test::setAttribute(t.state, 0, Vec2f(0.25f, 0.75f));
            test::setAttribute(t.state, 8, baked);

            Vec3f const seen = c.source == kHost ? open : grey(c.source ? open.x : 1.0f);
            double const f = double(s.ambientOcclusionFactor);
            D3 const k = times(minus({1, 1, 1}, seen), f); // how much of the colour there is
            // A handful of roundings below 1.
            float const want = float(darkest(blend({1, 1, 1}, s.ambientOcclusionColor, k)));
            EXPECT_TRUE(test::near(t.shade(), {want, want, want, 1}, 5e-7));

            ASSERT_EQ(map.lookups.size(), c.source == kTexture);
            for (Vec2f const at : map.lookups)
                EXPECT_TRUE(at.x == 0.25f && at.y == 0.75f);
            ASSERT_EQ(t.host.calls.size(), c.source == kHost);
            if (c.source == kHost) {
                test::Call const& call = t.host.calls[0];
                EXPECT_EQ(call.vectors[0], t.state.P);
                EXPECT_EQ(call.vectors[1],
                          t.state.N
                              * (i % 2   ? 1.0f
                                     : i ? -1.0f
                                         : 0.0f))
                    << "turned to the viewer by the geometric normal";
                EXPECT_EQ(call.scalars[0], 1.0f) << "importance";
            }
        }
}

TEST(Mirror, ShadesTheTintedReflectionAndBlendsTheMask)
{
    test::Random random;
    for (int i = 0; i < 600; ++i) {
        test::Trial<corvid_Mtl_Mirror> t;
        ShadeState& s = t.state = test::randomHit(random, i % 2);
        s.Ci = {7, 7, 7, 7};
        Vec3f const T = t.shader.u_tintColor = random.color();
        constexpr Vec3f kMasks[] = {{0, 0, 0}, {1, 1, 1}, {1, 0.5f, 0.25f}};
        Vec3f const mask = t.shader.maskingColor = kMasks[i % 3], seen = random.color();
        Vec4f const behind = withAlpha(random.color(), 0.375f);
        t.host.onTrace = [&](Vec3f, Vec3f) { return seen; };
        t.host.onThrough = [&](Vec3f, Vec3f) { return behind; };
        t.shade();
        if (i % 3 == 1) {
            EXPECT_EQ(s.discardHit, 1);
            EXPECT_TRUE(t.host.calls.empty());
            continue;
        }
        double const F = 0.92 + 0.08 * std::pow(1 - std::fabs(test::dotOf(s.I, s.N)), 5);
        test::Call const& ray = t.host.calls[0];
        ASSERT_EQ(ray.service, "traceReflection");
        EXPECT_EQ(ray.vectors[0], s.P);
        EXPECT_NEAR(double(ray.scalars[0]), F * double(maxComponent(T)), 1e-6);
        D3 const straight = minus(s.I, times(s.N, 2 * test::dotOf(s.I, s.N)));
        double const side = i % 2 ? 1 : -1;
        if (side * inner(straight, s.Ng) > 0.05) {
            EXPECT_TRUE(test::near(ray.vectors[1], straight, 1e-6));
        }
        EXPECT_GT(side * test::dotOf(ray.vectors[1], s.Ng), 0.0499);
        bool const blended = i % 3 == 2;
        ASSERT_EQ(t.host.count("traceThrough"), blended);
        EXPECT_TRUE(!blended || t.host.calls[1].scalars[0] == 1.0f) << "importance";
        D3 const want = blend(times(filter(T, seen), F), rgb(behind), mask);
        EXPECT_TRUE(test::near(rgb(s.Ci), want, 1e-6));
        EXPECT_EQ(s.Ci.w, blended ? behind.w : 1);
    }
}

TEST(Mirror, SamplesTheMirrorDirectionForTheThirdSwitchOnly)
{
    test::Random random;
    corvid_Mtl_Mirror mirror;
    mirror.u_tintColor = {0.5f, 0.25f, 1};
    for (int i = 0; i < 200; ++i) {
        ShadeState s = test::randomHit(random, i % 2);
        s.allowReflection[0] = s.allowReflection[1] = s.allowTransmission[2] = 1;
        s.outBrdf = {7, 7, 7};
        ShadeState const before = s;
        mirror.transfer(nullptr, s);
        EXPECT_EQ(std::memcmp(&before, &s, sizeof s), 0) << "a perfect mirror scatters nothing";
        s.sampleType = 77;
        mirror.sample(nullptr, s);
        EXPECT_EQ(s.sampleType, 0u);
        s.allowReflection[2] = 1;
        mirror.sample(nullptr, s);
        double const d = test::dotOf(s.I, s.N);
        EXPECT_EQ(s.sampleType, 4u);
        EXPECT_EQ(s.sampleInvPdf, 1);
        EXPECT_NEAR(double(s.sampleCosine), std::fabs(d), 1e-6);
        EXPECT_TRUE(test::near(s.sampleDirection, minus(s.I, times(s.N, 2 * d)), 1e-6));
        EXPECT_TRUE(test::near(times(s.outBrdf, std::fabs(d)), mirror.u_tintColor, 1e-5))
            << "value times cosine is the tint";
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

TEST(ShadowPlane, DarkensWhatLiesBehindByShadowAndOcclusion)
{
    test::Random random;
    for (int i = 0; i < 1000; ++i) {
        Catcher c;
        D3 const color = c.shader.shadowColor = random.color();
        double const k = double(c.shader.shadowIntensity = random.in(0, 1));
        c.open = random.color();
        double u = 0;
        D3 shadowed;
        for (int l = 0; l < i % 4; ++l) {
            Vec3f const a = random.color() * 3.0f, b = random.color();
            c.host.addLight({0, 0, 1}, a, b);
            D3 const arriving = filter(a, b);
            u += double(maxComponent(a));
            shadowed = plus(shadowed, times(b, std::max({arriving.x, arriving.y, arriving.z})));
        }
        D3 const ratio = i % 4 ? times(shadowed, 1 / u) : D3(1, 1, 1), one(1, 1, 1);
        // The intensity is of the shadow, not of the occlusion.
        D3 const full = plus(times(color, k), D3(1 - k, 1 - k, 1 - k));
        D3 const x = filter(blend(full, one, ratio), blend(color, one, c.open));
        c.shade();
        // A dozen roundings of numbers up to 2.
        EXPECT_TRUE(test::near(rgb(c.state.Ci), filter(kBehind, x), 3e-6));
        EXPECT_NEAR(double(c.state.Ci.w), 1 - darkest(x), 3e-6);
        EXPECT_EQ(c.state.discardHit, 0);
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
