// Metal: energy, reciprocity, sampling, frame, lights and holes.
#include "materials/physical/corvid_Mtl_Metal.h"
#include "support/lobeSampling.h"
#include "support/scriptedHost.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

using test::FunctionTexture;
using test::Vec3d;
constexpr long kTangent = 36, kUv = 48;

Vec3d viewAt(double cosine, double azimuth)
{
    double const s = std::sqrt(1 - cosine * cosine);
    return {s * std::cos(azimuth), s * std::sin(azimuth), cosine};
}
ShadeState hitFrom(Vec3d v)
{
    ShadeState s = test::plainHit();
    s.I = -test::toFloat(v);
    test::setAttribute(s, kTangent, Vec3f(1, 0, 0));
    std::memset(s.allowReflection, 1, sizeof s.allowReflection);
    return s;
}
corvid_Mtl_Metal whiteMetal(float rough, float anisotropy)
{
    corvid_Mtl_Metal m;
    m.u_reflectColor = {1, 1, 1};
    m.u_roughValue = rough;
    m.u_anisotropyValue = anisotropy;
    return m;
}
Vec3f transferTo(corvid_Mtl_Metal const& metal, ShadeState s, Vec3f l)
{
    test::ScriptedHost host;
    s.sampleDirection = l;
    metal.transfer(&host, s);
    return s.outBrdf;
}

struct Lobe {
    float rough, anisotropy;
    double cosine, azimuth;
    double widthY() const
    {
        return std::clamp(double(rough * anisotropy), 0.1 * double(rough), 1.0);
    }
};
std::vector<Lobe> lobes()
{
    std::vector<Lobe> all;
    for (float rough : {0.02f, 0.1f, 0.25f, 0.5f, 0.8f, 1.0f})
        for (float anisotropy : {1.0f, 0.6f, 0.3f, 0.1f})
            for (double cosine : {0.1, 0.3, 0.6, 0.95})
                for (double azimuth : {0.1, 0.8, 1.5})
                    if (anisotropy < 1 || azimuth < 0.2)
                        all.push_back({rough, anisotropy, cosine, azimuth});
    return all;
}
std::string name(Lobe const& l)
{
    return "rough " + std::to_string(l.rough) + " anisotropy " + std::to_string(l.anisotropy)
        + " cosine " + std::to_string(l.cosine) + " azimuth " + std::to_string(l.azimuth);
}

TEST(Metal, WhiteMetalReturnsAllLight)
{
    double least = 1, most = 0;
    for (Lobe const& lobe : lobes()) {
        corvid_Mtl_Metal const metal = whiteMetal(lobe.rough, lobe.anisotropy);
        Vec3d const v = viewAt(lobe.cosine, lobe.azimuth);
        ShadeState const s = hitFrom(v);
        double const albedo =
            test::hemisphere({double(lobe.rough), lobe.widthY(), v}, 96, [&](Vec3d l) {
                return double(transferTo(metal, s, test::toFloat(l)).x);
            });
        // The grid itself is good to 0.1 %.
        EXPECT_LT(albedo, 1.001) << name(lobe);
        EXPECT_GT(albedo, 0.96) << name(lobe);
        least = std::min(least, albedo);
        most = std::max(most, albedo);
    }
    std::printf("white furnace: %.4f to %.4f\n", least, most);
}

TEST(Metal, IsReciprocal)
{
    test::Random random;
    for (int i = 0; i < 2000; ++i) {
        corvid_Mtl_Metal metal = whiteMetal(random.in(0.01f, 1), random.in(0.1f, 3));
        metal.u_reflectColor = random.color();
        metal.u_edgeColor = random.color();
        metal.u_anisoRotationValue = random.in(-3, 3);
        Vec3f const a = random.unit(), b = random.unit();
        Vec3d const v{double(a.x), double(a.y), std::fabs(double(a.z))};
        Vec3d const l{double(b.x), double(b.y), std::fabs(double(b.z))};
        Vec3f const there = transferTo(metal, hitFrom(v), test::toFloat(l));
        Vec3f const back = transferTo(metal, hitFrom(l), test::toFloat(v));
        // Rounding of the half vector, 1e-7, over the least width 0.001, four times.
        EXPECT_NEAR(there.x, back.x, 1e-3f * (there.x + 1e-3f));
        EXPECT_NEAR(there.z, back.z, 1e-3f * (there.z + 1e-3f));
    }
}

