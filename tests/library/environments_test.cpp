// SPDX-License-Identifier: Apache-2.0
#include "environments/corvid_Env_Backplate.h"
#include "environments/corvid_Env_Default.h"
#include "support/textTable.h"

namespace zsi {
namespace {

constexpr Vec4f kFlat(0, 0.5f, 0.7f, 0);

template <class Environment>
struct Sky {
    test::FunctionTexture<Vec3f> reflection{[](Vec3f) { return Vec4f(0.5f, 0.25f, 1, 0.3f); }};
    test::FunctionTexture<Vec3f> diffuse{[](Vec3f) { return Vec4f(2, 4, 8, 0.6f); }};
    Environment shader;
    ShadeState state = test::plainHit();

    Sky()
    {
        shader.reflectionCube.texture = &reflection;
        shader.diffuseCube.texture = &diffuse;
        shader.globalIBLMatrix = Mat3f::identity();
        state.maxRayDepth = 3;
    }
    Vec4f look(float rayType, float depth = 0)
    {
        state.rayType = static_cast<std::uint32_t>(rayType);
        state.rayDepth = static_cast<std::uint32_t>(depth);
        shader.shade(nullptr, state); // no service is asked
        return state.Ci;
    }
};

TEST(DefaultEnvironment, RayTypeAndDepthChooseWhatARaySees)
{
    constexpr Vec4f kWant[] = {kFlat, {0.5f, 0.25f, 1, 1}, {2, 4, 8, 1}};
    // ray type, depth of 3; 0: background, 1: reflection, 2: diffuse
    constexpr float kCases[][3] = {{1, 0, 0},  {4, 2, 0}, {16, 0, 0}, {0, 0, 0},
                                   {34, 0, 0}, {2, 0, 1}, {2, 3, 1},  {32, 2, 2},
                                   {32, 3, 1}, {1, 3, 1}, {16, 9, 1}};
    for (auto const& [rayType, depth, seen] : kCases) {
        Sky<corvid_Env_Default> sky;
        EXPECT_TRUE(test::near(sky.look(rayType, depth), kWant[int(seen)], 1e-6)) << rayType;
        EXPECT_EQ(sky.reflection.lookups.size() + 2 * sky.diffuse.lookups.size(), unsigned(seen));
    }
}

TEST(DefaultEnvironment, RotatesTheDirectionRowByRowAndSwapsTheAxes)
{
    Sky<corvid_Env_Default> sky;
    sky.shader.globalIBLMatrix = {1, 2, 3, 40, 50, 60, 700, 800, 900};
    sky.state.I = {1, 10, 100};
    sky.look(2);
    // Rows give (321, 6540, 98700); the coordinate is (x, z, -y).
    EXPECT_EQ(sky.reflection.lookups[0], Vec3f(321, 98700, -6540));
}

/// Both environments, each cube by its own controls: the other's change nothing.
template <class Environment>
void expectGrades()
{
    // texel, contrast, gain mode, gain, saturation: colour, to the bit
    for (test::Line const& c : test::table(R"(
        none                    | | 8 4 16       0.5 1    0 9 9 9     1    8 4 16
        contrast                | | 8 4 16       0.5 0.5  3 9 9 9     1    4.25 2.25 8.25
        gain                    | | 8 4 16       0.5 1    1 2 0.5 4   1    16 2 64
        gain of luminance       | | 8 4 16       0.5 1    2 2 0.5 4   1    12 3 24
        saturation              | | 8 4 16       0.5 1    0 9 9 9     0.5  7 5 11
        all, in order           | | 8 4 16       0.5 0.5  1 2 0.5 4   0.5  7.65625 3.96875 19.90625
        x and y are added first | | 1 4e8 -16e8  0.5 1    2 1 1 1     1    0 0 0
        before z                | | 4e8 1 -8e8   0.5 1    2 1 1 1     1    0 0 0
        nothing is clamped      | | 8 4 16       0.5 -1   0 9 9 9     1    -7 -3 -15)"))
        for (bool const reflects : {false, true}) {
            Sky<Environment> sky;
            auto const at = [&](std::size_t i) { return c.want[i]; };
            sky.reflection.texel =
                sky.diffuse.texel = [&](Vec3f) { return withAlpha(test::vec3(c.want), 0); };
            Environment& s = sky.shader;
            s.IBLLuminanceFactors = {0.25f, 0.5f, 0.125f};
            (reflects ? s.reflectIBLContrast : s.diffuseIBLContrast) = Vec2f(at(3), at(4));
            (reflects ? s.reflectIBLGainMode : s.diffuseIBLGainMode) = int(at(5));
            (reflects ? s.reflectIBLGain : s.diffuseIBLGain) = test::vec3(c.want, 6);
            (reflects ? s.reflectIBLSaturation : s.diffuseIBLSaturation) = at(9);
            EXPECT_EQ(rgb(sky.look(reflects ? 2 : 32)), test::vec3(c.want, 10)) << c.why;
            EXPECT_EQ(rgb(sky.look(reflects ? 32 : 2)), test::vec3(c.want)) << c.why;
        }
}

TEST(DefaultEnvironment, GradesEachCubeByItsOwnControls) { expectGrades<corvid_Env_Default>(); }
TEST(Backplate, GradesEachCubeByItsOwnControls) { expectGrades<corvid_Env_Backplate>(); }

TEST(DefaultEnvironment, MissingCubesAreBlackAndNanIsGradedNotHidden)
{
    Sky<corvid_Env_Default> sky;
    sky.shader.reflectionCube = {};
    EXPECT_TRUE(test::near(sky.look(2), {0, 0, 0, 1}, 0));
    sky.shader.reflectIBLContrast.y = std::nanf("");
    EXPECT_TRUE(std::isnan(sky.look(2).x));
    EXPECT_EQ(sky.look(2).w, 1.0f);
}

struct Plate : Sky<corvid_Env_Backplate> {
    test::FunctionTexture<Vec2f> image{[](Vec2f uv) { return Vec4f(uv.x, uv.y, 5, 0.9f); }};
    test::FunctionTexture<Vec3f> cube{[](Vec3f d) { return withAlpha(d, 0.9f); }};

    Plate()
    {
        shader.useBackgroundImage = true;
        shader.backgroundImage.texture = &image;
        shader.backplateCube.texture = &cube;
        shader.backplateCubeRotation = Mat3f::identity();
        shader.backplatetransform = Mat4f::identity();
        state.imageHeight = 480;
    }
    /// However deep the ray: this environment has no depth limit.
    Vec4f lookAt(float x, float y, float rayType = 1)
    {
        state.rasterX = x;
        state.rasterY = y;
        return look(rayType, 8);
    }
};

TEST(Backplate, RayTypeAndSwitchesChooseWhatARaySees)
{
    constexpr Vec4f kWant[] = {
        kFlat, {0.5f, 0, 5, 0}, {0, 1, -479.5f, 0}, {0.5f, 0.25f, 1, 1}, {2, 4, 8, 1}};
    // ray type, switches of image, cube and reflection; 0: background, 1: image, 2: cube,
    // 3: reflection, 4: diffuse
    constexpr int kCases[][5] = {{1, 0, 1, 1, 0},  {1, 1, 0, 1, 1},  {4, 1, 0, 1, 1},
                                 {1, 1, 1, 1, 2},  {4, 1, 1, 0, 2},  {4, 0, 0, 1, 0},
                                 {16, 1, 0, 1, 0}, {0, 1, 1, 1, 0},  {2, 1, 1, 1, 3},
                                 {2, 1, 1, 0, 0},  {32, 1, 1, 0, 4}, {32, 0, 0, 1, 4}};
    for (auto const& [rayType, image, cube, reflection, seen] : kCases) {
        SCOPED_TRACE("ray type " + std::to_string(rayType));
        Plate p;
        p.shader.useBackgroundImage = image;
        p.shader.useCubeBackplate = cube;
        p.shader.useCubeReflection = reflection;
        EXPECT_TRUE(test::near(p.lookAt(0.5f, 480, float(rayType)), kWant[seen], 1e-6));
        EXPECT_EQ(p.image.lookups.size() + p.cube.lookups.size() + p.reflection.lookups.size()
                      + p.diffuse.lookups.size(),
                  seen != 0);
    }
}

TEST(Backplate, ScreenImageCoversTheUnitSquareWithItsRim)
{
    // raster, own height (below 0: the image's), offset: inside, uv
    for (test::Line const& c : test::table(R"(
        bottom left               | | 0 480   -1  0 0       1 0 0
        top right: 1 is inside    | | 640 0   -1  0 0       1 1 1
        right of the image        | | 641 0   -1  0 0       0 0 0
        above                     | | 640 -1  -1  0 0       0 0 0
        left                      | | -1 0    -1  0 0       0 0 0
        below                     | | 0 481   -1  0 0       0 0 0
        own height                | | 0 0     240 0 0       1 0 0.5
        height 0 is a height      | | 0 -240  0   0 0       1 0 0.5
        both offsets are added    | | 0 480   -1  0.25 0.5  1 0.25 0.5)")) {
        Plate p;
        p.shader.uv_scale = {1.0f / 640, 1.0f / 480};
        p.shader.uv_offset = {c.want[3], c.want[4]};
        p.shader.render_size = {7, c.want[2]}; // the width is unused
        Vec4f const want = c.want[5] != 0 ? Vec4f(c.want[6], c.want[7], 5, 0) : kFlat;
        EXPECT_TRUE(test::near(p.lookAt(c.want[0], c.want[1]), want, 1e-6)) << c.why;
    }
}

TEST(Backplate, CubeIsSeenThroughTheCameraWindow)
{
    Plate p;
    corvid_Env_Backplate& s = p.shader;
    s.useCubeBackplate = true;
    p.lookAt(0.5f, 0.5f);
    EXPECT_EQ(p.cube.lookups.back(), Vec3f(0, 1, 0)); // centre of the window: straight ahead
    EXPECT_TRUE(std::signbit(p.cube.lookups.back().x));
    // x: (0.25 * 2 + 0.5 - 0.5) * 3 / 2 = 0.75; y: (0.5 - 0.25 - 0.5 * 1.5) * 4 / 2 + 0.5 = -0.5
    s.uv_scale = {2, 1.5f};
    s.uv_offset = {0.5f, 0.25f};
    s.camerawindowsize = {3, 4};
    s.backplateCloseUp = 2;
    s.backplateHorizon = 0.5f;
    s.backplatetransform = Mat4f(1, 2, 3, 9, 4, 5, 6, 9, 7, 8, 10, 9, 9, 9, 9, 9);
    s.backplateCubeRotation = Mat3f(1, 0, 0, 0, 0, 2, 0, -4, 1);
    p.lookAt(0.25f, 0.5f);
    // Rows times (0.75, -0.5, 1): (2.75, 6.5, 11.25); turned: (2.75, 22.5, -14.75); x and y turn
    // round, then (x, z, -y).
    EXPECT_EQ(p.cube.lookups.back(), Vec3f(-2.75f, -14.75f, 22.5f));
}

} // namespace
} // namespace zsi
