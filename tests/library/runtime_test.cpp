#include "runtime/builtins.h"
#include "support/scriptedHost.h"

#include <limits>

namespace zsi {
namespace {

constexpr float kNan = std::numeric_limits<float>::quiet_NaN();

TEST(Runtime, FaceForwardTurnsByTheReferenceAndIsZeroEdgeOn)
{
    Vec3f const n(1, 2, 3), i(0, 0, -1), none(0, 0, 0);
    EXPECT_EQ(sl_lib_faceforward(n, i, {0, 0, 1}), n);
    EXPECT_EQ(sl_lib_faceforward(n, i, {5, 0, -1e-30f}), -n);
    EXPECT_EQ(sl_lib_faceforward(n, i, {1, 0, 0}), none);
    EXPECT_EQ(sl_lib_faceforward(n, i, {kNan, 0, 1}), none);
}

TEST(Runtime, RefractionKeepsSnellsLawInThePlaneOfIncidence)
{
    test::Random random;
    int total = 0;
    for (int k = 0; k < 2000; ++k) {
        Vec3f const n = random.unit();
        Vec3f i = random.unit();
        if (test::dotOf(i, n) > 0)
            i = -i; // the caller's part
        float const eta = random.in(0.5f, 2.0f);
        Vec3f const t = sl_lib_refract(i, n, eta);
        double const c = test::dotOf(i, n), sine2 = double(eta) * double(eta) * (1 - c * c);
        if (std::abs(1 - sine2) < 1e-5)
            continue; // the margin itself is checked below
        if (sine2 > 1) {
            EXPECT_EQ(t, Vec3f(0, 0, 0));
            ++total;
            continue;
        }
        // Unit, on the far side, tangential part scaled by eta. Near the critical angle the cosine
        // is the root of a difference and keeps half the digits: sqrt(1e-6).
        test::Vec3d const across = test::minus(i, test::times(n, c));
        EXPECT_TRUE(test::near(test::minus(t, test::times(n, test::dotOf(t, n))),
                               test::times(across, double(eta)), 2e-6));
        EXPECT_NEAR(test::dotOf(t, n), -std::sqrt(1 - sine2), 1e-3);
        EXPECT_NEAR(length(t), 1.0f, 1e-5f);
    }
    EXPECT_GT(total, 100);
    // c counts as |c|, and k = 1e-6 is already total reflection.
    EXPECT_EQ(sl_lib_refract({1, 0, -1e-4f}, {0, 0, 1}, 1.5f), Vec3f(0, 0, 0));
    EXPECT_EQ(sl_lib_refract({1, 0, 0}, {0, 0, 1}, 1.0f), Vec3f(0, 0, 0));
    EXPECT_EQ(sl_lib_refract({0, 0, 1}, {0, 0, 1}, 0.5f), Vec3f(0, 0, 0))
        << "N along I: eta I + (eta - 1) N";
}

TEST(Runtime, LogarithmsOfTheirBases)
{
    for (float const x : {1e-30f, 0.1f, 2.0f, 3e38f}) {
        EXPECT_NEAR(double(sl_lib_log2(x)), std::log2(double(x)), 3e-7 * 128);
        EXPECT_NEAR(double(sl_lib_log10(x)), std::log10(double(x)), 3e-7 * 40);
    }
    EXPECT_EQ(sl_lib_log2(0.0f), -std::numeric_limits<float>::infinity());
    EXPECT_TRUE(std::isnan(sl_lib_log10(-1.0f)));
}

TEST(Runtime, TexturesReadOpaqueBlackWhereTheyHaveNothing)
{
    Vec4f const black(0, 0, 0, 1);
    EXPECT_TRUE(test::near(TextureSampler1D{}.lookup(0.5f), black, 0));
    EXPECT_TRUE(test::near(TextureSampler2D{}.lookup({kNan, 3}), black, 0));
    EXPECT_TRUE(test::near(TextureSamplerCube{}.lookup({0, 0, 0}), black, 0));

    struct Silent final : HostTexture2D {
        void reserved0() override { }
        void reserved1() override { }
        void lookup(Vec4f*, Vec2f const*) const override { }
    } const silent;
    TextureSampler2D handle;
    handle.texture = &silent;
    handle.index = 12345; // the host's word: never looked at
    EXPECT_TRUE(test::near(handle.lookup({0, 0}), black, 0));
}

TEST(Runtime, ValueTypes)
{
    EXPECT_TRUE(Vec3f(0.0f, 1, 2) == Vec3f(-0.0f, 1, 2));
    EXPECT_FALSE(Vec3f(kNan, 1, 2) == Vec3f(kNan, 1, 2));
    EXPECT_FALSE(Vec3f(0, 1, 2) == Vec3f(0, 1, 2.0000002f));
    Mat3f const block(Mat4f(0, 1, 2, 90, 3, 4, 5, 91, 6, 7, 8, 92, 93, 94, 95, 96));
    for (int i = 0; i < 9; ++i)
        EXPECT_EQ(block.m[i], static_cast<float>(i)) << "row by row, without the translation";
    EXPECT_TRUE(std::isnan(clamp01(kNan)));
    EXPECT_EQ(normalize({0, 0, 0}), Vec3f(0, 0, 0));
}

} // namespace
} // namespace zsi
