#include "materials/legacy/MarlowLegacy.h"
#include "materials/utility/corvid_Mtl_AmbientOnly.h"
#include "materials/utility/corvid_Mtl_NormalsOnly.h"
#include "support/lobeSampling.h"
#include "support/reference.h"
#include "support/scriptedHost.h"
#include "support/steadyHost.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

using Picture = test::FunctionTexture<Vec2f>;
using Cube = test::FunctionTexture<Vec3f>;

double d(float v) { return static_cast<double>(v); }
double axis(Vec3f v, int i) { return d(i == 0 ? v.x : i == 1 ? v.y : v.z); }

/// Opaque white paint without highlights, out of range kept.
struct Legacy {
    MarlowLegacy shader;
    test::ScriptedHost host;
    ShadeState state = test::plainHit();

    Legacy()
    {
        shader.diffuseColor = {1, 1, 1};
        shader.specularColor = shader.specular2Color = {0, 0, 0};
        shader.transparencyMode = -1;
        shader.usingHDRbuffer = true;
        shader.globalIBLMatrix = Mat3f::identity();
    }
    Vec4f shade()
    {
        host.calls.clear();
        state.Ci = {7, 7, 7, 7};
        state.discardHit = 0;
        shader.shade(&host, state);
        return state.Ci;
    }
    void whiteRoom()
    {
        host.onTrace = host.onIndirect = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
        host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 1, 1, 1); };
    }
};

void expectColor(Vec4f got, Vec3f want, float alpha, char const* why, float tolerance = 2e-6f)
{
    for (int i = 0; i < 3; ++i)
        EXPECT_NEAR(axis(rgb(got), i), axis(want, i), d(tolerance)) << why;
    EXPECT_NEAR(got.w, alpha, tolerance) << why;
}

/// All layers at random; the clear part straight, without a pane.
void scatter(MarlowLegacy& s, test::Random& random)
{
    s.diffuseColor = random.color();
    s.specularColor = random.color() * 0.5f;
    s.specular2Color = random.color() * 0.5f;
    s.specularREG = {random.in(0, 1), random.in(0.1f, 0.9f), random.in(0, 1.5f)};
    s.specular2REG = {random.in(0, 1), random.in(0.1f, 0.9f), random.in(0, 1.5f)};
    s.transparencyMode = 0;
    s.transparencyColor = random.color();
    s.transparencyBlocksHighlights = random.in(0, 1) < 0.5f;
    s.reflectivityColor = random.color() * 0.7f;
    s.useUniformReflectivity = random.in(0, 1) < 0.5f;
    s.fresnel = {0.05f, 0.9f, 3, 1};
    s.reflectLight = random.in(0, 1) < 0.5f;
    s.surfaceRoughness = random.in(0.1f, 0.8f);
    s.maskingColor = random.color();
}

ShadeState hitAt(test::Random& random, float leastCosine)
{
    ShadeState s = test::plainHit();
    do
        s.I = random.unit();
    while (s.I.z > -leastCosine);
    return s;
}

TEST(MarlowLegacy, ShadowRaysKeepWhatMaskAndTransparencyLeave)
{
    test::Random random;
    for (int i = 0; i < 1000; ++i) {
        MarlowLegacy s; // as made: highlights and reflection count nothing here
        test::ScriptedHost host;
        ShadeState state = test::randomHit(random, i % 2);
        Vec4f const diffuseTexel = withAlpha(random.color(), random.in(0, 1));
        Vec4f const maskTexel = withAlpha(random.color(), random.in(0, 1));
        Picture diffuse([&](Vec2f) { return diffuseTexel; });
        Picture mask([&](Vec2f) { return maskTexel; });
        auto const coin = [&] { return random.in(0, 1) < 0.5f; };
        s.transparencyColor = random.color();
        s.diffuseColor = random.color();
        s.maskingColor = random.color();
        s.transparencyInvert = coin();
        s.transparencyFromDiffuse = coin();
        s.transparencyBlocksHighlights = coin();
        s.reverseNormal = coin();
        s.maskingInvertTexture = coin();
        s.maskingFromAlpha = coin();
        s.diffuseMode = coin() ? 1 : 0;
        s.maskingMode = i % 3 - 1;
        bool const bound = coin();
        if (bound)
            s.diffuseTexture.texture = &diffuse;
        s.maskingTexture.texture = &mask;
        s.transmission(&host, state);
        for (int c = 0; c < 3; ++c) {
            double t = axis(s.transparencyColor, c);
            if (s.transparencyFromDiffuse)
                t = s.diffuseMode == 0 ? axis(s.diffuseColor, c) : bound ? d(diffuseTexel.w) : 0;
            if (s.transparencyInvert)
                t = 1 - t;
            double m = 0;
            if (s.maskingMode == 0)
                m = axis(s.maskingColor, c); // a colour is not inverted
            if (s.maskingMode == 1) {
                m = s.maskingFromAlpha ? d(maskTexel.w) : axis(rgb(maskTexel), c);
                m = s.maskingInvertTexture ? 1 - m : m;
            }
            ASSERT_NEAR(axis(state.transmissionColor, c), 1 - (1 - t) * (1 - m), 1e-6);
        }
    }
}

