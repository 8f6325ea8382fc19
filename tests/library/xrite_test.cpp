#include "materials/legacy/XRite.h"
#include "support/lobeSampling.h"
#include "support/scriptedHost.h"

#include <bit>

namespace zsi {
namespace {

using Texture = test::FunctionTexture<Vec2f>;
using Cube = test::FunctionTexture<Vec3f>;

double d(float v) { return static_cast<double>(v); }

using Paint = test::Trial<XRite>;

TEST(CarPaint, FresnelCurveAndTransferCurve)
{
    Paint p;
    XRite const& s = p.shader;
    auto const f = [&](float z) {
        return s.f_fast_fresnel(&p.host, p.state, {5, 5, z}, s.fresnel);
    };
    EXPECT_EQ(f(1), 0.04f);
    EXPECT_EQ(f(3), 0.04f);
    EXPECT_FLOAT_EQ(f(0), 0.94f);
    EXPECT_EQ(f(-1), f(0));
    EXPECT_NEAR(f(0.5f), 0.04 + 0.9 * 0.17677670, 1e-7);
    EXPECT_EQ(s.f_fast_fresnel(&p.host, p.state, {0, 0, 0}, {0.5f, 0.9f, 1, 0.75f}), 0.75f);

    auto const curve = [&](float x) { return s.f_r709tosRGB(&p.host, p.state, {x, 0, 1}); };
    EXPECT_EQ(curve(0.0031308f).x, 12.92f * 0.0031308f); // the linear branch holds its end
    EXPECT_GT(curve(0.0031309f).x, 0.04044f);
    EXPECT_EQ(curve(-1).x, -12.92f);
    test::Random random;
    for (int i = 0; i < 1000; ++i) {
        float const x = random.in(0.004f, 4);
        // The exponent to the bit: its neighbour would differ in most results.
        float const want = 1.055f * std::pow(x, std::bit_cast<float>(0x3ED55556u)) - 0.055f;
        ASSERT_EQ(curve(x).x, want);
        ASSERT_NEAR(d(want), 1.055 * std::pow(d(x), 1 / 2.4) - 0.055, 2e-6);
    }
}

TEST(CarPaint, FlakeNormalsAndMaskAreReadAsStored)
{
    Paint p;
    EXPECT_EQ(p.shader.f_getFlakeNormal(&p.host, p.state, {0.3f, 0.4f}), Vec3f(-1, -1, 0));
    Texture normals([](Vec2f uv) { return Vec4f(uv.x, uv.y, 0.9f, 0); });
    p.shader.flakeNormalTexture.texture = &normals;
    EXPECT_EQ(p.shader.f_getFlakeNormal(&p.host, p.state, {0.25f, 1}), Vec3f(-0.5f, 1, 0.9f));

    p.shader.maskingColor = {0.1f, 0.5f, 1};
    p.shader.transmission(&p.host, p.state);
    EXPECT_EQ(p.state.transmissionColor, Vec3f(0.1f, 0.5f, 1));
    p.shader.maskingMode = 1; // the map is read at the "uv" attribute
    p.shader.maskingUVMatrix = Mat3f::identity();
    p.shader.maskingTexture.texture = &normals;
    test::setAttribute(p.state, 24, Vec2f(0.25f, 0.75f));
    p.shader.transmission(&p.host, p.state);
    EXPECT_EQ(p.state.transmissionColor, Vec3f(0.25f, 0.75f, 0.9f));
    p.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 1, 1, 0.5f); };
    EXPECT_TRUE(test::near(p.shade(), {0.25f, 0.75f, 0.9f, 0.5f}, 1e-6)); // black: the mask alone
}

