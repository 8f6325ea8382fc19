// SPDX-License-Identifier: Apache-2.0
#include "runtime/builtins.h"
#include "support/scriptedHost.h"

namespace zsi {
namespace {

constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
constexpr Vec3f kNone(0, 0, 0);

TEST(Runtime, FaceForwardTurnsByTheReferenceAndIsZeroEdgeOn)
{
    Vec3f const n(1, 2, 3), i(0, 0, -1);
    EXPECT_EQ(sl_lib_faceforward(n, i, {0, 0, 1}), n);
    EXPECT_EQ(sl_lib_faceforward(n, i, {5, 0, -1e-30f}), -n);
    EXPECT_EQ(sl_lib_faceforward(n, i, {1, 0, 0}), kNone);
    EXPECT_EQ(sl_lib_faceforward(n, i, {kNan, 0, 1}), kNone);
}

TEST(Runtime, RefractionKeepsSnellsLawInThePlaneOfIncidence)
{
    // Sines 3/5 and 2/5, 3/5 and 3/4, in a plane that is no plane of axes.
    Vec3f const n(0, 0.6f, 0.8f), across(0.6f, -0.64f * 0.75f, 0.48f * 0.75f);
    Vec3f const along = across * (1 / length(across)), i = along * 0.6f - n * 0.8f;
    EXPECT_TRUE(test::near(sl_lib_refract(i, n, 1 / 1.5f), along * 0.4f - n * 0.9165151f, 1e-6));
    EXPECT_TRUE(test::near(sl_lib_refract(i, n, 1.25f), along * 0.75f - n * 0.6614378f, 1e-6));
    EXPECT_EQ(sl_lib_refract(i, n, 1.7f), kNone);
    // The cosine counts without sign, and k = 1e-6 is already total reflection.
    EXPECT_EQ(sl_lib_refract({1, 0, -1e-4f}, {0, 0, 1}, 1.5f), kNone);
    EXPECT_EQ(sl_lib_refract({1, 0, 0}, {0, 0, 1}, 1.0f), kNone);
    EXPECT_EQ(sl_lib_refract({1, 0, -9.9e-4f}, {0, 0, 1}, 1.0f), kNone);
    EXPECT_NE(sl_lib_refract({1, 0, -1.01e-3f}, {0, 0, 1}, 1.0f), kNone);
    EXPECT_EQ(sl_lib_refract({0, 0, 1}, {0, 0, 1}, 0.5f), kNone) << "eta I + (eta - 1) N";
}

TEST(Runtime, LogarithmsOfTheirBases)
{
    EXPECT_NEAR(sl_lib_log2(8.0f), 3.0f, 1e-6f);
    EXPECT_NEAR(sl_lib_log10(1e-30f), -30.0f, 1e-5f);
    EXPECT_EQ(sl_lib_log2(0.0f), -std::numeric_limits<float>::infinity());
    EXPECT_TRUE(std::isnan(sl_lib_log10(-1.0f)));
}

TEST(Runtime, TexturesReadOpaqueBlackWhereTheyHaveNothing)
{
    Vec4f const black(0, 0, 0, 1);
    struct Silent final : HostTexture2D {
        void reserved0() override { }
        void reserved1() override { }
        void lookup(Vec4f*, Vec2f const*) const override { }
    } const silent;
    TextureSampler2D handle;
    EXPECT_TRUE(test::near(handle.lookup({kNan, 3}), black, 0));
    handle.texture = &silent;
    handle.index = 12345; // the host's word: never looked at
    EXPECT_TRUE(test::near(handle.lookup({0, 0}), black, 0));
    EXPECT_TRUE(test::near(TextureSampler1D{}.lookup(0.5f), black, 0));
    EXPECT_TRUE(test::near(TextureSamplerCube{}.lookup({0, 0, 0}), black, 0));
}

TEST(Runtime, ValueTypes)
{
    EXPECT_TRUE(Vec3f(0.0f, 1, 2) == Vec3f(-0.0f, 1, 2));
    EXPECT_FALSE(Vec3f(kNan, 1, 2) == Vec3f(kNan, 1, 2));
    Mat3f const block(Mat4f(0, 1, 2, 90, 3, 4, 5, 91, 6, 7, 8, 92, 93, 94, 95, 96));
    for (int i = 0; i < 9; ++i)
        EXPECT_EQ(block.m[i], static_cast<float>(i)) << "row by row, without the translation";
    EXPECT_TRUE(std::isnan(clamp01(kNan)));
    EXPECT_EQ(normalize(kNone), kNone);
}

} // namespace
} // namespace zsi
