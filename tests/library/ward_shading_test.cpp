// What the Ward material asks of its host, and its bent frames.
#include "support/networkOracle.h"
#include "support/wardSetup.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

/// Seen along x at 53 degrees of height; behind: from the far side.
ShadeState slantedHit(bool behind)
{
    ShadeState s = test::plainWardHit();
    s.I = {0.6f, 0, behind ? 0.8f : -0.8f};
    s.incomingIor = 1.1f;
    s.beyondIor = 1.2f;
    return s;
}

TEST(WardShading, AsksTheHostInOrderAndTellsTheWeights)
{
    corvid_Mtl_Ward m;
    test::plainWard(m);
    m.u_transparency = m.usingRaytracedAO = true;
    m.usePrecalcAO = false;
    m.u_transparencyValue = 0.5f;
    m.u_translucencyValue = 0.25f;
    m.u_reflectGlossyValue = 0.3f;
    m.u_refractGlossyValue = 0.2f;
    m.maskingColor = {0.5f, 0, 0};
    test::FunctionTexture<Vec2f> half([](Vec2f) { return Vec4f(0.5f, 0, 0, 1); });
    m.u_cutoutMapEnable = true;
    m.u_cutoutMap.texture = &half;

    struct Asked {
        char const* service;
        float normalZ; ///< z of the second vector
        std::vector<float> scalars; ///< category or spread, then importance
    };
    // Diffuse (0.6, 0.5, 0.4) loses half to the reflectivity of 0.5 and half of the rest to the
    // transparency; its filter is (0.8, 0.75, 0.7). Ambient and indirect light are 1 each.
    std::vector<Asked> const front{{"traceThrough", -0.8f, {0.5f}},
                                   {"getLightSamples", 1, {0}},
                                   {"traceSpecular", 0.8f, {0.3f, 0.45f}},
                                   {"traceRefraction", -0.86818f, {0.2f, 0.2f}},
                                   {"ambientLight", 1, {}},
                                   {"indirectDiffuse", 1, {0.15f}},
                                   {"occlusion", 1, {0.3f}},
                                   {"occlusion", 1, {1}},
                                   {"traceThrough", -0.8f, {1}}};
    // Behind, 0.6 * 0.25 * 0.5 * 0.8 of the light comes through diffused, 0.8 * 0.75 * 0.5
    // straight.
    std::vector<Asked> const behind{
        {"traceThrough", 0.8f, {0.5f}},  {"getLightSamples", -1, {0}},
        {"getLightSamples", 1, {0}},     {"traceRefraction", 0.74684f, {0.2f, 0.3f}},
        {"ambientLight", -1, {}},        {"indirectDiffuse", -1, {0.15f}},
        {"occlusion", -1, {0.3f}},       {"ambientLight", 1, {}},
        {"indirectDiffuse", 1, {0.06f}}, {"occlusion", 1, {0.12f}},
        {"occlusion", -1, {1}},          {"traceThrough", 0.8f, {1}}};
    for (bool const far : {false, true}) {
        test::ScriptedHost host;
        host.onAmbient = host.onIndirect = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
        ShadeState s = slantedHit(far);
        m.shade(&host, s);
        auto const& want = far ? behind : front;
        ASSERT_EQ(host.calls.size(), want.size()) << far;
        for (std::size_t i = 0; i < want.size(); ++i) {
            test::Call const& got = host.calls[i];
            SCOPED_TRACE(std::to_string(i) + " " + want[i].service + (far ? " behind" : ""));
            EXPECT_EQ(got.service, want[i].service);
            EXPECT_NEAR(got.vectors.at(1).z, want[i].normalZ, 1e-4f);
            ASSERT_EQ(got.scalars.size(), want[i].scalars.size());
            for (std::size_t k = 0; k < got.scalars.size(); ++k)
                EXPECT_NEAR(got.scalars[k], want[i].scalars[k], 1e-5f);
        }
    }
}

