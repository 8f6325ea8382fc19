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

/// Red of the transmission; the diffuse map has alpha 1/4 and colour 0.1, the mask map 0.5 and
/// alpha 0.75.
TEST(MarlowLegacy, ShadowRaysKeepWhatMaskAndTransparencyLeave)
{
    struct Case {
        char const* why;
        bool fromDiffuse, invert;
        int diffuseMode, maskingMode;
        bool fromAlpha, invertMask;
        float want;
    };
    constexpr Case kCases[] = {
        {"as made, 80 % clear", false, false, 0, -1, false, false, 0.8f},
        {"inverted", false, true, 0, -1, false, false, 0.2f},
        {"colour of the diffuse", true, false, 0, -1, false, false, 0.3f},
        {"alpha of its map", true, false, 1, -1, false, false, 0.25f},
        {"that inverted", true, true, 1, -1, false, false, 0.75f},
        {"mask: 1 - 0.2 * 0.4", false, false, 0, 0, false, false, 0.92f},
        {"a plain mask is not inverted", false, false, 0, 0, false, true, 0.92f},
        {"mask map: 1 - 0.2 * 0.5", false, false, 0, 1, false, false, 0.9f},
        {"inverted alpha: 1 - 0.2 * 0.75", false, false, 0, 1, true, true, 0.85f},
        {"both: 1 - 0.25 * 0.25", true, true, 1, 1, true, false, 0.9375f},
    };
    Picture diffuse([](Vec2f) { return Vec4f(0.1f, 0.1f, 0.1f, 0.25f); });
    Picture mask([](Vec2f) { return Vec4f(0.5f, 0.5f, 0.5f, 0.75f); });
    for (Case const& c : kCases)
        for (bool reversed : {false, true}) {
            MarlowLegacy s; // as made: highlights and reflection count nothing here
            test::ScriptedHost host;
            ShadeState state = test::plainHit();
            s.diffuseColor = {0.3f, 0, 0};
            s.maskingColor = {0.6f, 0, 0};
            s.transparencyFromDiffuse = c.fromDiffuse;
            s.transparencyInvert = c.invert;
            s.transparencyBlocksHighlights = s.reverseNormal = reversed;
            s.diffuseMode = c.diffuseMode;
            s.diffuseTexture.texture = &diffuse;
            s.maskingMode = c.maskingMode;
            s.maskingTexture.texture = &mask;
            s.maskingFromAlpha = c.fromAlpha;
            s.maskingInvertTexture = c.invertMask;
            s.transmission(&host, state);
            EXPECT_NEAR(state.transmissionColor.x, c.want, 1e-6) << c.why;
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

/// A white lobe of any width sends out all light: to paths and lights by its integral, to traced
/// rays ray by ray, and mirrored rays that no light reaches weigh the same. All are spread alike.
TEST(MarlowLegacy, OneEnergyAndOneShapeForOneLobe)
{
    test::Random random;
    for (float const width : {0.03f, 0.4f, 1.0f})
        for (float const cosine : {1.0f, 0.5f, 0.1f})
            for (int kind : {0, 1, 2}) { // a highlight; a reflection with and without lights
                Legacy l;
                MarlowLegacy& s = l.shader;
                s.specularREG = {0, width, 1};
                s.surfaceRoughness = width;
                (kind ? s.reflectivityColor : s.specularColor) = {1, 1, 1};
                s.reflectLight = kind == 1;
                float const sine = std::sqrt(1 - cosine * cosine);
                l.state.I = {sine, 0, -cosine};
                std::fill_n(l.state.allowReflection, 3, std::uint8_t(1));
                auto const map = test::MirrorMap{d(width), d(width), {-d(sine), 0, d(cosine)}};
                auto const transfer = [&](test::Vec3d dir) {
                    l.state.sampleDirection = test::toFloat(dir);
                    s.transfer(&l.host, l.state);
                    return d(l.state.outBrdf.x);
                };
                l.host.onTrace = [&](Vec3f, Vec3f dir) {
                    return grey(dir.z); // brighter upwards
                };
                constexpr int kDraws = 1500;
                double traced = 0, sampled = 0;
                for (int i = 0; i < kDraws; ++i) {
                    for (float& x : l.host.randoms = std::vector<float>(48))
                        x = random.in(0, 0.9999f);
                    l.host.randomCalls = 0;
                    traced += d(l.shade().x) / kDraws;
                    s.sample(&l.host, l.state);
                    if (kind == 2) {
                        EXPECT_EQ(l.state.sampleType, kSampleStraight);
                        EXPECT_EQ(l.state.outBrdf.x, 1.0f);
                        sampled += d(l.state.sampleDirection.z) / kDraws;
                    }
                }
                // Four standard errors; the cosine of a lobe deviates by 0.3 at most.
                constexpr double kNoise = 4 * 0.3 / 38;
                if (kind < 2) {
                    // What albedoTables.h interpolates is within 1.2 %.
                    EXPECT_NEAR(test::hemisphere(map, 100, transfer), 1, 0.013) << width << cosine;
                    EXPECT_NEAR(
                        test::hemisphere(map, 300,
                                         [&](test::Vec3d dir) { return dir.z * transfer(dir); }),
                        traced, kNoise + 0.013)
                        << width << ' ' << cosine;
                } else {
                    EXPECT_EQ(transfer({-d(l.state.I.x), 0, d(cosine)}), 0) << "no light";
                    EXPECT_NEAR(sampled, traced, 1.5 * kNoise) << width << ' ' << cosine;
                }
                l.whiteRoom();
                expectColor(l.shade(), {1, 1, 1}, 1, "white room", 1e-6f);
            }
}

/// The true surface leans 40 degrees to the bent one: nothing below either is lit or proposed.
TEST(MarlowLegacy, NothingIsLitBelowTheTrueSurface)
{
    test::Random random;
    Legacy l;
    MarlowLegacy& s = l.shader;
    s.specularColor = {0.5f, 0.5f, 0.5f};
    s.specularREG = {0, 0.5f, 1};
    s.reflectivityColor = {0.3f, 0.3f, 0.3f};
    s.surfaceRoughness = 0.5f;
    std::fill_n(l.state.allowReflection, 3, std::uint8_t(1));
    int below = 0, accepted = 0;
    for (int i = 0; i < 4000; ++i) {
        s.faceLight = i % 2;
        s.reflectLight = i % 4 < 2;
        bool const back = i % 8 < 4;
        l.state.I = normalize(Vec3f(-0.6f, 0, back ? 1.0f : -1.0f));
        l.state.Ng = {0.6427876f, 0, 0.7660444f};
        for (float& x : l.host.randoms = std::vector<float>(64))
            x = random.in(0, 0.9999f);
        s.sample(&l.host, l.state);
        if (l.state.sampleType == kSampleMixture) {
            Vec3f const dir = l.state.sampleDirection;
            EXPECT_GE(dir.z * dot(dir, l.state.Ng), 0.0f);
            ++accepted;
        } else if (l.state.sampleType == kSampleStraight) {
            EXPECT_GE(dot(l.state.sampleDirection, l.state.Ng) * (back ? -1.0f : 1.0f), 0.0f);
        }
        Vec3f const L = l.state.sampleDirection = random.unit();
        s.transfer(&l.host, l.state);
        if (L.z * dot(L, l.state.Ng) < 0) {
            ++below;
            EXPECT_EQ(l.state.outBrdf, kBlack);
            l.host.lights.clear();
            l.host.addLight(L, {1, 1, 1});
            expectColor(l.shade(), {0, 0, 0}, 1, "light below");
        }
    }
    EXPECT_GT(accepted, 1000);
    EXPECT_GT(below, 500);
}

TEST(MarlowLegacy, RaysThatGatherLightSeeWideHighlightsAndMattMirrors)
{
    Legacy l;
    MarlowLegacy& s = l.shader;
    s.diffuseColor = {0, 0, 0};
    s.specularColor = {0.5f, 0.5f, 0.5f};
    s.specularREG = {0, 0.02f, 1};
    s.reflectivityColor = {0.25f, 0.25f, 0.25f};
    l.host.onIndirect = [](Vec3f, Vec3f) { return Vec3f(4, 4, 4); };
    l.host.addLight({0, 0.1f, 0.995f}, {1, 1, 1});
    l.state.rayType = kRayDiffuse;
    float const narrow = l.shade().x;
    EXPECT_EQ(l.host.count("traceSpecular"), 0);
    s.specularREG.y = 0.3f;
    EXPECT_EQ(l.shade().x, narrow);
    s.specularREG.y = 0.4f;
    EXPECT_NE(l.shade().x, narrow);
    l.host.lights.clear();
    EXPECT_NEAR(l.shade().x, 4 * 0.75f, 1e-6f);
}

TEST(MarlowLegacy, BumpLeansByItsDepth)
{
    Picture bump([](Vec2f) { return Vec4f(1, 0.5f, 1, 1); }); // 45 degrees towards rising u
    Legacy l;
    l.shader.bumpMode = 1;
    l.shader.bumpTexture.texture = &bump;
    l.shader.bumpUVMatrix = Mat3f::identity();
    test::setAttribute(l.state, 16, Vec3f(1, 0, 0));
    test::setAttribute(l.state, 28, Vec3f(0, 1, 0));
    for (float const depth : {1.0f, 2.0f, -0.5f, 0.0f})
        for (bool reversed : {false, true}) {
            l.shader.bumpDepth = depth;
            l.shader.reverseNormal = reversed;
            l.shade();
            Vec3f const want = normalize(Vec3f(depth, 0, reversed ? -1.0f : 1.0f));
            EXPECT_LT(length(l.host.calls[0].vectors[1] - want), 1e-6f) << depth;
        }
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
