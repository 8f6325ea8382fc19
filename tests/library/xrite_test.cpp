// SPDX-License-Identifier: Apache-2.0
// The measured car paint: its curves, flakes near and far, and the light that each part brings.
#include "materials/legacy/XRite.h"
#include "support/lobeSampling.h"
#include "support/textTable.h"

#include <bit>

namespace zsi {
namespace {

constexpr Vec3f kWhite(1, 1, 1);

struct Paint : test::Subject {
    explicit Paint(std::string const& settings = "")
        : Subject("XRite")
    {
        set(settings);
        test::setAttribute(state, byName.at("vtxcolor").offset, Vec4f(0.5f, 0, 0, 1)); // half open
    }
    void whiteRoom() { set("trace=1,1,1 indirect=1,1,1"); }
    /// Slopes as the widths of the flakes assume: Gaussian, mean square 0.1.
    auto& gaussianFlakes()
    {
        return texture("flakeNormalTexture", [](Vec2f at) {
            float const r = std::sqrt(-0.1f * std::log(1 - at.x)), phi = 6.2831853f * at.y;
            float const z = 1 / std::sqrt(1 + r * r);
            return Vec4f(0.5f + 0.5f * r * z * std::cos(phi), 0.5f + 0.5f * r * z * std::sin(phi),
                         z, 1);
        });
    }
};

TEST(CarPaint, FunctionsOfCurvesAndFlakes)
{
    XRite s;
    test::ScriptedHost host;
    ShadeState const state = test::plainHit();
    auto const f = [&](float z) { return s.f_fast_fresnel(&host, state, {5, 5, z}, s.fresnel); };
    EXPECT_EQ(f(3), 0.04f);
    EXPECT_FLOAT_EQ(f(-1), 0.94f);
    EXPECT_NEAR(f(0.5f), 0.04 + 0.9 * 0.17677670, 1e-7);
    EXPECT_EQ(s.f_fast_fresnel(&host, state, {0, 0, 0}, {0.5f, 0.9f, 1, 0.75f}), 0.75f);

    auto const curve = [&](float x) { return s.f_r709tosRGB(&host, state, {x, 0, 1}).x; };
    EXPECT_EQ(curve(0.0031308f), 12.92f * 0.0031308f); // the linear branch holds its end
    EXPECT_GT(curve(0.0031309f), 0.04044f);
    EXPECT_EQ(curve(-1), -12.92f);
    for (int i = 1; i < 1000; ++i) {
        float const x = static_cast<float>(i) * 0.004f;
        // The exponent to the bit: its neighbour would differ in most results.
        ASSERT_EQ(curve(x), 1.055f * std::pow(x, std::bit_cast<float>(0x3ED55556u)) - 0.055f);
    }
    EXPECT_EQ(s.f_getFlakeNormal(&host, state, {0.3f, 0.4f}), Vec3f(-1, -1, 0));
    test::FunctionTexture<Vec2f> normals([](Vec2f uv) { return Vec4f(uv.x, uv.y, 0.9f, 0); });
    s.flakeNormalTexture.texture = &normals;
    EXPECT_EQ(s.f_getFlakeNormal(&host, state, {0.25f, 1}), Vec3f(-0.5f, 1, 0.9f));
}

/// A flake is 1/2048 wide at the defaults, a pixel a thousandth of the distance.
TEST(CarPaint, FlakesGlintNearAndFadeFarWithTheSameBrightness)
{
    test::Random random;
    struct Look {
        double mean = 0, deviation = 0;
    };
    auto const look = [&](float distance, Vec3f L) {
        Paint p("flakeColor=.1,.1,.1 flakeColor2=.1,.1,.1 fresnel=0,0,1,1");
        auto& normals = p.gaussianFlakes();
        p.state.E = {0, 0, distance};
        p.host.addLight(normalize(L), kWhite);
        Look seen;
        double squares = 0;
        constexpr int kSpots = 4000;
        for (int i = 0; i < kSpots; ++i) {
            p.attribute("uv", Vec2f(random.in(0, 1), random.in(0, 1)));
            normals.lookups.clear();
            double const x = double(p.shade().x);
            EXPECT_LE(normals.lookups.size(), 7u);
            seen.mean += x / kSpots;
            squares += x * x / kSpots;
        }
        seen.deviation = std::sqrt(std::fmax(0.0, squares - seen.mean * seen.mean));
        return seen;
    };
    for (Vec3f const L : {Vec3f(0, 0, 1), Vec3f(0.5f, 0, 1), Vec3f(1, 1, 1)}) {
        Look const near = look(0.1f, L), middle = look(2, L), far = look(20, L);
        EXPECT_GT(near.deviation, 0.5 * near.mean);
        EXPECT_LT(middle.deviation, 0.5 * near.deviation);
        EXPECT_LT(far.deviation, 0.1 * near.deviation);
        EXPECT_LT(look(1e4f, L).deviation, 1e-3 * near.deviation);
        double const error = 4 * near.deviation / std::sqrt(4000.0); // four standard errors
        EXPECT_NEAR(near.mean, far.mean, error) << L.x;
        EXPECT_NEAR(middle.mean, far.mean, error) << L.x;
    }
    // Within one flake the colour is one; over many, flakes differ. 0.05 units of 2048 flakes are
    // 102 cells; a line crosses about 4/pi edges of a Voronoi pattern of unit density per unit
    // length (Moller 1989).
    Paint p;
    p.gaussianFlakes();
    p.state.E = {0, 0, 0.01f};
    p.host.addLight({0, 0, 1}, kWhite);
    int changes = 0;
    for (float last = -1, i = 0; i < 4000; ++i) {
        p.attribute("uv", Vec2f(i * 1.25e-5f, 0.3f));
        float const x = p.shade().x;
        changes += x != last;
        last = x;
    }
    EXPECT_NEAR(changes, 130, 30);
}

/// Red flakes that turn green under a light that they mirror: alone by their own slope of .3, whose
/// square is .09 of .09 and the mean .1; far away by the slope h of the half vector, over h^2 and
/// the width .11 of them all.
TEST(CarPaint, FlopShowsUnderLights)
{
    for (bool const far : {false, true})
        for (float const h : {0.0f, 0.2f, 0.33166248f, 0.6f}) {
            Paint p("flakeColor=1,0,0 flakeColor2=0,1,0 contributionFactor=1 xriteDiffuse=0,0,0 "
                    "fresnel=0,0,1,1 coarseness=1 flakeNormalTexture=.65,.5,1,1");
            p.state.E = {0, 0, far ? 1e6f : 0.1f};
            Vec3f const half = normalize(Vec3f(h, 0, 1));
            p.host.addLight(half * (2 * half.z) - Vec3f(0, 0, 1), kWhite);
            Vec3f const c = p.shade();
            float const want = far ? h * h / (h * h + 0.11f) : 0.09f / 0.19f;
            EXPECT_NEAR(c.y / (c.x + c.y), want, 2e-3f) << far << h;
        }
}

/// White paint under a dome of lights shows what it shows in a white room.
TEST(CarPaint, LightsBringAsMuchAsTheRoom)
{
    // Distance of the viewer; width of the lobe; flakes by the texture. No coat on flakes: the grid
    // fits one lobe.
    for (test::Line const& line : test::table(R"(
solid                 | xriteIsSolid=1 xriteDiffuse=1,1,1                      | 1 .04 0
flat flakes, near     | xriteDiffuse=0,0,0 fresnel=0,0,1,1                     | .01 .1 0
flat flakes, far      | xriteDiffuse=0,0,0 fresnel=0,0,1,1                     | 1e4 .1 0
flakes that lean, far | xriteDiffuse=0,0,0 fresnel=0,0,1,1 coarseness=.656     | 1e4 .23 1
as much as can be     | xriteDiffuse=0,0,0 fresnel=0,0,1,1 coarseness=1e30     | 1e4 .95 1
)"))
        for (double const cosine : {1.0, 0.5, 0.1}) {
            Paint p("contributionFactor=1 flakeColor=1,1,1 flakeColor2=1,1,1 " + line.settings);
            if (line.want.at(2) > 0)
                p.gaussianFlakes();
            double const sine = std::sqrt(1 - cosine * cosine), width = double(line.want.at(1)) / 2;
            p.state.I = test::toFloat({sine, 0, -cosine});
            p.state.E = p.state.P - p.state.I * line.want.at(0);
            p.whiteRoom();
            EXPECT_NEAR(p.shade().x, 1, 1e-5) << line.why;
            p.host.onTrace = p.host.onIndirect = nullptr;
            p.host.addLight({0, 0, 1}, kWhite);
            EXPECT_NEAR(test::hemisphere({width, width, {-sine, 0, cosine}}, 120,
                                         [&](test::Vec3d l) {
                                             p.host.lights[0].L = test::toFloat(l);
                                             p.host.lights[0].weight = float(l.z);
                                             return double(p.shade().x) / (M_PI * l.z);
                                         }),
                        1, 0.012)
                << line.why << ' ' << cosine;
        }
}

TEST(CarPaint, BrokenInputIsNeutral)
{
    constexpr float kNan = std::numeric_limits<float>::quiet_NaN(), kMuch = 1e30f;
    auto const shown = [&](std::string const& name, float value) {
        Paint p;
        p.gaussianFlakes();
        p.set(name, std::vector(p.byName.at(name).size / sizeof(float), value));
        p.whiteRoom();
        p.host.addLight({0, 0.6f, 0.8f}, kWhite);
        return p.shade();
    };
    for (char const* name : {"xriteDiffuse", "flakeColor", "flakeColor2", "specIntensity",
                             "diffIntensity", "contributionFactor"})
        for (float const value : {-1.0f, kNan, -kMuch})
            EXPECT_EQ(shown(name, value), shown(name, 0)) << name << value;
    EXPECT_EQ(shown("coarseness", kNan), shown("coarseness", 0));
    EXPECT_EQ(shown("coarseness", kMuch), shown("coarseness", 3));
    EXPECT_EQ(shown("coarseness", -kMuch), shown("coarseness", -3));
    EXPECT_TRUE(std::isfinite(shown("specIntensity", kMuch).x));
}

} // namespace
} // namespace zsi