TEST(Metal, SamplesFollowTheirDensityAndCarryTheValueOfTransfer)
{
    test::ScriptedHost host;
    test::Random random;
    host.randoms.resize(3);
    for (Lobe const& lobe : {Lobe{0.05f, 1, 0.9, 0}, Lobe{0.3f, 0.3f, 0.4, 1.2}, Lobe{1, 1, 0.7, 0},
                             Lobe{0.8f, 0.1f, 0.2, 0.4}, Lobe{0.002f, 1, 0.5, 2}}) {
        SCOPED_TRACE(name(lobe));
        corvid_Mtl_Metal metal = whiteMetal(lobe.rough, lobe.anisotropy);
        metal.u_reflectColor = {1, 0.6f, 0.1f};
        metal.u_edgeColor = {0.9f, 0.2f, 1};
        Vec3d const v = viewAt(lobe.cosine, lobe.azimuth);
        test::DensityCheck check{{double(lobe.rough), lobe.widthY(), v}};
        double red = 0, redSquares = 0;
        constexpr int kDraws = 60000;
        for (int i = 0; i < kDraws; ++i) {
            ShadeState s = hitFrom(v);
            for (float& u : host.randoms)
                u = random.in(0, 1);
            metal.sample(&host, s);
            if (s.sampleType == kSampleNone) {
                check.reject();
                continue;
            }
            ASSERT_EQ(s.sampleType, 2u);
            Vec3f const d = s.sampleDirection;
            check.accept({double(d.x), double(d.y), double(d.z)}, double(s.sampleInvPdf));
            double const weight = double(s.outBrdf.x) * double(s.sampleCosine * s.sampleInvPdf);
            red += weight;
            redSquares += weight * weight;
            if (i % 16)
                continue;
            ShadeState t = s;
            metal.transfer(&host, t);
            // 1e-7 of rounding over the width, doubled by the square and again by its square.
            float const tolerance = 1e-5f + 1e-6f / lobe.rough;
            EXPECT_NEAR(t.outBrdf.x, s.outBrdf.x, tolerance * s.outBrdf.x);
            EXPECT_NEAR(t.outBrdf.y, s.outBrdf.y, tolerance * s.outBrdf.y);
            EXPECT_NEAR(t.sampleCosine, s.sampleCosine, 1e-5f);
        }
        int cells;
        double const deviation = check.deviation(cells);
        EXPECT_GT(cells, 20);
        EXPECT_LT(deviation, cells + 4 * std::sqrt(2.0 * cells)); // chi-square, 4 deviations
        ShadeState const s = hitFrom(v);
        double const want = test::hemisphere(check.map, 128, [&](Vec3d l) {
            return double(transferTo(metal, s, test::toFloat(l)).x);
        });
        double const mean = red / kDraws;
        double const error = std::sqrt((redSquares / kDraws - mean * mean) / kDraws);
        EXPECT_NEAR(mean, want, 4 * error + 0.003);
    }
}

// Reference of the frame, in double and in the plain order of the statement.
struct Frame {
    Vec3d t, b, n;
};
Vec3d unit(Vec3d a)
{
    double const l = std::sqrt(test::dot(a, a));
    return l > 0 ? Vec3d{a.x / l, a.y / l, a.z / l} : a;
}
Vec3d sum(Vec3d a, double k, Vec3d b) { return {a.x + k * b.x, a.y + k * b.y, a.z + k * b.z}; }
void square(Frame& f)
{
    f.t = unit(sum(f.t, -test::dot(f.t, f.n), f.n));
    f.b = unit({f.n.y * f.t.z - f.n.z * f.t.y, f.n.z * f.t.x - f.n.x * f.t.z,
                f.n.x * f.t.y - f.n.y * f.t.x});
}
double ramp(double x, double y)
{
    x = std::fabs(x - std::floor(x) - 0.5);
    y = std::fabs(y - std::floor(y) - 0.5);
    return std::min(1.0, 2 * std::max(x, y));
}

