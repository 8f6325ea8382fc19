#include "environments/corvid_Env_Backplate.h"
#include "environments/corvid_Env_Default.h"
#include "support/scriptedHost.h"

namespace zsi {
namespace {

using Picture = test::FunctionTexture<Vec2f>;
using Cube = test::FunctionTexture<Vec3f>;

constexpr Vec4f kFlat(0, 0.5f, 0.7f, 0);

template <class Environment>
struct Sky {
    Cube reflection{[](Vec3f) { return Vec4f(0.5f, 0.25f, 1, 0.3f); }};
    Cube diffuse{[](Vec3f) { return Vec4f(2, 4, 8, 0.6f); }};
    Environment shader;
    ShadeState state = test::plainHit();

    Sky()
    {
        shader.reflectionCube.texture = &reflection;
        shader.diffuseCube.texture = &diffuse;
        shader.globalIBLMatrix = Mat3f::identity();
        state.maxRayDepth = 3;
    }
    Vec4f look(std::uint32_t rayType, std::uint32_t depth = 0)
    {
        state.rayType = rayType;
        state.rayDepth = depth;
        shader.shade(nullptr, state); // no service is asked
        return state.Ci;
    }
};

TEST(DefaultEnvironment, RayTypeAndDepthChooseWhatARaySees)
{
    enum Seen { kBackground, kReflection, kDiffuse };
    struct Case {
        std::uint32_t rayType, depth;
        Seen want;
    };
    constexpr Case kCases[] = {
        {1, 0, kBackground},  {4, 2, kBackground}, {16, 0, kBackground}, {0, 0, kBackground},
        {34, 0, kBackground}, {2, 0, kReflection}, {2, 3, kReflection},  {32, 2, kDiffuse},
        {32, 3, kReflection}, {1, 3, kReflection}, {16, 9, kReflection},
    };
    constexpr Vec4f kWant[] = {kFlat, {0.5f, 0.25f, 1, 1}, {2, 4, 8, 1}};
    for (Case const& c : kCases) {
        SCOPED_TRACE("ray type " + std::to_string(c.rayType) + " depth " + std::to_string(c.depth));
        Sky<corvid_Env_Default> sky;
        EXPECT_TRUE(test::near(sky.look(c.rayType, c.depth), kWant[c.want], 1e-6));
        EXPECT_EQ(sky.reflection.lookups.size(), c.want == kReflection);
        EXPECT_EQ(sky.diffuse.lookups.size(), c.want == kDiffuse);
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

struct Grade {
    Vec2f contrast;
    int gainMode;
    Vec3f gain;
    float saturation;

    explicit Grade(test::Random& random)
        : contrast(random.in(0, 1), random.in(0, 2))
        , gainMode(static_cast<int>(random.in(0, 4))) // 3 is none
        , gain(random.color())
        , saturation(random.in(0, 2))
    {
    }
    /// The arithmetic in its stated order, in single precision.
    Vec3f operator()(Vec3f c, Vec3f f) const
    {
        float const lift = contrast.x * (1.0f - contrast.y);
        c = {c.x * contrast.y + lift, c.y * contrast.y + lift, c.z * contrast.y + lift};
        if (gainMode == 2)
            c = gain * (c.z * f.z + (c.x * f.x + c.y * f.y));
        else if (gainMode == 1)
            c = c * gain;
        float const m = ((f.x * c.x + f.y * c.y) + f.z * c.z) * (1.0f - saturation);
        return {c.x * saturation + m, c.y * saturation + m, c.z * saturation + m};
    }
};

TEST(DefaultEnvironment, GradesEachCubeByItsOwnControlsToTheBit)
{
    test::Random random;
    for (int i = 0; i < 2000; ++i) {
        Sky<corvid_Env_Default> sky;
        Vec3f const texel = random.color() * 9;
        sky.reflection.texel = sky.diffuse.texel = [&](Vec3f) { return withAlpha(texel, 0); };
        corvid_Env_Default& s = sky.shader;
        Vec3f const factors = s.IBLLuminanceFactors = random.color();
        Grade const r(random), d(random);
        s.reflectIBLContrast = r.contrast;
        s.reflectIBLGainMode = r.gainMode;
        s.reflectIBLGain = r.gain;
        s.reflectIBLSaturation = r.saturation;
        s.diffuseIBLContrast = d.contrast;
        s.diffuseIBLGainMode = d.gainMode;
        s.diffuseIBLGain = d.gain;
        s.diffuseIBLSaturation = d.saturation;
        ASSERT_EQ(rgb(sky.look(2)), r(texel, factors));
        ASSERT_EQ(rgb(sky.look(32)), d(texel, factors));
    }
}

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
    Picture image{[](Vec2f uv) { return Vec4f(uv.x, uv.y, 5, 0.9f); }};
    Cube cube{[](Vec3f d) { return Vec4f(d.x, d.y, d.z, 0.9f); }};

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
    Vec4f lookAt(float x, float y, std::uint32_t rayType = 1)
    {
        state.rasterX = x;
        state.rasterY = y;
        return look(rayType, 8);
    }
};

TEST(Backplate, RayTypeAndSwitchesChooseWhatARaySees)
{
    enum Seen { kBackground, kImage, kCube, kReflection, kDiffuse };
    struct Case {
        std::uint32_t rayType;
        bool image, cube, reflection;
        Seen want;
    };
    constexpr Case kCases[] = {
        {1, false, true, true, kBackground},  {1, true, false, true, kImage},
        {4, true, false, true, kImage},       {1, true, true, true, kCube},
        {4, true, true, false, kCube},        {4, false, false, true, kBackground},
        {16, true, false, true, kBackground}, {0, true, true, true, kBackground},
        {2, true, true, true, kReflection},   {2, true, true, false, kBackground},
        {32, true, true, false, kDiffuse},    {32, false, false, true, kDiffuse},
    };
    constexpr Vec4f kWant[] = {
        kFlat, {0.5f, 0, 5, 0}, {0, 1, -479.5f, 0}, {0.5f, 0.25f, 1, 1}, {2, 4, 8, 1}};
    for (Case const& c : kCases) {
        SCOPED_TRACE("ray type " + std::to_string(c.rayType));
        Plate p;
        p.shader.useBackgroundImage = c.image;
        p.shader.useCubeBackplate = c.cube;
        p.shader.useCubeReflection = c.reflection;
        EXPECT_TRUE(test::near(p.lookAt(0.5f, 480, c.rayType), kWant[c.want], 1e-6));
        EXPECT_EQ(p.image.lookups.size() + p.cube.lookups.size() + p.reflection.lookups.size()
                      + p.diffuse.lookups.size(),
                  c.want != kBackground);
    }
}

TEST(Backplate, ScreenImageCoversTheUnitSquareWithItsRim)
{
    struct Case {
        char const* why;
        float x, y;
        Vec2f renderSize, offset;
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
        Plate p;
        p.shader.uv_scale = {1.0f / 640, 1.0f / 480};
        p.shader.uv_offset = c.offset;
        p.shader.render_size = c.renderSize;
        Vec4f const want = c.inside ? Vec4f(c.uv.x, c.uv.y, 5, 0) : kFlat;
        EXPECT_TRUE(test::near(p.lookAt(c.x, c.y), want, 1e-6)) << c.why;
    }
}

TEST(Backplate, CubeIsSeenThroughTheCameraWindow)
{
    Plate p;
    p.shader.useCubeBackplate = true;
    p.lookAt(0.5f, 0.5f);
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
        p.lookAt(x, y);
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
        // Some twenty roundings of terms below 30.
        ASSERT_TRUE(test::near(p.cube.lookups.back(), {-r[0], r[2], r[1]}, 4e-5));
    }
}

} // namespace
} // namespace zsi