TEST(CarPaint, SolidPaintIsTheBaseUnderTheCoatAndReadsNoFlakes)
{
    Texture normals([](Vec2f) { return Vec4f(0.5f, 0.5f, 1, 1); });
    Paint p;
    XRite& s = p.shader;
    s.flakeNormalTexture.texture = &normals;
    s.xriteIsSolid = true;
    s.xriteDiffuse = {1, 1, 1};
    s.diffIntensity = 0.5f;
    float const r = std::sqrt(0.75f);
    p.host.addLight({r, 0, 0.5f}, {2, 1, 4}, {0.5f, 1, 0.25f}, 0.5f);
    // Far from the mirror direction the coat's highlight is below 1e-4 of this.
    EXPECT_TRUE(test::near(rgb(p.shade()), grey(0.96f * 0.5f * 0.5f), 2e-3));
    EXPECT_EQ(p.host.count("getLightSamples"), 1);
    EXPECT_EQ(p.host.calls[0].scalars[0], -2.0f);

    // In a white room: base, and 0.04 mirrored, whether by cubes or by the host.
    Cube white([](Vec3f) { return Vec4f(1, 1, 1, 1); });
    p.host.lights.clear();
    for (bool cubes : {false, true}) {
        Paint room;
        room.shader = s;
        room.host.onTrace = room.host.onIndirect = [&](Vec3f, Vec3f) {
            return cubes ? Vec3f(9, 9, 9) : Vec3f(1, 1, 1);
        };
        if (cubes)
            room.shader.diffuseCube.texture = room.shader.reflectCube.texture =
                room.shader.specularCube.texture = &white;
        EXPECT_NEAR(room.shade().x, 0.96f * 0.5f + 0.04f, 1e-6f);
        room.shader.ambientOcclusionMode = 2; // vertex colour 0: fully occluded
        EXPECT_NEAR(room.shade().x, cubes ? 0.0f : 0.04f, 1e-6f);
    }
    EXPECT_TRUE(normals.lookups.empty());
}

/// Flake slopes as their widths assume: Gaussian, mean square 0.1.
Vec4f gaussianFlake(Vec2f at)
{
    float const r = std::sqrt(-0.1f * std::log(1 - at.x)), phi = 6.2831853f * at.y;
    float const z = 1 / std::sqrt(1 + r * r);
    return {0.5f + 0.5f * r * z * std::cos(phi), 0.5f + 0.5f * r * z * std::sin(phi), z, 1};
}

/// Mean and deviation of one spot of paint over its flakes, from `distance`.
struct Look {
    double mean = 0, deviation = 0;
    Look(float distance, Vec3f L, float coarseness = 0.656f)
    {
        Texture normals(gaussianFlake);
        Paint p;
        p.shader.flakeNormalTexture.texture = &normals;
        p.shader.coarseness = coarseness;
        p.shader.flakeColor2 = p.shader.flakeColor;
        p.shader.fresnel = {0, 0, 1, 1}; // no coat
        p.state.E = {0, 0, distance};
        p.host.addLight(normalize(L), {1, 1, 1});
        test::Random random;
        double squares = 0;
        constexpr int kSpots = 4000;
        for (int i = 0; i < kSpots; ++i) {
            test::setAttribute(p.state, 24, Vec2f(random.in(0, 1), random.in(0, 1)));
            normals.lookups.clear();
            double const x = d(p.shade().x);
            EXPECT_LE(normals.lookups.size(), 7u);
            mean += x / kSpots;
            squares += x * x / kSpots;
        }
        deviation = std::sqrt(std::fmax(0.0, squares - mean * mean));
    }
};

/// A flake is 1/2048 wide at the defaults, a pixel a thousandth of the distance.
TEST(CarPaint, FlakesGlintNearAndFadeFarWithTheSameBrightness)
{
    for (Vec3f const L : {Vec3f(0, 0, 1), Vec3f(0.5f, 0, 1), Vec3f(1, 1, 1)}) {
        Look const near(0.1f, L), middle(2, L), far(20, L), horizon(1e4f, L);
        EXPECT_GT(near.deviation, 0.5 * near.mean);
        EXPECT_LT(middle.deviation, 0.5 * near.deviation);
        EXPECT_LT(far.deviation, 0.1 * near.deviation);
        EXPECT_LT(horizon.deviation, 1e-3 * near.deviation);
        // Four standard errors of the near mean.
        double const error = 4 * near.deviation / std::sqrt(4000.0);
        EXPECT_NEAR(near.mean, far.mean, error) << L.x;
        EXPECT_NEAR(middle.mean, far.mean, error) << L.x;
        Look const flat(0.1f, L, 0); // coarseness 0; the root of what double cancels
        EXPECT_LE(flat.deviation, 1e-6 * flat.mean);
    }
}

