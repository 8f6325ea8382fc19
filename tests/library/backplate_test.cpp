#include "environments/corvid_Env_Backplate.h"
#include "support/record.h"
#include "support/scriptedHost.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

struct Plate {
    test::FunctionTexture<Vec2f> image{[](Vec2f uv) { return Vec4f(uv.x, uv.y, 5, 0.9f); }};
    test::FunctionTexture<Vec3f> cube{[](Vec3f d) { return Vec4f(d.x, d.y, d.z, 0.9f); }};
    test::FunctionTexture<Vec3f> reflection{[](Vec3f) { return Vec4f(0.5f, 0.25f, 1, 0.3f); }};
    test::FunctionTexture<Vec3f> diffuse{[](Vec3f) { return Vec4f(2, 4, 8, 0.6f); }};
    corvid_Env_Backplate shader;
    ShadeState state = test::plainHit();

    Plate()
    {
        shader.backgroundImage.texture = &image;
        shader.backplateCube.texture = &cube;
        shader.reflectionCube.texture = &reflection;
        shader.diffuseCube.texture = &diffuse;
        shader.globalIBLMatrix = shader.backplateCubeRotation = Mat3f::identity();
        shader.backplatetransform = Mat4f::identity();
        state.imageHeight = 480;
    }
    Vec4f look(std::uint32_t rayType, float x = 0, float y = 0)
    {
        state.rayType = rayType;
        state.rasterX = x;
        state.rasterY = y;
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

TEST(Backplate, RayTypeAndSwitchesChooseWhatARaySees)
{
    enum Seen { kFlat, kImage, kCube, kReflection, kDiffuse };
    struct Case {
        std::uint32_t rayType;
        bool image, cube, reflection;
        Seen want;
    };
    constexpr Case kCases[] = {
        {1, false, false, true, kFlat},     {1, false, true, true, kFlat},
        {1, true, false, true, kImage},     {4, true, false, true, kImage},
        {1, true, true, true, kCube},       {4, true, true, false, kCube},
        {4, false, false, true, kFlat},     {16, true, false, true, kFlat},
        {0, true, true, true, kFlat},       {2, true, true, true, kReflection},
        {2, true, true, false, kFlat},      {32, true, true, false, kDiffuse},
        {32, false, false, true, kDiffuse},
    };
    for (Case const& c : kCases)
        for (std::uint32_t depth : {0u, 8u}) { // this environment has no depth limit
            SCOPED_TRACE("ray type " + std::to_string(c.rayType));
            Plate p;
            p.shader.useBackgroundImage = c.image;
            p.shader.useCubeBackplate = c.cube;
            p.shader.useCubeReflection = c.reflection;
            p.shader.reflectIBLGainMode = 1; // each path has its own controls
            p.shader.reflectIBLGain = {2, 2, 2};
            p.shader.diffuseIBLSaturation = 0.0f;
            p.shader.IBLLuminanceFactors = {0.25f, 0.5f, 0.125f};
            p.state.rayDepth = depth;
            Vec4f const got = p.look(c.rayType, 0.5f, 480);
            constexpr Vec4f kWant[] = {{0, 0.5f, 0.7f, 0},
                                       {0.5f, 0, 5, 0},
                                       {0, 1, -479.5f, 0},
                                       {1, 0.5f, 2, 1},
                                       {3.5f, 3.5f, 3.5f, 1}};
            expectColor(got, kWant[c.want]);
            EXPECT_EQ(p.image.lookups.size(), c.want == kImage);
            EXPECT_EQ(p.cube.lookups.size(), c.want == kCube);
            EXPECT_EQ(p.reflection.lookups.size(), c.want == kReflection);
            EXPECT_EQ(p.diffuse.lookups.size(), c.want == kDiffuse);
        }
}

TEST(Backplate, ScreenImageCoversTheUnitSquareWithItsRim)
{
    struct Case {
        char const* why;
        float x, y;
        Vec2f renderSize;
        Vec2f offset;
        bool inside;
        Vec2f uv;
    };
    constexpr Case kCases[] = {
        {"bottom left", 0, 480, {-1, -1}, {0, 0}, true, {0, 0}},
        {"top right: 1 is inside", 640, 0, {-1, -1}, {0, 0}, true, {1, 1}},
        {"right of the image", 641, 0, {-1, -1}, {0, 0}, false, {}},
        {"above", 640, -1, {-1, -1}, {0, 0}, false, {}},
        {"left", -1, 0, {-1, -1}, {0, 0}, false, {}},
        {"below", 0, 481, {-1, -1}, {0, 0}, false, {}},
        {"own height, width unused", 0, 0, {7, 240}, {0, 0}, true, {0, 0.5f}},
        {"height 0 is a height", 0, -240, {-1, 0}, {0, 0}, true, {0, 0.5f}},
        {"both offsets are added", 0, 480, {-1, -1}, {0.25f, 0.5f}, true, {0.25f, 0.5f}},
    };
    for (Case const& c : kCases) {
        SCOPED_TRACE(c.why);
        Plate p;
        p.shader.useBackgroundImage = true;
        p.shader.uv_scale = {1.0f / 640, 1.0f / 480};
        p.shader.uv_offset = c.offset;
        p.shader.render_size = c.renderSize;
        expectColor(p.look(1, c.x, c.y),
                    c.inside ? Vec4f(c.uv.x, c.uv.y, 5, 0) : Vec4f(0, 0.5f, 0.7f, 0));
    }
    Plate empty;
    empty.shader.useBackgroundImage = true;
    empty.shader.backgroundImage = {};
    expectColor(empty.look(1, 0, 480), {0, 0, 0, 0});
}

TEST(Backplate, CubeIsSeenThroughTheCameraWindow)
{
    Plate p;
    p.shader.useBackgroundImage = p.shader.useCubeBackplate = true;
    p.look(1, 0.5f, 0.5f);
    EXPECT_EQ(p.cube.lookups.back(), Vec3f(0, 1, 0)); // centre of the window: straight ahead
    EXPECT_TRUE(std::signbit(p.cube.lookups.back().x));
    test::Random random;
    for (int i = 0; i < 1000; ++i) {
        corvid_Env_Backplate& s = p.shader;
        s.uv_scale = {random.in(0, 2), random.in(0, 2)};
        s.uv_offset = {random.in(-1, 1), random.in(-1, 1)};
        s.camerawindowsize = {random.in(0.1f, 2), random.in(0.1f, 2)};
        s.backplateCloseUp = random.in(0.5f, 2);
        s.backplateHorizon = random.in(-1, 1);
        for (float& m : s.backplatetransform.m)
            m = random.in(-1, 1);
        for (float& m : s.backplateCubeRotation.m)
            m = random.in(-1, 1);
        float const x = random.in(0, 1), y = random.in(0, 1);
        p.look(1, x, y);
        // The window's point in double: centred, scaled by its size over the zoom, then lifted.
        auto const d = [](float v) { return static_cast<double>(v); };
        double const zoom = d(s.backplateCloseUp);
        double const window[3] = {
            (d(x) * d(s.uv_scale.x) + d(s.uv_offset.x) - 0.5) * d(s.camerawindowsize.x) / zoom,
            (0.5 - d(s.uv_offset.y) - d(y) * d(s.uv_scale.y)) * d(s.camerawindowsize.y) / zoom
                + d(s.backplateHorizon),
            1.0};
        double placed[3] = {}, r[3] = {};
        for (int k = 0; k < 9; ++k)
            placed[k / 3] += d(s.backplatetransform.m[k / 3 * 4 + k % 3]) * window[k % 3];
        for (int k = 0; k < 9; ++k)
            r[k / 3] += d(s.backplateCubeRotation.m[k]) * placed[k % 3];
        Vec3f const got = p.cube.lookups.back();
        // Some twenty roundings of terms below 30.
        ASSERT_NEAR(got.x, -r[0], 4e-5);
        ASSERT_NEAR(got.y, r[2], 4e-5);
        ASSERT_NEAR(got.z, r[1], 4e-5);
    }
}

} // namespace
} // namespace zsi