TEST(Metal, FrameIsBentByThePatternThenTheFacetsThenRotated)
{
    // A smooth height, so that float and double see the same slope.
    FunctionTexture<Vec2f> height([](Vec2f at) {
        float const h = 30 * at.x * at.x + 20 * at.x * at.y;
        return Vec4f(h, 0.5f * h, 0.25f * h, 1);
    });
    test::ScriptedHost host;
    test::Random random;
    for (int i = 0; i < 300; ++i) {
        corvid_Mtl_Metal metal;
        metal.u_patternEnable = i % 2;
        metal.u_bumpSwitcher = i / 2 % 3;
        metal.u_patternMap.texture = &height;
        metal.u_patternAmount = random.in(-0.8f, 0.8f);
        metal.u_patternTransform = {0.5f, 0.2f, 0, -0.3f, 0.4f, 0, 0.7f, 0.6f, 1};
        metal.u_uvScale = random.in(0.5f, 2);
        Vec2f const uv(random.in(0, 3), random.in(0, 3));
        Vec3f const N = random.unit(), tangent = random.unit();
        ShadeState s = test::plainHit();
        test::setAttribute(s, kUv, uv);
        test::setAttribute(s, kTangent, tangent);
        Mat3f const toWorld(0, 1, 0, -1, 0, 0, 0, 0, 1); // x to y, y to -x

        Frame f{{-double(tangent.y), double(tangent.x), double(tangent.z)},
                {},
                {double(N.x), double(N.y), double(N.z)}};
        square(f);
        if (metal.u_patternEnable) {
            double const u = double(0.5f * uv.x - 0.3f * uv.y + 0.7f);
            double const v = double(0.2f * uv.x + 0.4f * uv.y + 0.6f);
            auto const h = [](double x, double y) { return 1.75 * (30 * x * x + 20 * x * y); };
            double const k = double(metal.u_patternAmount) * 3.33;
            f.n = sum(sum(f.n, k * (h(u, v) - h(u + 0.001, v)), f.t),
                      k * (h(u, v) - h(u, v + 0.001)), f.b);
            f.n = unit(f.n);
            square(f);
        }
        double const x = double(uv.x * metal.u_uvScale * 0.5f);
        double const y = double(uv.y * metal.u_uvScale * 0.5f);
        if (metal.u_bumpSwitcher == 1) {
            double const k = 0.5 * double(metal.u_patternAmount) / 0.001;
            double const du = k * (ramp(x + 0.001, y) - ramp(x, y));
            double const dv = k * (ramp(x, y + 0.001) - ramp(x, y));
            f.n = sum(sum(f.n, du, f.t), dv, f.b);
            square(f);
        }
        SLArray<Vec3f> got;
        metal.f_computeShadingFrameNative(&host, s, s.P, N, toWorld, got);
        // Differences over a step of 0.001 lose three digits of the height's rounding.
        float const tolerance = metal.u_bumpSwitcher == 1 ? 4e-3f : 1e-3f;
        Vec3f const want[] = {test::toFloat(f.t), test::toFloat(f.b), test::toFloat(f.n)};
        for (int k = 0; k < 3; ++k)
            ASSERT_LT(length(got[k] - want[k]), tolerance) << i << " entry " << k;
    }

    corvid_Mtl_Metal metal;
    ShadeState const s = test::plainHit();
    FunctionTexture<Vec2f> quarter([](Vec2f) { return Vec4f(1.5707963f, 9, 9, 9); });
    metal.u_anisoRotationMap.texture = &quarter;
    struct Turn {
        char const* why;
        float angle, value;
        bool mapped;
        Vec3f tangent;
    };
    float const c = std::cos(0.3f), sn = std::sin(0.3f);
    for (Turn const& turn : {Turn{"its own angle", 0.3f, 9, false, {c, sn, 0}},
                             {"no angle", 0, 0, false, {1, 0, 0}},
                             {"negative: the value", -2, 0.3f, false, {c, sn, 0}},
                             {"the value's sign counts", 0, -0.3f, false, {c, -sn, 0}},
                             {"the map replaces the value", 0, 9, true, {0, 1, 0}}}) {
        metal.u_anisoRotationValue = turn.value;
        metal.u_anisoRotationMapEnable = turn.mapped;
        SLArray<Vec3f> frame{{{1, 0, 0}, {0, 1, 0}, {0, 0, 1}}};
        metal.f_anisoRotateFrame(&host, s, frame, turn.angle);
        EXPECT_LT(length(frame[0] - turn.tangent), 1e-6f) << turn.why;
        EXPECT_LT(length(frame[1] - Vec3f(-turn.tangent.y, turn.tangent.x, 0)), 1e-6f) << turn.why;
    }
}