TEST(MarlowLegacy, PaneAbsorbsAlongTheWayInsideAndBodyBends)
{
    test::Random random;
    for (int i = 0; i < 300; ++i) {
        Legacy l;
        MarlowLegacy& s = l.shader;
        l.state = hitAt(random, 0.1f);
        float const cosine = -l.state.I.z;
        s.transparencyMode = 0;
        s.transparencyColor = {1, 0.5f, 1};
        s.refractiveIndex = random.in(1.1f, 2.5f);
        s.simulatedThickness = random.in(0.1f, 2);
        s.absorbanceRGB = {0, random.in(0, 2), random.in(0, 2)};
        s.diffuseColor = {0, 0, 0};
        l.whiteRoom();
        double const sine = std::sqrt(1 - d(cosine) * d(cosine)) / d(s.refractiveIndex);
        double const way = d(s.simulatedThickness) / std::sqrt(1 - sine * sine);
        Vec3f const want(1, 0.5f * float(std::exp(-way * axis(s.absorbanceRGB, 1))),
                         float(std::exp(-way * axis(s.absorbanceRGB, 2))));
        expectColor(l.shade(), want, 1, "pane");
        EXPECT_EQ(l.host.calls.back().vectors[1], l.state.I) << "a pane does not bend";
        s.transmission(&l.host, l.state);
        expectColor(withAlpha(l.state.transmissionColor, 1), want, 1, "pane's shadow");
        s.absorbanceRGB = {-1, -0.5f, -1};
        float const more = float(std::exp(0.5 * way)) * 0.5f;
        expectColor(l.shade(), {0, more, 0}, 1, "-1 is the mark of one never set");

        s.simulatedThickness = i % 2 ? 0.0f : -1.0f;
        bool const inside = i % 4 < 2;
        s.reverseNormal = i % 3 == 0;
        if (inside != s.reverseNormal)
            l.state.Ng = -l.state.Ng;
        if (inside)
            l.state.beyondIor = 1.2f;
        else
            l.state.incomingIor = 1.2f;
        expectColor(l.shade(), {1, 0.5f, 1}, 1, "no pane, no absorption");
        Vec3f const T = normalize(l.host.calls.back().vectors[1]);
        double const n = 1.2 / d(s.refractiveIndex),
                     outer = std::hypot(d(l.state.I.x), d(l.state.I.y));
        double const inner = std::hypot(d(T.x), d(T.y));
        double const bent = inside ? outer / n : outer * n;
        if (bent < 0.999) {
            EXPECT_NEAR(inner, bent, 2e-5);
            EXPECT_LT(T.z, 0);
        } else if (bent > 1.001) {
            EXPECT_GT(T.z, 0) << "total reflection";
        }
    }
}

/// Nothing gains or loses light: the shares of white layers add up to 1 on every channel.
TEST(MarlowLegacy, WhiteSurfaceVanishesInAWhiteRoom)
{
    test::Random random;
    for (int i = 0; i < 2000; ++i) {
        Legacy l;
        l.whiteRoom();
        scatter(l.shader, random);
        l.shader.diffuseColor = {1, 1, 1};
        l.shader.faceForward = i % 2;
        l.shader.refractiveIndex = i % 3 ? 1.0f : 1.3f;
        l.state = test::randomHit(random, i % 4 < 2);
        expectColor(l.shade(), {1, 1, 1}, 1, "furnace", 4e-6f);
    }
}

