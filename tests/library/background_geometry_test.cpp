// SPDX-License-Identifier: Apache-2.0
#include "environments/BackgroundGeometry.h"
#include "support/textTable.h"

namespace zsi {
namespace {

using Picture = test::FunctionTexture<Vec2f>;
using Cube = test::FunctionTexture<Vec3f>;
using test::Vec3d;

struct Ground : test::Trial<BackgroundGeometry> {
    Ground()
    {
        state.I = normalize(Vec3f(1, 0, -1));
        state.Ci = {7, 7, 7, 7};
        shader.diffuseColor = {0.2f, 0.4f, 0.6f};
        shader.globalIBLMatrix = Mat3f::identity();
    }
};

testing::AssertionResult shows(Ground& ground, Vec3d want)
{
    Vec4f const got = ground.shade();
    return got.w == 1 ? test::near(rgb(got), want, 1e-6) : testing::AssertionFailure() << "alpha";
}

TEST(BackgroundGeometry, FacesCutsAndBlendsByAlpha)
{
    // height of I, alpha: kept, rays through
    for (test::Line const& c : test::table(R"(
        front        | | -1 1     1 0
        back         | | 1 1      0 0
        edge on      | | 0 1      0 0
        cut out      | | -1 0.04  0 0
        at the limit | | -1 0.05  1 1
        half clear   | | -1 0.5   1 1)")) {
        SCOPED_TRACE(c.why);
        float const a = c.want[1], b = 1 - a;
        bool const kept = c.want[2] != 0, through = c.want[3] != 0;
        Picture picture([&](Vec2f) { return Vec4f(0.2f, 0.4f, 0.6f, a); });
        Ground g;
        g.state.I = {1 - std::fabs(c.want[0]), 0, c.want[0]};
        g.shader.diffuseMode = 1;
        g.shader.diffuseTexture.texture = &picture;
        g.host.addLight({0, 0, 1}, {1, 1, 1});
        g.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 2, 3, 0.5f); };
        Vec4f const seen =
            withAlpha(Vec3f(0.2f, 0.4f, 0.6f) * a + Vec3f(1, 2, 3) * b, a + 0.5f * b);
        EXPECT_TRUE(test::near(g.shade(), kept ? seen : Vec4f(7, 7, 7, 7), 1e-6));
        EXPECT_EQ(g.state.discardHit, !kept);
        ASSERT_EQ(g.host.count("traceThrough"), through);
        EXPECT_TRUE(!through || g.host.calls[0].scalars[0] == 1.0f) << "importance";
    }
}

/// White ground under one light of (4, 2, 1) with weight 1/2, one of (0, 0, 2) behind the smooth
/// normal's rim, and a sky of (0.5, 1, 0) that is half open.
TEST(BackgroundGeometry, LightsAddUpInTheirShadowAndTheSkyInItsOcclusion)
{
    // shadow, tint, its intensity, sky: light
    for (std::uint32_t const rayType : {1u, 2u, 4u, 32u})
        for (test::Line const& c : test::table(R"(
            open           | | 1 1 1    0 0 0    1    0  2 1 2.5
            sky            | | 1 1 1    0 0 0    1    1  2.25 1.5 2.5
            shadow         | | 0 0.5 1  0 0 0    1    1  0.25 1 2.5
            half as strong | | 0 0.5 1  0 0 0    0.5  1  1.25 1.25 2.5
            tinted         | | 0 0.5 0  0.5 0 1  1    0  1 0.5 2.5)")) {
            Ground g;
            g.state.rayType = rayType;
            g.shader.diffuseColor = {1, 1, 1};
            g.shader.shadowColor = test::vec3(c.want, 3);
            g.shader.shadowIntensity = c.want[6];
            g.host.addLight({0, 0.6f, 0.8f}, {4, 2, 1}, test::vec3(c.want), 0.5f);
            g.host.addLight({1, 0, 0}, {0, 0, 2}, {1, 1, 1}, 1);
            g.host.onOcclusion = [](Vec3f, Vec3f) { return Vec3f(0.5f, 0.5f, 0.5f); };
            Cube cube([](Vec3f at) { return Vec4f(0.25f * at.y, 0.5f, 0, 1); }); // up is y
            if (c.want[7] != 0)
                g.shader.diffuseCube.texture = &cube;
            g.shader.globalIBLGainValue = 4;
            g.shader.diffuseIBLGainValue = 0.5f;
            Vec3f const want = test::vec3(c.want, 8);
            EXPECT_TRUE(shows(g, want)) << c.why << rayType;
            EXPECT_EQ(g.host.calls[0].scalars[0], 0.0f); // the common list
            g.shader.diffuseColor = {0.5f, 0, 0.25f}; // the picture scales all of it
            EXPECT_TRUE(shows(g, want * Vec3f(0.5f, 0, 0.25f))) << c.why;
        }
}