/// White paint under a dome of lights shows what it shows in a white room.
TEST(CarPaint, LightsBringAsMuchAsTheRoom)
{
    struct Case {
        char const* why;
        bool solid, texture;
        float distance, coarseness;
        double width; // of the lobe
    };
    constexpr Case kCases[] = {{"solid", true, false, 1, 1, 0.04},
                               {"flat flakes, near", false, false, 0.01f, 1, 0.1},
                               {"flat flakes, far", false, false, 1e4f, 1, 0.1},
                               {"flakes that lean, far", false, true, 1e4f, 0.656f, 0.23},
                               {"as much as can be", false, true, 1e4f, 1e30f, 0.95}};
    Texture normals(gaussianFlake);
    for (Case const& c : kCases)
        for (double const cosine : {1.0, 0.5, 0.26, 0.1}) {
            Paint p;
            XRite& s = p.shader;
            s.xriteIsSolid = c.solid;
            s.coarseness = c.coarseness;
            if (!c.solid)
                s.fresnel = {0, 0, 1, 1}; // no coat: the grid fits one lobe
            s.contributionFactor = 1;
            s.xriteDiffuse = grey(c.solid ? 1.0f : 0.0f);
            s.flakeColor = s.flakeColor2 = {1, 1, 1};
            if (c.texture)
                s.flakeNormalTexture.texture = &normals;
            double const sine = std::sqrt(1 - cosine * cosine);
            p.state.I = test::toFloat({sine, 0, -cosine});
            p.state.E = p.state.P - p.state.I * c.distance;
            p.host.onTrace = p.host.onIndirect = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
            EXPECT_NEAR(p.shade().x, 1, 1e-5) << c.why;
            p.host.onTrace = p.host.onIndirect = nullptr;
            p.host.addLight({0, 0, 1}, {1, 1, 1});
            double const dome = test::hemisphere(
                {c.width / 2, c.width / 2, {-sine, 0, cosine}}, 120, [&](test::Vec3d l) {
                    p.host.lights[0].L = test::toFloat(l);
                    p.host.lights[0].weight = float(l.z);
                    return l.z > 0 ? d(p.shade().x) / (M_PI * l.z) : 0;
                });
            EXPECT_NEAR(dome, 1, 0.012) << c.why << ' ' << cosine;
        }
}

TEST(CarPaint, BrokenInputIsNeutral)
{
    constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
    Texture normals(gaussianFlake);
    auto const shown = [&](float XRite::*number, Vec3f XRite::*color, float value) {
        Paint p;
        p.shader.flakeNormalTexture.texture = &normals;
        (number ? p.shader.*number : (p.shader.*color).y) = value;
        p.host.onTrace = p.host.onIndirect = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
        p.host.addLight({0, 0.6f, 0.8f}, {1, 1, 1});
        return rgb(p.shade());
    };
    for (float const value : {-1.0f, kNan, -1e30f}) {
        for (auto color : {&XRite::xriteDiffuse, &XRite::flakeColor, &XRite::flakeColor2})
            EXPECT_EQ(shown(nullptr, color, value), shown(nullptr, color, 0)) << value;
        for (auto number :
             {&XRite::specIntensity, &XRite::diffIntensity, &XRite::contributionFactor})
            EXPECT_EQ(shown(number, nullptr, value), shown(number, nullptr, 0)) << value;
    }
    EXPECT_EQ(shown(&XRite::coarseness, nullptr, kNan), shown(&XRite::coarseness, nullptr, 0));
    for (float const value : {1e30f, -1e30f, std::numeric_limits<float>::infinity()}) {
        float const most = std::copysign(3.0f, value);
        EXPECT_EQ(shown(&XRite::coarseness, nullptr, value),
                  shown(&XRite::coarseness, nullptr, most));
        Vec3f const most3 = shown(&XRite::specIntensity, nullptr, std::fabs(value));
        EXPECT_TRUE(std::isfinite(most3.x) && most3.x > 0);
    }
}

TEST(CarPaint, FlakeShapeStaysWithTheSurface)
{
    // Within one flake the colour is one; over many, flakes differ.
    Texture normals(gaussianFlake);
    Paint p;
    p.shader.flakeNormalTexture.texture = &normals;
    p.state.E = {0, 0, 0.01f};
    p.host.addLight({0, 0, 1}, {1, 1, 1});
    int changes = 0;
    float last = 0;
    constexpr int kSteps = 4000;
    for (int i = 0; i < kSteps; ++i) {
        test::setAttribute(p.state, 24, Vec2f(static_cast<float>(i) / kSteps * 0.05f, 0.3f));
        float const x = p.shade().x;
        changes += i > 0 && x != last;
        last = x;
    }
    // 0.05 units of 2048 flakes are 102 cells; a line crosses about 4/pi edges of a Voronoi
    // pattern of unit density per unit length (Moller 1989).
    EXPECT_NEAR(changes, 130, 30);
}

} // namespace
} // namespace zsi