/// A light alone: `shade` is what a path tracer gets from `transfer`.
TEST(MarlowLegacy, LightsShadeAsTransferSays)
{
    test::Random random;
    int lit = 0;
    for (int i = 0; i < 2000; ++i) {
        Legacy l;
        scatter(l.shader, random);
        l.shader.reverseNormal = i % 2;
        l.shader.faceForward = i % 4 < 2;
        l.shader.faceLight = i % 8 < 4;
        l.state = test::randomHit(random, i % 5 != 0);
        Vec3f const L = random.unit(), color = random.color();
        l.state.sampleDirection = L;
        l.shader.transfer(&l.host, l.state);
        Vec3f const want = l.state.outBrdf * color * (l.state.sampleCosine * 3.14159265f);
        l.host.addLight(L, color, {1, 1, 1}, l.state.sampleCosine);
        if (want == Vec3f(0, 0, 0)) // a host does not list lights behind the normal
            continue;
        Vec3f const got = rgb(l.shade());
        ++lit;
        for (int c = 0; c < 3; ++c)
            ASSERT_NEAR(axis(got, c), axis(want, c), 1e-4 * axis(want, c) + 1e-6);
    }
    EXPECT_GT(lit, 1000);
}

TEST(MarlowLegacy, ReceivesLightsAndTheirTintedShadow)
{
    struct Case {
        char const* why;
        Vec3f shadow, tint;
        float intensity, gain;
        Vec3f want;
    };
    constexpr Case kCases[] = {
        {"open", {1, 1, 1}, {0, 0, 0}, 1, 1, {2, 1, 4}},
        {"shadow as it is", {0.5f, 0, 1}, {0, 0, 0}, 1, 1, {1, 0, 4}},
        {"half as strong", {0, 0, 0}, {0, 0, 0}, 0.5f, 1, {1, 0.5f, 2}},
        {"tinted", {0, 0.5f, 0}, {0, 0, 0.5f}, 1, 1, {0, 0.5f, 2}},
        {"gain", {1, 1, 1}, {0, 0, 0}, 1, 3, {6, 3, 12}},
    };
    for (Case const& c : kCases)
        for (bool reversed : {false, true}) {
            Legacy l;
            l.host.addLight({0, 0.6f, 0.8f}, {4, 2, 8}, c.shadow, 0.5f);
            l.shader.shadowColor = c.tint;
            l.shader.shadowIntensity = c.intensity;
            l.shader.diffuseLightGainValue = c.gain;
            l.shader.faceLight = true; // which makes both sides one
            l.shader.reverseNormal = reversed;
            expectColor(l.shade(), c.want, 1, c.why);
            EXPECT_EQ(l.host.calls[0].scalars[0], -1024.0f);
            EXPECT_EQ(l.host.count("getLightSamples"), 2);
            l.shader.faceLight = false;
            l.shade();
            EXPECT_EQ(l.host.calls[0].vectors[1], Vec3f(0, 0, reversed ? -1.0f : 1.0f));
        }
}

TEST(MarlowLegacy, OutputSwitches)
{
    Legacy l;
    MarlowLegacy& s = l.shader;
    s.diffuseColor = {0.5f, 0.25f, 2};
    l.host.addLight({0, 0, 1}, {2, 2, 2});
    expectColor(l.shade(), {1, 0.5f, 4}, 1, "lit");
    s.usingHDRbuffer = false;
    expectColor(l.shade(), {1, 0.5f, 1}, 1, "clamped");
    s.usingHDRbuffer = true;
    s.selfIlluminance = true;
    expectColor(l.shade(), {1.5f, 0.75f, 6}, 1, "shines");
    s.unlitSurface = true;
    expectColor(l.shade(), {0.5f, 0.25f, 2}, 1, "unlit");
    EXPECT_TRUE(l.host.calls.empty());

    l.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 1, 1, 0.5f); };
    s.maskingColor = {0.5f, 0.5f, 0.5f};
    s.transparencyMode = 0;
    s.transparencyColor = {0.5f, 0.5f, 0.5f};
    // A quarter is left of the surface; half of what is behind is nothing.
    expectColor(l.shade(), {0.875f, 0.8125f, 1.25f}, 0.625f, "cut and clear");
    EXPECT_EQ(l.host.count("traceThrough"), 1);
    s.useAlpha = false;
    EXPECT_EQ(l.shade().w, 1);
    s.maskingColor = {1, 1, 1};
    expectColor(l.shade(), {7, 7, 7}, 7, "cut out");
    EXPECT_EQ(l.state.discardHit, 1);
}