TEST(WardShading, OcclusionOfACutOutSurfaceIsThatOfItsOpacity)
{
    // White, without lobe, lit head-on by a light of colour 1; the baked occlusion is full.
    corvid_Mtl_Ward m;
    test::plainWard(m);
    m.u_diffuseColor = {1, 1, 1};
    m.u_reflectivity = 0;
    m.u_cutoutMapEnable = true;
    m.u_cutoutAmount = 0.5f;
    test::FunctionTexture<Vec2f> white([](Vec2f) { return Vec4f(1, 1, 1, 1); });
    m.u_cutoutMap.texture = &white;
    test::ScriptedHost host;
    host.addLight({0, 0, 1}, {1, 1, 1});
    auto const shown = [&] {
        ShadeState s = test::plainWardHit();
        m.shade(&host, s);
        return s.Ci.x;
    };
    EXPECT_EQ(shown(), 0.5f) << "half a surface";
    m.ambientOcclusionMode = 1; // no texture: 0
    EXPECT_EQ(shown(), 0.0f) << "occluded in full, whatever the cut-out";
    m.u_transparency = true;
    m.u_transparencyValue = 0.75f;
    EXPECT_EQ(shown(), 0.5f * 0.25f * 0.75f) << "a quarter of the diffuse light, a quarter opaque";
}

TEST(WardShading, AdjustedNormalsAreVisibleOnTheArcOfTheirTilt)
{
    ShadeState const s = test::plainHit();
    test::Random random;
    constexpr float kLimit = 1.553343f;
    int turned = 0;
    for (int i = 0; i < 5000; ++i) {
        Vec3f const plain = random.unit();
        Vec3f const bumped = normalize(plain + random.unit() * (i % 2 ? 0.05f : 2.0f));
        Vec3f viewer = random.unit();
        viewer = dot(viewer, plain) < 0 ? -viewer : viewer;
        if (dot(viewer, plain) < 0.02f || dot(bumped, plain) < -0.99f)
            continue;
        Vec3f const got = f_adjustBumpNormal(nullptr, s, viewer * 2, plain, bumped * 3);
        Vec3f const pole = cross(plain, bumped);
        EXPECT_NEAR(length(got), 1, 1e-5f);
        EXPECT_NEAR(dot(got, pole), 0, 1e-5f) << "off the arc";
        EXPECT_GE(dot(cross(plain, got), pole), -1e-6f) << "beyond the plain end of the arc";
        if (dot(viewer, bumped) > std::cos(kLimit) && dot(plain, bumped) > std::cos(kLimit)) {
            EXPECT_NEAR(dot(got, bumped), 1, 1e-5f) << "was visible";
        } else {
            ++turned;
            EXPECT_GE(dot(got, viewer), 0.0f);
            EXPECT_GE(dot(got, plain), std::cos(kLimit) - 1e-5f);
        }
    }
    EXPECT_GT(turned, 1000);
}

/// Normal of a hit at P under a pattern, where the host's noise is what `giveNoise` says.
Vec3f patterned(int kind, float amount, Vec3f P, Vec3f tiling = {1, 1, 1})
{
    corvid_Mtl_Ward m;
    m.u_procedureMapEnable = kind;
    m.u_procedureMapAmount = amount;
    m.u_procedureMapTiling = tiling;
    test::ScriptedHost host;
    test::giveNoise(host);
    ShadeState const s = test::plainWardHit();
    SLArray<Vec3f> frame;
    m.f_computeShadingFrame(&host, s, P, s.N, s.objectToWorld, frame);
    return frame[2];
}

TEST(WardShading, PatternsBendByTheirAmountAtAnyTiling)
{
    test::Random random;
    for (int const kind : {kProcedureNoise, kProcedureBrush, kProcedureSmoke, kProcedureCells}) {
        double slope = 0, tiled = 0;
        for (int i = 0; i < 300; ++i) {
            Vec3f const P = random.color() * 5;
            Vec3f const n = patterned(kind, 1, P), half = patterned(kind, 0.5f, P);
            EXPECT_NEAR(half.x * 2, n.x, 1e-4f) << "an offset of the normal, times the amount";
            EXPECT_EQ(n.z, 1.0f) << "the length is left as it comes out";
            slope += std::hypot(double(n.x), double(n.y)) / 300;
            Vec3f const t = patterned(kind, 1, P, {7, 7, 7});
            tiled += std::hypot(double(t.x), double(t.y)) / 300;
        }
        EXPECT_GT(slope, 0.1) << kind;
        EXPECT_LT(slope, 3) << kind;
        EXPECT_NEAR(tiled / slope, 1, 0.3) << "tiling changes the size, not the depth " << kind;
    }
    for (int const kind : {0, -1, 5})
        EXPECT_TRUE(patterned(kind, 1, {1, 2, 3}) == Vec3f(0, 0, 1)) << kind;
}

} // namespace
} // namespace zsi