TEST(Metal, LightsCountWithTheValueOfTransferAndTheMirrorRayWithTheAlbedo)
{
    test::ScriptedHost host;
    corvid_Mtl_Metal metal = whiteMetal(0.4f, 0.5f);
    metal.u_reflectColor = {0.9f, 0.5f, 0.2f};
    ShadeState s = hitFrom(viewAt(0.7, 0.5));
    // 0.125 above the horizon: (0.075 / 0.2)^2 (3 - 2 x 0.075 / 0.2) of the light.
    Vec3f const L =
        normalize({-0.99f, 0.1f, 0.0f}) * std::sqrt(1 - 0.015625f) + Vec3f(0, 0, 0.125f);
    for (float side : {1.0f, -1.0f}) { // metal has two equal faces
        s.N = s.Ng = {0, 0, side};
        host.lights.clear();
        metal.shade(&host, s);
        EXPECT_EQ(maxComponent(rgb(s.Ci)), 0.0f);
        host.addLight(L, {2, 3, 4}, {1, 0.5f, 0.25f}, 0.6f);
        metal.shade(&host, s);
        Vec3f const want = transferTo(metal, s, L) * Vec3f(2, 1.5f, 1) * (0.6f * 0.31640625f);
        EXPECT_LT(length(rgb(s.Ci) - want), 1e-4f * length(want));
        EXPECT_GT(s.Ci.x, 0.0f);
    }
    host.lights.clear();
    host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
    host.calls.clear();
    corvid_Mtl_Metal const white = whiteMetal(0.4f, 0.25f);
    white.shade(&host, s);
    EXPECT_NEAR(s.Ci.y, 1.0f, 1e-5f); // all light comes back
    ASSERT_EQ(host.count("traceSpecular"), 1);
    test::Call const& ray = host.calls.back();
    EXPECT_LT(length(ray.vectors[1] - Vec3f(s.I.x, s.I.y, -s.I.z)), 1e-6f);
    EXPECT_NEAR(ray.scalars[0], 0.2f, 1e-6f); // spread: mean of 0.4 and 0.1
    EXPECT_NEAR(ray.scalars[1], 1.0f, 1e-5f);
}

TEST(Metal, ReflectanceGoesFromTheColourThroughTheTintToWhite)
{
    test::ScriptedHost host;
    host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
    corvid_Mtl_Metal metal = whiteMetal(0.001f, 1);
    metal.u_reflectColor = {0.9f, 0.5f, 0.2f};
    metal.u_edgeColor = {1, 0.5f, 0.1f};
    auto const reflectance = [&](double cosine) {
        ShadeState s = hitFrom(viewAt(cosine, 0));
        metal.shade(&host, s);
        return rgb(s.Ci);
    };
    EXPECT_LT(length(reflectance(1) - metal.u_reflectColor), 1e-3f);
    // At the cosine 1/7: r0 + (1 - r0) (6/7)^5, times the tint.
    float const w = 0.46266436f;
    for (float tint : {1.0f, 0.5f, 0.1f}) {
        metal.u_edgeColor = grey(tint);
        Vec3f const want = (metal.u_reflectColor + (grey(1) - metal.u_reflectColor) * w) * tint;
        EXPECT_LT(length(reflectance(1 / 7.0) - want), 2e-3f) << tint;
    }
    EXPECT_GT(minComponent(reflectance(0.004)), 0.9f); // the tint's bump still takes 7 x 0.004
}