TEST(MarlowLegacy, ShowsNormalsAndOcclusionAsTheUtilityMaterialsDo)
{
    test::Random random;
    for (int i = 0; i < 400; ++i) {
        Legacy l;
        l.state = test::randomHit(random, i % 2);
        ShadeState other = l.state;
        l.shader.reverseNormal = i % 4 < 2;
        l.shader.faceForward = i % 8 < 4;
        l.shader.faceLight = i % 16 < 8;
        l.shader.showNormalsOnly = true;
        corvid_Mtl_NormalsOnly normals;
        normals.reverseNormal = l.shader.reverseNormal;
        normals.faceForward = l.shader.faceForward;
        normals.faceLight = l.shader.faceLight;
        normals.shade(&l.host, other);
        expectColor(l.shade(), rgb(other.Ci), other.Ci.w, "normals", 0);

        l.shader.showNormalsOnly = false;
        corvid_Mtl_AmbientOnly ambient;
        ambient.showAmbientOnly = l.shader.showAmbientOnly = true;
        ambient.usingRaytracedAO = l.shader.usingRaytracedAO = i % 32 < 16;
        ambient.ambientOcclusionMode = l.shader.ambientOcclusionMode = i % 3 == 0 ? 2 : 0;
        ambient.ambientOcclusionColor = l.shader.ambientOcclusionColor = random.color();
        Vec4f const vertex = withAlpha(random.color(), 1);
        test::setAttribute(l.state, 40, vertex); // where each class has its vertex colour
        test::setAttribute(other, 8, vertex);
        l.host.onOcclusion = [](Vec3f, Vec3f n) { return Vec3f(0.5f, 0.6f, 0.7f) + n * 0.1f; };
        ambient.shade(&l.host, other);
        expectColor(l.shade(), rgb(other.Ci), other.Ci.w, "occlusion", 0);
    }
}

TEST(MarlowLegacy, CubesReplaceOrAddAndAreGradedFromTheGeneralToTheParticular)
{
    Cube cube([](Vec3f v) { return Vec4f(0.2f + 0.1f * v.x, 0.5f, 0.3f - 0.1f * v.y, 1); });
    for (int mode : {-1, 0, 1}) {
        Legacy l;
        MarlowLegacy& s = l.shader;
        l.host.onIndirect = l.host.onTrace = [](Vec3f, Vec3f) { return Vec3f(0.25f, 0, 0); };
        s.globalIllumIntensity = 2;
        s.IBLDiffMode = s.IBLSpecMode = mode;
        s.diffuseIBLCube.texture = s.specularIBLCube.texture = &cube;
        // Neutral at the defaults: +z looks up (0, 1, 0).
        Vec3f const hosts = mode == 0 ? Vec3f(0, 0, 0) : Vec3f(0.5f, 0, 0);
        Vec3f const cubes = mode < 0 ? Vec3f(0, 0, 0) : Vec3f(0.2f, 0.5f, 0.2f);
        expectColor(l.shade(), hosts + cubes, 1, "diffuse");
        s.specularColor = {1, 1, 1};
        s.specularREG = {0, 0.3f, 1}; // a mirror but for its width
        expectColor(l.shade(), hosts * 0.5f + cubes, 1, "highlight");
        s.specularColor = {0, 0, 0};
        s.reflectivityColor = {1, 1, 1};
        s.useReflectionCubeIBL = mode >= 0;
        s.reflectionCubeIBL.texture = &cube;
        expectColor(l.shade(), mode < 0 ? Vec3f(0.25f, 0, 0) : cubes, 1, "reflection");
    }
    Legacy l;
    MarlowLegacy& s = l.shader;
    s.IBLDiffMode = 0;
    s.diffuseIBLCube.texture = &cube;
    s.globalIBLGainValue = 2; // 0.4, 1, 0.4
    s.diffuseIBLChannelContrastPivot = {0.2f, 0.2f, 0.2f};
    s.diffuseIBLChannelContrastValue = 2; // 0.6, 1.8, 0.6
    s.diffuseIBLGainColor = {1, 0.5f, 0};
    s.diffuseIBLGainSource = 1;
    expectColor(l.shade(), {0.6f, 0.9f, 0}, 1, "one after the other");
}

