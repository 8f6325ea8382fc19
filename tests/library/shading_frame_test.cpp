// SPDX-License-Identifier: Apache-2.0
#include "materials/physical/shared/proceduralNormal.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/shadingFrame.h"
#include "support/scriptedHost.h"

namespace zsi {
namespace {

using test::Vec3d;

SLArray<Vec3f> const kWorld{{{1, 0, 0}, {0, 1, 0}, {0, 0, 1}}};

/// Other frames are those of the materials' tests.
TEST(ShadingFrame, ATangentAlongTheNormalLeavesZerosNotNan)
{
    SLArray<Vec3f> const f = computeBaseFrame({0, 0, 3}, {0, 0, 1}, {1, 0, 0, 0, 1, 0, 0, 0, 1});
    EXPECT_EQ(f[0], Vec3f(0, 0, 0));
    EXPECT_EQ(f[1], Vec3f(0, 0, 0));
}

TEST(ShadingFrame, BumpsDownhillByThreeHeights)
{
    struct Case {
        Vec2f slope; ///< of the sum of the channels
        Vec3f normal; ///< (0, 0, 1) - 3.33 * 2 * 0.001 * slope, but as it is where it is flat
    };
    constexpr Case kCases[] = {{{0, 0}, {0, 0, 1}},
                               {{0.008f, -0.008f}, {0, 0, 1}},
                               {{0, 40}, {0, -0.2664f, 1}},
                               {{-40, 20}, {0.2664f, -0.1332f, 1}}};
    for (Case const& c : kCases) {
        test::FunctionTexture<Vec2f> map([&](Vec2f p) {
            float const quarter = (c.slope.x * p.x + c.slope.y * p.y) / 4;
            return Vec4f(quarter, 2 * quarter, quarter, 99);
        });
        TextureSampler2D sampler;
        sampler.texture = &map;
        SLArray<Vec3f> frame = kWorld;
        f_rtBumpPerturb(nullptr, test::plainHit(), frame, {0.25f, 0.5f}, sampler,
                        {0, 1, 0, 2, 0, 0, 0.5f, 0.125f, 1}, 2, 0.5f);
        EXPECT_TRUE(test::near(frame[2], c.normal, 1e-4));
        EXPECT_EQ(frame[0], kWorld[0]) << "tangents wait for the caller";
        ASSERT_EQ(map.lookups.size(), 3u);
        EXPECT_TRUE(map.lookups[0].x == 0.75f && map.lookups[0].y == 0.1875f);
        EXPECT_NEAR(map.lookups[1].x, 0.751f, 1e-6f) << "the step is not scaled";
        EXPECT_NEAR(map.lookups[2].y, 0.1885f, 1e-6f);
    }
}

/// Properties, whatever the numbers: the mirror direction, or at the margin in the plane of I and
/// N.
TEST(SafeReflect, KeepsTheMarginInThePlaneOrFallsBackToTheNormal)
{
    auto const reflect = [](Vec3f I, Vec3f Ng, Vec3f N) {
        return f_safe_reflect(nullptr, test::plainHit(), I, Ng, N);
    };
    test::Random random;
    int kept = 0, bent = 0;
    for (int i = 0; i < 4000; ++i) {
        Vec3f const Ng = random.unit(), N = normalize(Ng + random.unit() * 0.8f);
        Vec3f I = random.unit();
        if (dot(I, Ng) > 0)
            I = -I; // from outside
        Vec3d const mirror = Vec3d(I) - Vec3d(N) * (2 * dot(Vec3d(I), Vec3d(N)));
        double const height = dot(mirror, Vec3d(Ng));
        if (dot(I, Ng) > -0.1f || dot(I, N) > -0.1f || std::fabs(height - 0.05) < 1e-6)
            continue; // too near to a decision, or to a division by nothing
        Vec3d const got = reflect(I, Ng, N);
        if (height > 0.05) {
            ASSERT_TRUE(test::near(got, mirror, 1e-6));
            ++kept;
            continue;
        }
        ASSERT_NEAR(dot(got, got), 1, 1e-6);
        ASSERT_NEAR(dot(got, Vec3d(Ng)), 0.05, 1e-4);
        ASSERT_NEAR(dot(got, cross(Vec3d(I), Vec3d(N))), 0, 1e-4) << "in the plane of I and N";
        // Of the two such vectors, the one on N's side of the ray.
        ASSERT_GT(dot(cross(Vec3d(I), got), cross(Vec3d(I), Vec3d(N))), 0);
        ++bent;
    }
    EXPECT_GT(kept, 1000);
    EXPECT_GT(bent, 100);
    // A plane of I and N that lies too flat to reach the margin anywhere.
    Vec3f const Ng(0, 0, 1), flat(0.3f, 0.9539392f, 0.01f);
    EXPECT_EQ(reflect({0.9998f, 0, -0.02f}, Ng, flat), flat);
    // The margin itself is enough; a hair below is not.
    auto const atHeight = [&](float z) { return reflect({std::sqrt(1 - z * z), 0, -z}, Ng, Ng).z; };
    EXPECT_EQ(atHeight(0.05f), 0.05f);
    EXPECT_NEAR(atHeight(0.0499f), 0.05f, 1e-6f);
    // Along the surface, normal and ray alike: no quadratic is left.
    EXPECT_EQ(reflect({1, 0, 0}, Ng, {1, 0, 0}), Vec3f(1, 0, 0));
}

TEST(ProceduralNormal, LeansDownhillAndTurnsWithTheObject)
{
    // A slope along one axis of the object: the offset is along that axis, downhill, of order 1.
    test::ScriptedHost host;
    host.onNoise = [](Vec4f p) { return 0.5f + 0.4f * p.x; };
    ShadeState const s = test::plainHit();
    Mat3f const turned(0, 1, 0, -1, 0, 0, 0, 0, 1); // the object's x lies along the world's y
    Vec3f const straight =
        castRippleOffset(&host, s, {0, 0, 0}, {1, 0, 0, 0, 1, 0, 0, 0, 1}, {3, 3, 3}, kWorld);
    EXPECT_EQ(host.noiseCalls, 6);
    EXPECT_NEAR(straight.x, -0.4f * 2 * 1.5f, 1e-4f) << "contrast 2, weights 1 and 1/2";
    EXPECT_NEAR(straight.y, 0, 1e-4f);
    Vec3f const t = castRippleOffset(&host, s, {0, 0, 0}, turned, {3, 3, 3}, kWorld);
    EXPECT_NEAR(t.x, 0, 1e-4f);
    EXPECT_NEAR(t.y, straight.x, 1e-4f);

    SLArray<Vec3f> frame = kWorld;
    bendByOffset(frame, {0.5f, -0.25f, 0.125f});
    EXPECT_EQ(frame[2], Vec3f(0.5f, -0.25f, 1.125f)) << "not normalised";
    EXPECT_NEAR(length(frame[0]), 1, 1e-6f);
    EXPECT_NEAR(dot(frame[1], frame[2]), 0, 1e-6f);
}

} // namespace
} // namespace zsi