TEST(Metal, HolesShowLetThroughAndAreSampledInTheirShare)
{
    FunctionTexture<Vec2f> half([](Vec2f) { return Vec4f(0.5f, 0, 0, 1); });
    test::ScriptedHost host;
    host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
    host.onThrough = [](Vec3f, Vec3f) { return Vec4f(0, 0, 1, 0.5f); };
    corvid_Mtl_Metal metal = whiteMetal(0.3f, 1);
    metal.u_cutoutMapEnable = true;
    metal.u_cutoutMap.texture = &half;
    ShadeState s = hitFrom(viewAt(0.8, 0));
    Vec3f const L(0.6f, 0, 0.8f);
    Vec3f const solid = transferTo(whiteMetal(0.3f, 1), s, L);
    for (float amount : {0.0f, 1.0f, 2.0f, 9.0f}) { // keeps 0, 1/2, 1, 1
        metal.u_cutoutAmount = amount;
        float const keep = std::min(1.0f, 0.5f * amount);
        metal.transmission(&host, s);
        EXPECT_EQ(s.transmissionColor, grey(1 - keep));
        EXPECT_NEAR(transferTo(metal, s, L).x, keep * solid.x, 1e-6f);
        host.calls.clear();
        metal.shade(&host, s);
        EXPECT_NEAR(s.Ci.x, keep, 1e-5f);
        EXPECT_NEAR(s.Ci.z, 1, 1e-5f);
        EXPECT_EQ(host.count("traceThrough"), keep < 1);
        EXPECT_EQ(host.count("traceSpecular"), keep > 0);

        int straight = 0, mirrored = 0;
        for (int i = 0; i < 400; ++i) {
            s.allowTransmission[1] = 1;
            host.randoms = {(static_cast<float>(i) + 0.5f) / 400, 0.5f, 0.3f, 0.4f};
            host.randomCalls = 0;
            metal.sample(&host, s);
            if (s.sampleType == kSampleStraight) {
                EXPECT_EQ(s.sampleDirection, s.I);
                EXPECT_EQ(s.outBrdf, Vec3f(1, 1, 1));
                ++straight;
            } else if (s.sampleType == kSampleMixture) {
                ++mirrored;
            }
            s.allowTransmission[1] = 0;
        }
        EXPECT_NEAR(static_cast<float>(straight) / 400, 1 - keep, 0.003f);
        EXPECT_NEAR(static_cast<float>(mirrored) / 400, keep, 0.003f);
    }
    metal.u_cutoutAmount = 1; // half kept: the density of the reflections halves with them
    host.randoms = {0.1f, 0.5f, 0.3f, 0.4f};
    host.randomCalls = 0;
    s.allowTransmission[0] = 1;
    metal.sample(&host, s);
    float const both = s.sampleInvPdf;
    host.randomCalls = 1;
    s.allowTransmission[0] = 0;
    metal.sample(&host, s);
    EXPECT_NEAR(both, 2 * s.sampleInvPdf, 1e-4f * both);
    std::memset(s.allowReflection, 0, sizeof s.allowReflection);
    metal.sample(&host, s);
    EXPECT_EQ(s.sampleType, 0u);
    s.allowTransmission[2] = 1; // only through: the hole's share is the weight
    metal.sample(&host, s);
    EXPECT_EQ(s.sampleType, 4u);
    EXPECT_EQ(s.outBrdf, grey(0.5f));
    EXPECT_EQ(s.sampleDirection, s.I);
}

TEST(Metal, StaysFiniteAtTheEndsOfEveryRange)
{
    test::ScriptedHost host;
    test::Random random;
    host.randoms.resize(3);
    constexpr float kEnds[] = {-1, 0, 1e-6f, 0.5f, 1, 1e6f};
    for (int i = 0; i < 4000; ++i) {
        auto const end = [&] { return kEnds[static_cast<int>(random.in(0, 5.99f))]; };
        corvid_Mtl_Metal metal;
        metal.u_roughValue = end();
        metal.u_anisotropyValue = end();
        metal.u_reflectColor = {end(), end(), end()};
        metal.u_edgeColor = {end(), end(), end()};
        Vec3f d = random.unit();
        d.z = std::max(std::fabs(d.z), 1e-6f) * (i % 3 ? 1.0f : 1e-5f);
        d = normalize(d);
        ShadeState s = hitFrom({double(d.x), double(d.y), double(d.z)});
        if (i % 5 == 0)
            test::setAttribute(s, kTangent, Vec3f(0, 0, i % 2 ? 1.0f : 0.0f)); // no tangent
        for (float& u : host.randoms)
            u = i % 7 ? random.in(0, 1) : 0;
        s.sampleType = 99;
        metal.sample(&host, s);
        ASSERT_NE(s.sampleType, 99u);
        if (s.sampleType) {
            EXPECT_TRUE(std::isfinite(dot(s.outBrdf, s.sampleDirection) * s.sampleInvPdf)) << i;
            EXPECT_NEAR(length(s.sampleDirection), 1, 1e-4f) << i;
        }
        s.sampleDirection = i % 2 ? Vec3f(-d.x, -d.y, d.z) : random.unit();
        metal.transfer(&host, s);
        EXPECT_TRUE(std::isfinite(s.outBrdf.x + s.outBrdf.y + s.outBrdf.z)) << i;
        EXPECT_GE(minComponent(s.outBrdf), 0.0f) << i;
    }
}

} // namespace
} // namespace zsi