/// Sampled directions follow the density that they report, carry the value of `transfer`, and all
/// that is not scattered carries its share: the mean weight is the light that the surface keeps.
TEST(MarlowLegacy, SamplesAgreeWithTransferAndDensity)
{
    test::Random random;
    for (int i = 0; i < 8; ++i) {
        Legacy l;
        MarlowLegacy& s = l.shader;
        scatter(s, random);
        s.maskingColor = s.maskingColor * 0.2f;
        s.transparencyColor = s.transparencyColor * 0.4f;
        s.reflectLight = i % 2;
        s.refractiveIndex = i % 4 < 2 ? 1.0f : 1.4f;
        l.state = hitAt(random, 0.2f);
        bool const reflects = i != 7, transmits = i != 6;
        std::fill_n(l.state.allowReflection, 3, reflects);
        std::fill_n(l.state.allowTransmission, 3, transmits);
        // The frame is about z, so that the local direction is the world's up to a turn.
        test::Vec3d const v{-d(l.state.I.x), -d(l.state.I.y), -d(l.state.I.z)};
        test::DensityCheck check{{0.4, 0.4, v}};
        constexpr int kDraws = 60000;
        double mean = 0, squares = 0;
        ShadeState other = l.state;
        for (int k = 0; k < kDraws; ++k) {
            l.host.randoms = {random.in(0, 0.9999f), random.in(0, 0.9999f), random.in(0, 0.9999f)};
            l.host.randomCalls = 0;
            s.sample(&l.host, l.state);
            ShadeState const& r = l.state;
            double const weight =
                r.sampleType ? d(r.outBrdf.y) * d(r.sampleCosine) * d(r.sampleInvPdf) : 0;
            mean += weight / kDraws;
            squares += weight * weight / kDraws;
            if (r.sampleType != kSampleMixture) {
                check.reject();
                continue;
            }
            check.accept({d(r.sampleDirection.x), d(r.sampleDirection.y), d(r.sampleDirection.z)},
                         d(r.sampleInvPdf));
            other.sampleDirection = r.sampleDirection;
            s.transfer(&l.host, other);
            ASSERT_NEAR(r.outBrdf.y, other.outBrdf.y, 1e-4f * other.outBrdf.y);
            ASSERT_NEAR(r.sampleCosine, other.sampleCosine, 1e-6f);
        }
        int cells = 0;
        if (reflects) {
            double const deviation = check.deviation(cells);
            EXPECT_GT(cells, 10);
            EXPECT_LT(deviation, cells + 5 * std::sqrt(2.0 * cells)) << i;
        }
        // The sum by integration, and by a room of light without a mixture.
        double want = reflects ? test::hemisphere(check.map, 200,
                                                  [&](test::Vec3d dir) {
                                                      other.sampleDirection = test::toFloat(dir);
                                                      s.transfer(&l.host, other);
                                                      return d(other.outBrdf.y);
                                                  })
                               : 0;
        Legacy rest;
        rest.shader = s;
        rest.state = l.state;
        rest.shader.diffuseColor = {0, 0, 0};
        rest.shader.specularColor = rest.shader.specular2Color = {0, 0, 0};
        if (transmits) {
            rest.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 1, 1, 1); };
            rest.host.onTrace = [](Vec3f, Vec3f dir) { return grey(dir.z < 0 ? 1.0f : 0.0f); };
        }
        want += d(rest.shade().y);
        if (reflects && !s.reflectLight) {
            rest.host.onThrough = nullptr;
            rest.host.onTrace = [](Vec3f, Vec3f dir) { return grey(dir.z > 0 ? 1.0f : 0.0f); };
            want += d(rest.shade().y);
        }
        EXPECT_NEAR(mean, want, 5 * std::sqrt((squares - mean * mean) / kDraws) + 1e-3) << i;
        EXPECT_LT(want, 1.001) << i;
    }
}

TEST(MarlowLegacy, ResultsAreFiniteWhateverComes)
{
    auto const finite = [](Vec3f v) {
        return std::isfinite(v.x) && std::isfinite(v.y) && std::isfinite(v.z);
    };
    for (unsigned seed = 0; seed < 3000; ++seed) {
        MarlowLegacy shader;
        test::RecordingManager const registered(shader);
        test::Supply supply(seed, true);
        test::fillParameters(registered, supply, true);
        ShadeState s = test::fillRecord(supply);
        test::SteadyHost host(seed, true);
        s.sampleInvPdf = s.sampleCosine = 1;
        shader.transfer(&host, s);
        ASSERT_TRUE(finite(s.outBrdf) && std::isfinite(s.sampleCosine)) << seed;
        shader.sample(&host, s);
        if (s.sampleType != kSampleNone) {
            ASSERT_TRUE(finite(s.outBrdf) && finite(s.sampleDirection)) << seed;
            ASSERT_TRUE(std::isfinite(s.sampleCosine) && s.sampleInvPdf > 0) << seed;
        }
        shader.transmission(&host, s);
        ASSERT_TRUE(finite(s.transmissionColor)) << seed;
        s.discardHit = 0;
        s.Ci = {0, 0, 0, 0};
        shader.shade(&host, s);
        ASSERT_TRUE(finite(rgb(s.Ci)) && std::isfinite(s.Ci.w)) << seed;
    }
}

} // namespace
} // namespace zsi
