#include "environments/BackgroundGeometry.h"
#include "support/scriptedHost.h"

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
    struct Case {
        char const* why;
        Vec3f I;
        float alpha;
        bool kept;
        int through;
    };
    Case const cases[] = {
        {"front", {0, 0, -1}, 1.0f, true, 0},         {"back", {0, 0, 1}, 1.0f, false, 0},
        {"edge on", {1, 0, 0}, 1.0f, false, 0},       {"cut out", {0, 0, -1}, 0.04f, false, 0},
        {"at the limit", {0, 0, -1}, 0.05f, true, 1}, {"half clear", {0, 0, -1}, 0.5f, true, 1},
    };
    for (Case const& c : cases) {
        SCOPED_TRACE(c.why);
        Picture picture([&](Vec2f) { return Vec4f(0.2f, 0.4f, 0.6f, c.alpha); });
        Ground g;
        g.state.I = c.I;
        g.shader.diffuseMode = 1;
        g.shader.diffuseTexture.texture = &picture;
        g.host.addLight({0, 0, 1}, {1, 1, 1});
        g.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 2, 3, 0.5f); };
        float const a = c.alpha, b = 1 - c.alpha;
        Vec3f const seen = Vec3f(0.2f, 0.4f, 0.6f) * a + Vec3f(1, 2, 3) * b;
        EXPECT_TRUE(test::near(g.shade(),
                               c.kept ? withAlpha(seen, a + 0.5f * b) : Vec4f(7, 7, 7, 7), 1e-6));
        EXPECT_EQ(g.state.discardHit, c.kept ? 0 : 1);
        ASSERT_EQ(g.host.count("traceThrough"), c.through);
        EXPECT_TRUE(!c.through || g.host.calls[0].scalars[0] == 1.0f) << "importance";
    }
}

