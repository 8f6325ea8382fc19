#include "environments/corvid_Env_Default.h"
#include "support/record.h"
#include "support/scriptedHost.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

using CubeTexture = test::FunctionTexture<Vec3f>;

struct Sky {
    CubeTexture reflection{[](Vec3f) { return Vec4f(0.5f, 0.25f, 1.0f, 0.3f); }};
    CubeTexture diffuse{[](Vec3f) { return Vec4f(2.0f, 4.0f, 8.0f, 0.6f); }};
    corvid_Env_Default shader;

    Sky()
    {
        shader.reflectionCube.texture = &reflection;
        shader.diffuseCube.texture = &diffuse;
        shader.globalIBLMatrix = Mat3f::identity();
    }
    Vec4f look(std::uint32_t rayType, std::uint32_t depth = 0, Vec3f direction = {0, 0, 1})
    {
        ShadeState state = test::plainHit();
        state.I = direction;
        state.rayType = rayType;
        state.rayDepth = depth;
        state.maxRayDepth = 3;
        shader.shade(nullptr, state); // no service is asked
        return state.Ci;
    }
};

void expectColor(Vec4f got, Vec4f want)
{
    EXPECT_FLOAT_EQ(got.x, want.x);
    EXPECT_FLOAT_EQ(got.y, want.y);
    EXPECT_FLOAT_EQ(got.z, want.z);
    EXPECT_EQ(got.w, want.w);
}

TEST(DefaultEnvironment, RayTypeAndDepthChooseWhatARaySees)
{
    enum Seen { kFlat, kReflection, kDiffuse };
    struct Case {
        std::uint32_t rayType, depth;
        Seen want;
    };
    constexpr Case kCases[] = {
        {1, 0, kFlat},        {4, 2, kFlat},       {16, 0, kFlat},       {0, 0, kFlat},
        {34, 0, kFlat},       {2, 0, kReflection}, {2, 3, kReflection},  {32, 2, kDiffuse},
        {32, 3, kReflection}, {1, 3, kReflection}, {16, 9, kReflection},
    };
    for (Case const& c : kCases) {
        SCOPED_TRACE("ray type " + std::to_string(c.rayType) + " depth " + std::to_string(c.depth));
        Sky sky;
        Vec4f const got = sky.look(c.rayType, c.depth);
        expectColor(got,
                    c.want == kFlat             ? Vec4f(0.0f, 0.5f, 0.7f, 0.0f)
                        : c.want == kReflection ? Vec4f(0.5f, 0.25f, 1.0f, 1.0f)
                                                : Vec4f(2.0f, 4.0f, 8.0f, 1.0f));
        EXPECT_EQ(sky.reflection.lookups.size(), c.want == kReflection);
        EXPECT_EQ(sky.diffuse.lookups.size(), c.want == kDiffuse);
    }
}

TEST(DefaultEnvironment, RotatesTheDirectionRowByRowAndSwapsTheAxes)
{
    Sky sky;
    sky.look(2, 0, {0, 0, 1});
    sky.look(2, 0, {0, 1, 0});
    sky.shader.globalIBLMatrix = {1, 2, 3, 40, 50, 60, 700, 800, 900};
    sky.look(2, 0, {1, 10, 100});
    EXPECT_EQ(sky.reflection.lookups[0], Vec3f(0, 1, 0));
    EXPECT_EQ(sky.reflection.lookups[1], Vec3f(0, 0, -1));
    // Rows give (321, 6540, 98700); the coordinate is (x, z, -y).
    EXPECT_EQ(sky.reflection.lookups[2], Vec3f(321, 98700, -6540));
}