/// Light at 60 and at 88 degrees, a normal that leans 45 degrees to it or away.
TEST(BackgroundGeometry, BumpShadesTheLights)
{
    double const low = std::sin(2 * M_PI / 180);
    struct Case {
        char const* why;
        double height, lean, want;
    };
    Case const cases[] = {{"cosine of 15 degrees", 0.5, 1, 0.9659258},
                          {"away", 0.5, -1, 0},
                          {"at most twice as bright", low, 1, 2 * low}};
    for (Case const& c : cases) {
        Picture bump([&](Vec2f) { return Vec4f(c.lean > 0 ? 1 : 0, 0.5f, 1, 1); });
        Ground g;
        g.shader.diffuseColor = {1, 1, 1};
        g.shader.bumpMode = 1;
        g.shader.bumpTexture.texture = &bump;
        g.shader.bumpUVMatrix = Mat3f::identity();
        test::setAttribute(g.state, 8, Vec3f(1, 0, 0));
        test::setAttribute(g.state, 20, Vec3f(0, 1, 0));
        double const x = std::sqrt(1 - c.height * c.height);
        g.host.addLight(test::toFloat({x, 0, c.height}), {1, 1, 1}, {1, 1, 1}, float(c.height));
        EXPECT_TRUE(shows(g, {c.want, c.want, c.want})) << c.why;
    }
}

