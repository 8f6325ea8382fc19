// Metal: energy, reciprocity, sampling, frame, lights and holes.
#include "materials/physical/corvid_Mtl_Metal.h"
#include "support/lobeSampling.h"
#include "support/reference.h"
#include "support/scriptedHost.h"

namespace zsi {
namespace {

using test::D3;
using test::FunctionTexture;
constexpr long kTangent = 36, kUv = 48;

D3 viewAt(double cosine, double azimuth)
{
    double const s = std::sqrt(1 - cosine * cosine);
    return {s * std::cos(azimuth), s * std::sin(azimuth), cosine};
}
ShadeState hitFrom(D3 v)
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

/// Reflectance along v under a white sky.
double albedo(corvid_Mtl_Metal const& metal, test::MirrorMap const& map, int grid)
{
    ShadeState const s = hitFrom(map.v);
    return test::hemisphere(map, grid,
                            [&](D3 l) { return double(transferTo(metal, s, test::toFloat(l)).x); });
}
test::MirrorMap mapOf(float rough, float anisotropy, D3 v)
{
    double const r = double(rough);
    return {r, std::clamp(r * double(anisotropy), 0.1 * r, 1.0), v};
}

TEST(Metal, WhiteMetalReturnsAllLight)
{
    for (float rough : {0.02f, 0.1f, 0.25f, 0.5f, 0.8f, 1.0f})
        for (float anisotropy : {1.0f, 0.6f, 0.1f, 10.0f})
            for (double cosine : {0.02, 0.1, 0.3, 0.6, 0.95})
                for (double azimuth : {0.1, 0.8, 1.5}) {
                    if (anisotropy == 1 && azimuth > 0.1)
                        continue;
                    D3 const v = viewAt(cosine, azimuth);
                    double const returned =
                        albedo(whiteMetal(rough, anisotropy), mapOf(rough, anisotropy, v), 96);
                    EXPECT_LT(returned, 1.01) << rough << " " << anisotropy << " " << cosine;
                    EXPECT_GT(returned, 0.96) << rough << " " << anisotropy << " " << cosine;
                }
}

TEST(Metal, IsReciprocal)
{
    test::Random random;
    for (int i = 0; i < 2000; ++i) {
        corvid_Mtl_Metal metal = whiteMetal(random.in(0.01f, 1), random.in(0.1f, 3));
        metal.u_reflectColor = random.color();
        metal.u_edgeColor = random.color();
        metal.u_anisoRotationValue = random.in(-3, 3);
        Vec3f a = random.unit(), b = random.unit();
        a.z = std::fabs(a.z);
        b.z = std::fabs(b.z);
        Vec3f const there = transferTo(metal, hitFrom(a), b),
                    back = transferTo(metal, hitFrom(b), a);
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
    struct Lobe {
        float rough, anisotropy;
        double cosine, azimuth;
    };
    for (Lobe const& lobe : {Lobe{0.05f, 1, 0.9, 0}, Lobe{0.3f, 0.3f, 0.4, 1.2}, Lobe{1, 1, 0.7, 0},
                             Lobe{0.8f, 0.1f, 0.2, 0.4}, Lobe{0.002f, 1, 0.5, 2}}) {
        SCOPED_TRACE(lobe.rough);
        corvid_Mtl_Metal metal = whiteMetal(lobe.rough, lobe.anisotropy);
        metal.u_reflectColor = {1, 0.6f, 0.1f};
        metal.u_edgeColor = {0.9f, 0.2f, 1};
        D3 const v = viewAt(lobe.cosine, lobe.azimuth);
        test::DensityCheck check{mapOf(lobe.rough, lobe.anisotropy, v)};
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
            check.accept(s.sampleDirection, double(s.sampleInvPdf));
            double const weight = double(s.outBrdf.x) * double(s.sampleCosine * s.sampleInvPdf);
            EXPECT_LT(weight, 2.6); // no fireflies
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
        double const mean = red / kDraws;
        double const error = std::sqrt((redSquares / kDraws - mean * mean) / kDraws);
        EXPECT_NEAR(mean, albedo(metal, check.map, 128), 4 * error + 0.003);
    }
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
    Mat4f const toWorld(0, 1, 0, 0, -1, 0, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1); // x to y, y to -x
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
        test::DFrame f(tangent, N, toWorld);
        if (metal.u_patternEnable) {
            double const u = double(0.5f * uv.x - 0.3f * uv.y + 0.7f);
            double const v = double(0.2f * uv.x + 0.4f * uv.y + 0.6f);
            auto const h = [](double x, double y) { return 1.75 * (30 * x * x + 20 * x * y); };
            double const k = double(metal.u_patternAmount) * 3.33;
            f.bend(k * (h(u, v) - h(u + 0.001, v)), k * (h(u, v) - h(u, v + 0.001)), true);
        }
        double const x = double(uv.x * metal.u_uvScale * 0.5f);
        double const y = double(uv.y * metal.u_uvScale * 0.5f);
        if (metal.u_bumpSwitcher == 1) {
            double const k = 0.5 * double(metal.u_patternAmount) / 0.001;
            f.bend(k * (ramp(x + 0.001, y) - ramp(x, y)), k * (ramp(x, y + 0.001) - ramp(x, y)),
                   false);
        }
        SLArray<Vec3f> got;
        metal.f_computeShadingFrameNative(&host, s, s.P, N, Mat3f(toWorld), got);
        // Differences over a step of 0.001 lose three digits of the height's rounding.
        double const tolerance = metal.u_bumpSwitcher == 1 ? 4e-3 : 1e-3;
        ASSERT_TRUE(test::near(got[0], f.t, tolerance)) << i;
        ASSERT_TRUE(test::near(got[1], f.b, tolerance)) << i;
        ASSERT_TRUE(test::near(got[2], f.n, tolerance)) << i;
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
        EXPECT_TRUE(test::near(frame[0], turn.tangent, 1e-6)) << turn.why;
        EXPECT_TRUE(test::near(frame[1], cross({0, 0, 1}, turn.tangent), 1e-6)) << turn.why;
    }
}

TEST(Metal, LightsCountAsTransferTimesPiAboveTheSurface)
{
    test::ScriptedHost host;
    corvid_Mtl_Metal metal = whiteMetal(0.4f, 0.5f);
    metal.u_reflectColor = {0.9f, 0.5f, 0.2f};
    for (float side : {1.0f, -1.0f}) // metal has two equal faces
        for (float height : {0.6f, 0.01f, -0.01f}) {
            ShadeState s = hitFrom(viewAt(0.7, 0.5));
            s.Ng = {0, 0, side};
            s.N = Vec3f(-0.28f, 0, 0.96f) * side; // leans to the light, also when it is below
            Vec3f const L = normalize({-0.99f, 0.1f, 0.0f}) * std::sqrt(1 - height * height)
                + Vec3f(0, 0, height);
            host.lights.clear();
            host.addLight(L, {2, 3, 4}, {1, 0.5f, 0.25f}, 0.6f);
            metal.shade(&host, s);
            Vec3f const value = transferTo(metal, s, L);
            EXPECT_EQ(value.x > 0, height > 0);
            Vec3f const want = value * Vec3f(2, 1.5f, 1) * (0.6f * 3.14159265f);
            EXPECT_TRUE(test::near(rgb(s.Ci), want, 1e-4 * double(length(want)))) << height;
        }
}

/// In a white room `shade`, whose ray is drawn from the lobe, shows what paths show; where normals
/// lean, nothing is sought below the surface.
TEST(Metal, TracesItsLobe)
{
    test::Trial<corvid_Mtl_Metal> t;
    test::Random random;
    t.host.randoms.resize(3);
    t.host.onTrace = [&](Vec3f, Vec3f d) {
        EXPECT_GT(dot(d, t.state.Ng), 0.0f);
        return Vec3f(1, 1, 1);
    };
    auto const shown = [&](auto const& mayBe, int draws) {
        double sum = 0, squares = 0;
        for (int i = 0; i < draws; ++i) {
            for (float& u : t.host.randoms)
                u = random.in(0, 1);
            double const red = double(t.shade().x);
            for (test::Call const& call : t.host.calls)
                EXPECT_TRUE(call.service != "traceSpecular" || call.scalars[0] == 0)
                    << "no spread beside the lobe's own";
            sum += red;
            squares += red * red;
        }
        double const mean = sum / draws;
        mayBe(mean, std::sqrt((squares / draws - mean * mean) / draws));
    };
    for (double cosine : {0.9, 0.25, 0.02})
        for (float anisotropy : {1.0f, 0.2f}) {
            t.shader = whiteMetal(0.5f, anisotropy);
            t.shader.u_reflectColor = {0.2f, 0, 0};
            t.shader.u_edgeColor = {0.1f, 0, 0};
            D3 const v = viewAt(cosine, 0.6);
            t.state = hitFrom(v);
            shown(
                [&](double mean, double error) {
                    EXPECT_NEAR(mean, albedo(t.shader, mapOf(0.5f, anisotropy, v), 128),
                                4 * error + 0.002);
                },
                8000);
        }
    // Bent so far that the plain mirror direction is below the surface.
    t.shader = whiteMetal(0.02f, 1);
    t.state = hitFrom(viewAt(0.4, 0));
    t.state.N = normalize({-0.9f, 0.2f, 0.4f});
    shown([](double mean, double) { EXPECT_GT(mean, 0.7) << "no black rim"; }, 500);
}

TEST(Metal, ReflectanceGoesFromTheColourThroughTheTintToWhite)
{
    test::Trial<corvid_Mtl_Metal> t{whiteMetal(0.001f, 1), {}, {}};
    t.host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
    Vec3f const r0 = t.shader.u_reflectColor = {0.9f, 0.5f, 0.2f};
    t.shader.u_edgeColor = {1, 0.5f, 0.1f};
    auto const reflectance = [&](double cosine) {
        t.state = hitFrom(viewAt(cosine, 0));
        return rgb(t.shade());
    };
    EXPECT_TRUE(test::near(reflectance(1), r0, 1e-3));
    EXPECT_GT(minComponent(reflectance(0.004)), 0.9f); // the tint's bump still takes 7 x 0.004
    // At the cosine 1/7: r0 + (1 - r0) (6/7)^5, times the tint.
    Vec3f const schlick = r0 + (grey(1) - r0) * 0.46266436f;
    for (float tint : {1.0f, 0.5f, 0.1f}) {
        t.shader.u_edgeColor = grey(tint);
        EXPECT_TRUE(test::near(reflectance(1 / 7.0), schlick * tint, 4e-3)) << tint;
    }
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
    whiteMetal(0.3f, 1).shade(&host, s);
    float const ray = s.Ci.x; // always by the same random numbers
    for (float amount : {0.0f, 1.0f, 2.0f, 9.0f}) { // keeps 0, 1/2, 1, 1
        metal.u_cutoutAmount = amount;
        float const keep = std::min(1.0f, 0.5f * amount);
        metal.transmission(&host, s);
        EXPECT_EQ(s.transmissionColor, grey(1 - keep));
        EXPECT_NEAR(transferTo(metal, s, L).x, keep * solid.x, 1e-6f);
        host.calls.clear();
        host.randoms = {0.5f};
        metal.shade(&host, s);
        EXPECT_NEAR(s.Ci.x, keep * ray, 1e-5f);
        EXPECT_NEAR(s.Ci.z, keep * ray + 1 - keep, 1e-5f);
        EXPECT_EQ(host.count("traceThrough"), keep < 1);
        EXPECT_TRUE(keep == 1 || host.calls[0].scalars[0] == 1 - keep) << "importance";
        EXPECT_EQ(host.count("traceSpecular"), keep > 0);

        s.allowTransmission[1] = 1;
        for (float pick : {0.0f, 0.49f, 0.5f, 0.99f}) {
            host.randoms = {pick, 0.5f, 0.3f, 0.4f};
            host.randomCalls = 0;
            metal.sample(&host, s);
            bool const straight = keep < 1 && pick >= keep;
            EXPECT_EQ(s.sampleType, straight ? kSampleStraight : kSampleMixture) << pick;
            EXPECT_TRUE(!straight || (s.sampleDirection == s.I && s.outBrdf == grey(1)));
        }
        s.allowTransmission[1] = 0;
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
    EXPECT_TRUE(test::near(s.outBrdf, transferTo(metal, s, s.sampleDirection), 1e-4));
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
    host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
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
        metal.maskingColor = {end(), end(), end()};
        metal.shade(&host, s);
        EXPECT_GE(minComponent(rgb(s.Ci)), 0.0f) << i;
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