TEST(DefaultEnvironment, GradesContrastThenGainThenSaturation)
{
    struct Grade {
        char const* why;
        Vec2f contrast;
        int mode;
        Vec3f gain;
        float saturation;
        Vec4f want;
    };
    // The cube gives (0.5, 0.25, 1); the weights are (0.25, 0.5, 0.125): luminance 0.375.
    constexpr Grade kGrades[] = {
        {"defaults", {0.5f, 1}, 0, {9, 9, 9}, 1, {0.5f, 0.25f, 1, 1}},
        {"no contrast left: the pivot", {0.5f, 0}, 0, {9, 9, 9}, 1, {0.5f, 0.5f, 0.5f, 1}},
        {"contrast 2 about 0.5", {0.5f, 2}, 0, {9, 9, 9}, 1, {0.5f, 0, 1.5f, 1}},
        {"gain per channel", {0.5f, 1}, 1, {2, 4, 0.5f}, 1, {1, 1, 0.5f, 1}},
        {"gain times luminance", {0.5f, 1}, 2, {1, 2, 4}, 1, {0.375f, 0.75f, 1.5f, 1}},
        {"an unknown mode is none", {0.5f, 1}, 3, {9, 9, 9}, 1, {0.5f, 0.25f, 1, 1}},
        {"grey", {0.5f, 1}, 0, {9, 9, 9}, 0, {0.375f, 0.375f, 0.375f, 1}},
        {"saturation 2: 2c - L", {0.5f, 1}, 0, {9, 9, 9}, 2, {0.625f, 0.125f, 1.625f, 1}},
        {"in order: (0.5, 0, 1.5), (1, 0, 3), L 0.625",
         {0.5f, 2},
         1,
         {2, 4, 2},
         2,
         {1.375f, -0.625f, 5.375f, 1}},
    };
    for (Grade const& g : kGrades) {
        SCOPED_TRACE(g.why);
        Sky sky;
        sky.diffuse.texel = sky.reflection.texel;
        corvid_Env_Default& s = sky.shader;
        s.IBLLuminanceFactors = {0.25f, 0.5f, 0.125f};
        s.reflectIBLContrast = g.contrast;
        s.reflectIBLGainMode = g.mode;
        s.reflectIBLGain = g.gain;
        s.reflectIBLSaturation = g.saturation;
        expectColor(sky.look(2), g.want);
        expectColor(sky.look(32), {0.5f, 0.25f, 1, 1}); // the other path has its own controls
        std::swap(s.diffuseIBLContrast, s.reflectIBLContrast);
        std::swap(s.diffuseIBLGainMode, s.reflectIBLGainMode);
        std::swap(s.diffuseIBLGain, s.reflectIBLGain);
        std::swap(s.diffuseIBLSaturation, s.reflectIBLSaturation);
        expectColor(sky.look(32), g.want);
        expectColor(sky.look(2), {0.5f, 0.25f, 1, 1});
    }
}

TEST(DefaultEnvironment, MissingCubesAreBlackAndNanIsGradedNotHidden)
{
    Sky sky;
    sky.shader.reflectionCube = {};
    expectColor(sky.look(2), {0, 0, 0, 1});
    sky.shader.reflectIBLContrast = {0.5f, 0};
    expectColor(sky.look(2), {0.5f, 0.5f, 0.5f, 1});
    sky.shader.reflectIBLContrast.y = std::nanf("");
    EXPECT_TRUE(std::isnan(sky.look(2).x));
    EXPECT_EQ(sky.look(2).w, 1.0f);
}

/// The arithmetic in its stated order, in single precision: the result must match to the bit.
TEST(DefaultEnvironment, MatchesTheStatedOrderOfOperationsToTheBit)
{
    test::Random random;
    for (int i = 0; i < 2000; ++i) {
        Sky sky;
        Vec4f const texel(random.in(0, 9), random.in(0, 9), random.in(0, 9), 0);
        sky.reflection.texel = [&](Vec3f) { return texel; };
        corvid_Env_Default& s = sky.shader;
        s.IBLLuminanceFactors = random.color();
        s.reflectIBLContrast = {random.in(0, 1), random.in(0, 2)};
        s.reflectIBLGainMode = i % 3;
        s.reflectIBLGain = random.color();
        s.reflectIBLSaturation = random.in(0, 2);
        float const amount = s.reflectIBLContrast.y,
                    lift = s.reflectIBLContrast.x * (1.0f - amount);
        Vec3f const f = s.IBLLuminanceFactors, g = s.reflectIBLGain;
        float r = texel.x * amount + lift, gr = texel.y * amount + lift,
              b = texel.z * amount + lift;
        if (i % 3 == 2) {
            float const l = b * f.z + (r * f.x + gr * f.y);
            r = g.x * l, gr = g.y * l, b = l * g.z;
        } else if (i % 3 == 1)
            r *= g.x, gr *= g.y, b *= g.z;
        float const m = ((f.x * r + f.y * gr) + f.z * b) * (1.0f - s.reflectIBLSaturation);
        Vec4f const got = sky.look(2);
        ASSERT_EQ(rgb(got),
                  Vec3f(r * s.reflectIBLSaturation + m, gr * s.reflectIBLSaturation + m,
                        b * s.reflectIBLSaturation + m));
    }
}

} // namespace
} // namespace zsi