/// Texels that lean by 45 degrees towards rising u, then v, of the picture: where that is in the
/// world, with a texture turned by 90 degrees (u along y of the object, v against x), repeated
/// twice, and an object that is turned by 90 degrees about x (y of it is up).
TEST(BackgroundGeometry, BumpTiltsTheNormalAlongRisingTextureCoordinates)
{
    // mode, normal of the object, position: world directions of rising u and v
    for (test::Line const& c : test::table(R"(
        uv           | | 1  0 0 1  0 0 0   0 0 1   -1 0 0
        planar       | | 2  0 0 1  0 0 0   0 0 1   -1 0 0
        box, z       | | 3  0 0 1  0 0 0   0 0 1   -1 0 0
        box, y       | | 3  0 -1 0  0 0 0  0 -1 0  -1 0 0
        cylinder, x  | | 4  1 0 0  9 0 0   0 0 -1  0 -1 0
        cylinder, -y | | 4  0 -1 0  0 -9 0 -1 0 0  0 -1 0)"))
        for (int const along : {0, 1})
            for (std::uint32_t const rayType : {1u, 32u}) { // whatever the ray
                Picture bump(
                    [&](Vec2f) { return Vec4f(along ? 0.5f : 1, along ? 1 : 0.5f, 1, 1); });
                Ground g;
                BackgroundGeometry& s = g.shader;
                s.bumpMode = static_cast<int>(c.want[0]);
                s.bumpTexture.texture = &bump;
                s.bumpTextureMatrix = Mat4f(0, -2, 0, 0, 2, 0, 0, 0, 0, 0, 2, 0, 0, 0, 0, 1);
                s.bumpTextureMatrixInverse =
                    Mat4f(0, 0.5f, 0, 0, -0.5f, 0, 0, 0, 0, 0, 0.5f, 0, 0, 0, 0, 1);
                s.bumpUVMatrix = Mat3f(s.bumpTextureMatrix);
                g.state.objectToWorld = Mat4f(3, 0, 0, 0, 0, 0, 3, 0, 0, -3, 0, 0, 0, 0, 0, 1);
                test::setAttribute(g.state, 8, Vec3f(1, 0, 0)); // uv = object xy
                test::setAttribute(g.state, 20, Vec3f(0, 1, 0));
                g.state.Nref = test::vec3(c.want, 1);
                g.state.Pref = test::vec3(c.want, 4);
                g.state.N = g.state.Ng =
                    normalize(transformDirection(g.state.objectToWorld, g.state.Nref));
                g.state.I = -g.state.N;
                g.state.rayType = rayType;
                Vec3f seen(0, 0, 0);
                g.host.onOcclusion = [&](Vec3f, Vec3f N) { return seen = N, Vec3f(1, 1, 1); };
                g.shade();
                Vec3f const rise = test::vec3(c.want, along ? 10 : 7);
                EXPECT_TRUE(test::near(seen, normalize(g.state.N + rise), 1e-5)) << c.why << along;
            }
}

TEST(BackgroundGeometry, ReflectivityIsSplitBetweenBlurredAndSharp)
{
    Cube one([](Vec3f) { return Vec4f(1, 1, 1, 1); });
    Vec3f const reflectivity(0.1f, 0.2f, 0.3f);
    for (bool const cube : {false, true}) {
        Ground g;
        g.state.I = {0.8f, 0, -0.6f};
        g.shader.diffuseColor = {0, 0, 0};
        g.shader.specularColor = reflectivity;
        g.host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
        g.shader.specularCube.texture = &one;
        g.shader.useCubeReflection = cube;
        g.shader.reflectCube.texture = &one;
        EXPECT_TRUE(shows(g, reflectivity)); // in a white room
        EXPECT_EQ(g.host.count("traceReflection"), !cube);
        g.shader.specularCube = {};
        float const sharp = 0.01024f; // (1 - 0.6)^5: only the sharp share is left
        EXPECT_TRUE(shows(g, reflectivity * sharp));
        if (!cube) {
            EXPECT_NEAR(g.host.calls.back().scalars[0], 0.3f * sharp, 1e-6f) << "importance";
        }
        g.state.rayType = 32;
        EXPECT_TRUE(shows(g, {0, 0, 0})) << "rays that gather light see no mirror";
    }
    // A reflection ray takes the ground for the environment, where there is one.
    Ground g;
    Cube cube([](Vec3f d) { return Vec4f(d.x + 2, d.y + 2, d.z + 2, 0.3f); });
    g.host.addLight({0, 0, 1}, {1, 1, 1});
    g.state.rayType = 2;
    EXPECT_TRUE(shows(g, Vec3f(0.2f, 0.4f, 0.6f)));
    g.shader.reflectCube.texture = &cube;
    float const r = std::sqrt(0.5f);
    EXPECT_TRUE(shows(g, Vec3f(2 + r, 2 - r, 2))); // I = (r, 0, -r), looked up at (x, z, -y)
    g.shader.useCubeReflection = false;
    EXPECT_TRUE(shows(g, Vec3f(0.2f, 0.4f, 0.6f)));
}

TEST(BackgroundGeometry, GradesContrastThenGainThenSaturation)
{
    // Luminance of (0.5, 0.25, 1): 0.2125 / 2 + 0.7154 / 4 + 0.0721.
    constexpr float kL = 0.3572f;
    struct Case {
        char const* why;
        ChannelGrade grade;
        Vec3f want;
    };
    Case const cases[] = {
        {"defaults", {}, {0.5f, 0.25f, 1}},
        {"none left: the pivot", {.contrastPivot = {3, 4, 5}, .contrast = 0}, {3, 4, 5}},
        {"steeper, dark at 0", {.contrastPivot = {0.5f, 0.5f, 0.5f}, .contrast = 3}, {0.5f, 0, 2}},
        {"value alone", {.gainColor = {9, 9, 9}, .gain = 2}, {1, 0.5f, 2}},
        {"colour", {.gainColor = {2, 4, 8}, .gainSource = 1, .gain = 0.5f}, {0.5f, 0.5f, 4}},
        {"luminance",
         {.gainColor = {1, 2, 4}, .gainSource = 2, .gain = 2},
         {2 * kL, 4 * kL, 8 * kL}},
        {"unknown source", {.gainColor = {9, 9, 9}, .gainSource = 3}, {0.5f, 0.25f, 1}},
        {"grey", {.saturation = 0}, {kL, kL, kL}},
        {"more colour", {.saturation = 2}, {1 - kL, 0.5f - kL, 2 - kL}},
    };
    for (Case const& c : cases) {
        Vec3f const got = gradeChannel({0.5f, 0.25f, 1}, c.grade);
        EXPECT_TRUE(test::near(got, Vec3f(maxOf(c.want.x, 0), maxOf(c.want.y, 0), c.want.z), 2e-6))
            << c.why;
    }
}

/// Without saturation a cube is grey, whichever way it is seen: by a reflection ray, mirrored
/// sharply, mirrored blurred, as light of the sky.
TEST(BackgroundGeometry, CubesAreGradedWhereverTheyAreSeen)
{
    Cube cube([](Vec3f) { return Vec4f(0.5f, 0.25f, 1, 1); });
    for (int const seen : {0, 1, 2, 3})
        for (bool const own : {false, true}) {
            Ground g;
            BackgroundGeometry& s = g.shader;
            TextureSamplerCube* const cubes[] = {&s.reflectCube, &s.reflectCube, &s.specularCube,
                                                 &s.diffuseCube};
            cubes[seen]->texture = &cube;
            s.useCubeReflection = true;
            s.diffuseColor = grey(seen == 3 ? 1 : 0);
            s.specularColor = grey(seen == 3 ? 0 : 1);
            g.state.rayType = seen == 0 ? 2 : 1;
            bool const grey = !own || seen < 2; // the others have no saturation of their own
            (own ? s.reflectIBLChannelSatValue : s.globalIBLSatValue) = 0;
            Vec4f const c = g.shade();
            EXPECT_GT(c.x, 0);
            EXPECT_EQ(std::fabs(c.x - c.z) < 1e-6f, grey) << seen << own;
        }
}

TEST(BackgroundGeometry, ShadowRaysStopAtGroundThatFacesUp)
{
    // ray type, height of the normal, light that passes
    constexpr float kCases[][3] = {{16, 0.9f, 0},
                                   {16, 0.89f, 1},
                                   {16, 1, 0},
                                   {16, -1, 1},
                                   {16, std::numeric_limits<float>::quiet_NaN(), 0},
                                   {1, 1, 1},
                                   {32, 1, 1}};
    for (auto const& [rayType, height, want] : kCases) {
        Ground g;
        g.state.rayType = static_cast<std::uint32_t>(rayType);
        g.state.N = {0, 0, height};
        g.shader.transmission(&g.host, g.state);
        EXPECT_EQ(g.state.transmissionColor, grey(want)) << height;
    }
    Ground g;
    g.shader.sample(&g.host, g.state);
    EXPECT_EQ(g.state.sampleDirection, g.state.I);
}

} // namespace
} // namespace zsi