/// White ground under one light of (4, 2, 1) with weight 1/2, one of (0, 0, 2) behind the smooth
/// normal's rim, and a sky of (0.5, 1, 0) that is half open.
TEST(BackgroundGeometry, LightsAddUpInTheirShadowAndTheSkyInItsOcclusion)
{
    struct Case {
        char const* why;
        Vec3f shadow, tint;
        float intensity;
        bool sky;
        Vec3d want;
    };
    constexpr Case kCases[] = {
        {"open", {1, 1, 1}, {0, 0, 0}, 1, false, {2, 1, 2.5}},
        {"sky", {1, 1, 1}, {0, 0, 0}, 1, true, {2.25, 1.5, 2.5}},
        {"shadow", {0, 0.5f, 1}, {0, 0, 0}, 1, true, {0.25, 1, 2.5}},
        {"half as strong", {0, 0.5f, 1}, {0, 0, 0}, 0.5f, true, {1.25, 1.25, 2.5}},
        {"tinted", {0, 0.5f, 0}, {0.5f, 0, 1}, 1, false, {1, 0.5, 2.5}},
    };
    for (std::uint32_t const rayType : {1u, 2u, 4u, 32u})
        for (Case const& c : kCases) {
            Ground g;
            g.state.rayType = rayType;
            g.shader.diffuseColor = {1, 1, 1};
            g.shader.shadowColor = c.tint;
            g.shader.shadowIntensity = c.intensity;
            g.host.addLight({0, 0.6f, 0.8f}, {4, 2, 1}, c.shadow, 0.5f);
            g.host.addLight({1, 0, 0}, {0, 0, 2}, {1, 1, 1}, 1);
            g.host.onOcclusion = [](Vec3f, Vec3f) { return Vec3f(0.5f, 0.5f, 0.5f); };
            Cube cube([](Vec3f at) { return Vec4f(0.25f * at.y, 0.5f, 0, 1); }); // up is y
            if (c.sky)
                g.shader.diffuseCube.texture = &cube;
            g.shader.globalIBLGainValue = 4;
            g.shader.diffuseIBLGainValue = 0.5f;
            EXPECT_TRUE(shows(g, c.want)) << c.why << rayType;
            EXPECT_EQ(g.host.calls[0].scalars[0], 0.0f); // the common list
            g.shader.diffuseColor = {0.5f, 0, 0.25f}; // the picture scales all of it
            EXPECT_TRUE(shows(g, {c.want.x / 2, 0, c.want.z / 4})) << c.why;
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

TEST(BackgroundGeometry, BumpTiltsTheNormalAlongRisingTextureCoordinates)
{
    // A texel that leans towards rising u at 45 degrees, then one that leans towards rising v.
    test::Random random;
    for (int i = 0; i < 400; ++i) {
        int const mode = 1 + i % 4;
        bool const alongU = i % 8 < 4;
        Picture bump([&](Vec2f) { return alongU ? Vec4f(1, 0.5f, 1, 1) : Vec4f(0.5f, 1, 1, 1); });
        Ground g;
        BackgroundGeometry& s = g.shader;
        s.bumpMode = mode;
        s.bumpTexture.texture = &bump;
        // A rotation about z of everything, the texture transform turned by another.
        auto const turn = [](float a, float scale) {
            float const c = std::cos(a) * scale, n = std::sin(a) * scale;
            return Mat4f(c, n, 0, 0, -n, c, 0, 0, 0, 0, scale, 0, 0, 0, 0, 1);
        };
        float const a = random.in(-3, 3), scale = random.in(0.5f, 3);
        s.bumpTextureMatrix = turn(a, scale);
        s.bumpTextureMatrixInverse = turn(-a, 1 / scale);
        s.bumpUVMatrix = Mat3f(s.bumpTextureMatrix);
        g.state.objectToWorld = turn(random.in(-3, 3), 2);
        test::setAttribute(g.state, 8, Vec3f(1, 0, 0)); // uv = object xy
        test::setAttribute(g.state, 20, Vec3f(0, 1, 0));
        // Angular: the cylinder's wall, seen from where its normal is; others: the xy plane.
        Vec3f object(random.in(-1, 1), random.in(-1, 1), random.in(-1, 1));
        Vec3f normal(0, 0, 1);
        if (mode == 4) {
            // tangentU is taken about the origin: far out, it and the seam's axis agree.
            object = object * 1e4f;
            normal = normalize(Vec3f(object.x, object.y, 0));
        }
        g.state.Pref = object;
        g.state.Nref = normal;
        Vec3f const n = normalize(transformDirection(g.state.objectToWorld, normal));
        g.state.N = g.state.Ng = n;
        g.state.I = -n;
        g.state.rayType = i % 3 ? 1 : 32; // whatever the ray
        Vec3f seen(0, 0, 0);
        g.host.onOcclusion = [&](Vec3f, Vec3f N) { return seen = N, Vec3f(1, 1, 1); };
        g.shade();
        EXPECT_NEAR(dot(seen, n), std::sqrt(0.5f), 1e-5f) << "mode " << mode;
        // A step along the lean, on the surface, must raise that texture coordinate by most.
        Vec3f const lean = normalize(seen - dot(seen, n) * n);
        Mat3f back(g.state.objectToWorld); // transposed: a rotation's inverse, up to scale
        std::swap(back.m[1], back.m[3]);
        Vec3f const step = transformDirection(back, lean) * (mode == 4 ? 10.0f : 1e-2f);
        auto const coordinate = [&](Vec3f p) {
            Picture probe([](Vec2f at) { return Vec4f(at.x, at.y, 0, 1); });
            TextureSampler2D sampler;
            sampler.texture = &probe;
            Vec3i axes;
            Vec3f u, v;
            Vec4f const t =
                s.f_evalMapping(nullptr, g.state, mode, {}, sampler, s.bumpTextureMatrix, 1, p,
                                normal, false, {p.x, p.y}, axes, u, v, s.bumpUVMatrix);
            return Vec2f(t.x, t.y);
        };
        Vec2f const rise = coordinate(object + step) - coordinate(object);
        if (mode == 4 && std::fabs(rise.x) > 0.5f)
            continue; // across the seam
        float const along = alongU ? rise.x : rise.y, across = alongU ? rise.y : rise.x;
        EXPECT_GT(along, 0.0f) << "mode " << mode;
        if (mode != 4) {
            EXPECT_LT(std::fabs(across), 1e-3f * along) << "mode " << mode;
        }
    }
}

TEST(BackgroundGeometry, ReflectivityIsSplitBetweenBlurredAndSharp)
{
    test::Random random;
    Cube one([](Vec3f) { return Vec4f(1, 1, 1, 1); });
    for (int i = 0; i < 200; ++i) {
        Ground g;
        float const c = random.in(0.05f, 1);
        g.state.I = {std::sqrt(1 - c * c), 0, -c};
        g.shader.diffuseColor = {0, 0, 0};
        g.shader.specularColor = {0.1f, 0.2f, 0.3f};
        g.host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
        g.shader.specularCube.texture = &one;
        g.shader.useCubeReflection = i % 2;
        g.shader.reflectCube.texture = &one;
        EXPECT_TRUE(shows(g, Vec3f(0.1f, 0.2f, 0.3f))); // in a white room, the reflectivity
        EXPECT_EQ(g.host.count("traceReflection"), i % 2 ? 0 : 1);
        g.shader.specularCube = {};
        float const sharp = std::pow(1 - c, 5.0f); // only the sharp share is left
        EXPECT_TRUE(shows(g, Vec3f(0.1f, 0.2f, 0.3f) * sharp));
        if (i % 2 == 0) {
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

TEST(BackgroundGeometry, ShadowRaysStopAtGroundThatFacesUp)
{
    struct Case {
        std::uint32_t rayType;
        float nz, want;
    };
    constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
    constexpr Case kCases[] = {{16, 0.9f, 0}, {16, 0.89f, 1}, {16, 1, 0}, {16, -1, 1},
                               {16, kNan, 0}, {1, 1, 1},      {32, 1, 1}};
    for (Case const& c : kCases) {
        Ground g;
        g.state.rayType = c.rayType;
        g.state.N = {0, 0, c.nz};
        g.shader.transmission(&g.host, g.state);
        EXPECT_EQ(g.state.transmissionColor, Vec3f(c.want, c.want, c.want)) << c.nz;
    }
    Ground g;
    g.shader.sample(&g.host, g.state);
    EXPECT_EQ(g.state.sampleDirection, g.state.I);
}

} // namespace
} // namespace zsi
