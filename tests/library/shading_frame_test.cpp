#include "materials/physical/shared/proceduralNormal.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/shadingFrame.h"
#include "support/reference.h"
#include "support/scriptedHost.h"

namespace zsi {
namespace {

using test::D3;
using test::minus;
using test::plus;
using test::times;

/// Other frames are those of the materials' tests.
TEST(ShadingFrame, ATangentAlongTheNormalLeavesZerosNotNan)
{
    SLArray<Vec3f> const f = computeBaseFrame({0, 0, 3}, {0, 0, 1}, {1, 0, 0, 0, 1, 0, 0, 0, 1});
    EXPECT_EQ(f[0], Vec3f(0, 0, 0));
    EXPECT_EQ(f[1], Vec3f(0, 0, 0));
}

TEST(ShadingFrame, BumpsDownhillByThreeHeights)
{
    test::Random random;
    test::ScriptedHost host;
    for (int i = 0; i < 500; ++i) {
        SLArray<Vec3f> const before =
            computeBaseFrame(random.unit(), random.unit(), {1, 0, 0, 0, 1, 0, 0, 0, 1});
        // A height that is flat, or too flat by a hair, or steep.
        float const steep = i % 3 == 0 ? 0.0f : i % 3 == 1 ? 0.002f : 40.0f;
        float const a = steep * random.in(-1, 1), b = steep * random.in(0.5f, 1);
        test::FunctionTexture<Vec2f> map([&](Vec2f p) {
            float const third = (a * p.x + b * p.y) / 4;
            return Vec4f(third, 2 * third, third, 99); // the height is the plain sum
        });
        TextureSampler2D sampler;
        sampler.texture = &map;
        Mat3f m;
        for (float& f : m.m)
            f = random.in(-1, 1);
        Vec2f const uv(random.in(0, 1), random.in(0, 1));
        float const amount = random.in(-2, 2), scale = random.in(0.5f, 3);

        SLArray<Vec3f> frame = before;
        f_rtBumpPerturb(&host, test::plainHit(), frame, uv, sampler, m, amount, scale);
        ASSERT_EQ(map.lookups.size(), 3u);
        double const u = (test::dotOf({uv.x, uv.y, 1}, {m.m[0], m.m[3], m.m[6]})) * double(scale);
        EXPECT_NEAR(double(map.lookups[0].x), u, 3e-6);
        EXPECT_NEAR(double(map.lookups[1].x), u + 0.001, 3e-6) << "the step is not scaled";

        D3 const bend =
            plus(times(before[0], -0.001 * double(a)), times(before[1], -0.001 * double(b)));
        D3 const want =
            i % 3 == 2 ? plus(before[2], times(bend, 3.33 * double(amount))) : D3(before[2]);
        // Heights of a few dozen round to some 1e-6 each, times 6.66 at most.
        EXPECT_LT(test::distance(frame[2], want), i % 3 == 2 ? 1e-4 : 0.0 + 1e-30);
        EXPECT_EQ(frame[0], before[0]) << "tangents wait for the caller";
    }
}

TEST(SafeReflect, KeepsTheMarginInThePlaneOrFallsBackToTheNormal)
{
    test::Random random;
    test::ScriptedHost host;
    int kept = 0, bent = 0;
    for (int i = 0; i < 20000; ++i) {
        Vec3f const I = random.unit(), Ng = random.unit();
        Vec3f const N = i % 2 ? random.unit() : normalize(Ng + random.unit() * 0.8f);
        D3 const di(I), dg(Ng), dn(N);
        double const d = inner(di, dn), g = inner(di, dg), s = inner(dn, dg);
        D3 const mirror = minus(di, times(dn, 2 * d));
        double const A = s * s + g * g - 2 * d * g * s, B = 0.1 * (d * g - s), C = 0.0025 - g * g;
        double const disc = B * B - 4 * A * C;
        if (std::fabs(inner(mirror, dg) - 0.05) < 1e-6 || std::fabs(disc) < 1e-5 || A < 1e-2
            || std::fabs(g) < 1e-2)
            continue; // too near to a decision, or to a division by nothing, for single precision
        D3 const got = f_safe_reflect(&host, test::plainHit(), I, Ng, N);
        if (inner(mirror, dg) >= 0.05) {
            EXPECT_LT(test::distance(got, mirror), 1e-6);
            ++kept;
        } else {
            ASSERT_GE(disc, 0);
            EXPECT_NEAR(inner(got, got), 1, 1e-6);
            EXPECT_NEAR(inner(got, dg), 0.05, 1e-3);
            EXPECT_NEAR(inner(got, outer(di, dn)), 0, 1e-4) << "in the plane of I and N";
            // Of the two such vectors, the one with more of N.
            double const beta = (-B + std::sqrt(disc)) / (2 * A);
            double const alpha = (0.05 - beta * s) / g;
            EXPECT_LT(test::distance(got, plus(times(di, alpha), times(dn, beta))), 1e-3);
            ++bent;
        }
    }
    EXPECT_GT(kept, 1000);
    EXPECT_GT(bent, 1000);
    // A plane of I and N that lies too flat to reach the margin anywhere.
    for (int i = 0; i < 500; ++i) {
        Vec3f const I = normalize({1, random.in(-0.5f, 0.5f), random.in(-0.02f, 0.02f)});
        Vec3f const N = normalize({random.in(-0.5f, 0.5f), 1, random.in(-0.02f, 0.02f)});
        EXPECT_EQ(f_safe_reflect(&host, test::plainHit(), I, {0, 0, 1}, N), N);
    }
    // The margin itself is enough; a hair below is not.
    Vec3f const Ng(0, 0, 1);
    auto const atHeight = [&](float z) {
        Vec3f const I(std::sqrt(1 - z * z), 0, -z);
        return f_safe_reflect(&host, test::plainHit(), I, Ng, Ng).z;
    };
    EXPECT_EQ(atHeight(0.05f), 0.05f);
    EXPECT_NEAR(atHeight(0.0499f), 0.05f, 1e-6f);
    // Along the surface, normal and ray alike: no quadratic is left.
    EXPECT_EQ(f_safe_reflect(&host, test::plainHit(), {1, 0, 0}, Ng, {1, 0, 0}), Vec3f(1, 0, 0));
}

TEST(ProceduralNormal, LeansDownhillAndTurnsWithTheObject)
{
    // A slope along one axis of the object: the offset is along that axis, downhill, of order 1.
    test::ScriptedHost host;
    host.onNoise = [](Vec4f p) { return 0.5f + 0.4f * p.x; };
    ShadeState const s = test::plainHit();
    Mat3f const turned(0, 1, 0, -1, 0, 0, 0, 0, 1); // the object's x lies along the world's y
    SLArray<Vec3f> const world{{{1, 0, 0}, {0, 1, 0}, {0, 0, 1}}};
    Vec3f const straight =
        castRippleOffset(&host, s, {0, 0, 0}, {1, 0, 0, 0, 1, 0, 0, 0, 1}, {3, 3, 3}, world);
    EXPECT_EQ(host.noiseCalls, 6);
    EXPECT_NEAR(straight.x, -0.4f * 2 * 1.5f, 1e-4f) << "contrast 2, weights 1 and 1/2";
    EXPECT_NEAR(straight.y, 0, 1e-4f);
    Vec3f const t = castRippleOffset(&host, s, {0, 0, 0}, turned, {3, 3, 3}, world);
    EXPECT_NEAR(t.x, 0, 1e-4f);
    EXPECT_NEAR(t.y, straight.x, 1e-4f);

    SLArray<Vec3f> frame = world;
    bendByOffset(frame, {0.5f, -0.25f, 0.125f});
    EXPECT_EQ(frame[2], Vec3f(0.5f, -0.25f, 1.125f)) << "not normalised";
    EXPECT_NEAR(length(frame[0]), 1, 1e-6f);
    EXPECT_NEAR(dot(frame[1], frame[2]), 0, 1e-6f);
}

} // namespace
} // namespace zsi
