// Properties of the procedural nodes that a comparison of values does not show.
#include "materials/ward/noiseNode.h"
#include "materials/ward/tileNode.h"
#include "support/networkOracle.h"
#include "support/record.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

constexpr Vec4f kBrick(0.6f, 0.2f, 0.1f, 1.0f);
constexpr Vec4f kMortar(0.1f, 0.3f, 0.5f, 0.8f);

TEST(NoiseNode, BlendsByTheNoiseValueBetweenTheThresholds)
{
    struct Case {
        char const* why;
        int type;
        float noise, levels, low, high;
        float want; ///< weight of the second colour
    };
    constexpr Case kCases[] = {
        {"plain, half way", 0, 0.5f, 0, 0.25f, 0.75f, 0.5f},
        {"at the low threshold", 0, 0.25f, 0, 0.25f, 0.75f, 0},
        {"below it", 0, 0.2f, 0, 0.25f, 0.75f, 0},
        {"above the high threshold", 0, 0.8f, 0, 0.25f, 0.75f, 1},
        {"equal thresholds: the value itself, also above", 0, 0.75f, 0, 0.5f, 0.5f, 0.75f},
        {"equal thresholds, below", 0, 0.25f, 0, 0.5f, 0.5f, 0.25f},
        {"thresholds the wrong way round: below low comes first", 0, 0.5f, 0, 0.75f, 0.25f, 0},
        {"fractal: (1/2 + 1/4 + 1)/2", 1, 0.75f, 2, 0, 1, 0.875f},
        {"a fraction is a whole octave: (1/2 + 1/4 + 1/8 + 1)/2", 1, 0.75f, 2.1f, 0, 1, 0.9375f},
        {"less than one level: (1/2 + 1)/2", 1, 0.75f, 0.01f, 0, 1, 0.75f},
        {"no levels: middle grey", 1, 0.75f, 0, 0, 1, 0.5f},
        {"turbulence: |-1/2| + |-1/4|", 2, 0.25f, 2, 0, 1, 0.75f},
        {"turbulence may pass 1", 2, 1.0f, 3, 0, 4, 0.4375f},
        {"unknown type: 0 through the thresholds", 3, 0.9f, 2, -1, 1, 0.5f},
        {"unknown type, negative", -1, 0.9f, 2, 0.1f, 1, 0},
    };
    for (Case const& c : kCases) {
        test::ScriptedHost host;
        host.onNoise = [&](Vec4f) { return c.noise; };
        Vec4f const got =
            f_Noise(&host, test::plainHit(), {0, 0}, {0, 0, 0}, {0, 1, 0.25f, 0}, {1, 0, 0.75f, 1},
                    c.low, c.high, Mat4f::identity(), 1, c.levels, 0, c.type);
        EXPECT_FLOAT_EQ(got.x, c.want) << c.why;
        EXPECT_FLOAT_EQ(got.y, 1 - c.want) << c.why;
        EXPECT_FLOAT_EQ(got.z, 0.25f + 0.5f * c.want) << c.why;
        EXPECT_FLOAT_EQ(got.w, c.want) << c.why;
    }
}

TEST(NoiseNode, AsksForPlacedOctavesAndComesToAnEnd)
{
    std::vector<Vec4f> asked;
    test::ScriptedHost host;
    host.onNoise = [&](Vec4f p) {
        asked.push_back(p);
        return 0.5f;
    };
    auto const run = [&](float size, float levels) {
        asked.clear();
        constexpr Mat4f kColumns(1, 2, 3, 0, 4, 5, 6, 0, 7, 8, 9, 0, 10, 20, 30, 1);
        f_Noise(&host, test::plainHit(), {5, 6}, {1, 10, 100}, {}, {}, 0, 1, kColumns, size, levels,
                0.75f, 1);
    };
    run(2, 2);
    ASSERT_EQ(asked.size(), 2u);
    constexpr float kWant[] = {375.5f, 436.0f, 496.5f}; // (1 + 40 + 700 + 10) / 2 and so on
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ((&asked[0].x)[i], kWant[i]);
        EXPECT_EQ((&asked[1].x)[i], 2 * kWant[i]);
    }
    EXPECT_EQ(asked[0].w, 0.75f);
    EXPECT_EQ(asked[1].w, 0.75f) << "the phase is no length";
    for (float const levels : {1e9f, INFINITY}) {
        run(0, levels);
        EXPECT_LT(asked.size(), 100u);
        EXPECT_TRUE(std::isfinite(asked.front().x)) << "a size of 0";
    }
}

struct Wall : TileShape {
    Mat4f xform = Mat4f::identity();
};
Wall wall(float columns, float rows, float gapX, float gapY)
{
    Wall t;
    t.horizontalCount = columns - gapX; // so that whole cells fill the square
    t.verticalCount = rows - gapY;
    t.horizontalGap = gapX;
    t.verticalGap = gapY;
    return t;
}

Vec4f tileAt(test::ScriptedHost& host, Wall const& t, Vec2f uv, Vec2f footprint = {0, 0})
{
    return f_Tile(&host, test::plainHit(), uv, {0, 0, 0}, kBrick, kMortar, t, t.xform, footprint);
}
float redOf(Vec4f c) { return (c.x - kMortar.x) / (kBrick.x - kMortar.x); }

void expectSame(Vec4f a, Vec4f b, char const* why)
{
    EXPECT_TRUE(a.x == b.x && a.y == b.y && a.z == b.z && a.w == b.w) << why;
}

TEST(TileNode, EndsAtTheSquareUnlessItRepeats)
{
    test::ScriptedHost host;
    test::giveNoise(host);
    Wall t = wall(4, 6, 0.1f, 0.2f);
    t.colorVariance = 0.8f;
    t.randomShift = 0.4f;
    constexpr Vec4f kNothing(0, 0, 0, 0);
    expectSame(tileAt(host, t, {-0.01f, 0.5f}), kNothing, "left");
    expectSame(tileAt(host, t, {1.01f, 0.5f}), kNothing, "right");
    expectSame(tileAt(host, t, {0.5f, -0.01f}), kNothing, "below");
    expectSame(tileAt(host, t, {0.5f, 1.01f}), kNothing, "above");
    EXPECT_GT(tileAt(host, t, {1, 1}).w, 0.0f) << "the corner belongs to it";
    t.repeatX = true;
    expectSame(tileAt(host, t, {0.5f, 1.25f}), kNothing, "repeats along x only");
    for (float const u : {0.125f, 0.40625f, 0.75f})
        for (float const v : {0.25f, 0.4375f})
            expectSame(tileAt(host, t, {u + 3, v}), tileAt(host, t, {u, v}), "x repeats");
    t.repeatX = false;
    t.repeatY = true;
    expectSame(tileAt(host, t, {-0.25f, 0.5f}), kNothing, "repeats along y only");
    expectSame(tileAt(host, t, {0.40625f, -1.75f}), tileAt(host, t, {0.40625f, 0.25f}),
               "y repeats");

    // A brick that the right end cuts goes on at the left end in the same shade.
    t.repeatX = true;
    int cut = 0;
    for (int row = 0; row < 6; ++row) {
        float const v = (static_cast<float>(row) + 0.5f) / 6;
        Vec4f const left = tileAt(host, t, {1e-4f, v}), right = tileAt(host, t, {1 - 1e-4f, v});
        if (redOf(left) == 0.0f || redOf(right) == 0.0f)
            continue; // mortar at the seam
        ++cut;
        expectSame(left, right, "seam");
    }
    EXPECT_GT(cut, 2);
}

TEST(TileNode, MortarIsTheBoxAverageOverTheFootprint)
{
    test::ScriptedHost host;
    Wall t = wall(5, 5, 0.08f, 0.15f);
    t.lineShift = -0.5f; // no bond: the pattern is a product of two axes
    constexpr float kMean = (1 - 2 * 0.08f) * (1 - 2 * 0.15f);
    test::Random random;
    for (int round = 0; round < 40; ++round) {
        Vec2f const at(random.in(0.3f, 0.7f), random.in(0.3f, 0.7f));
        Vec2f const box(random.in(0.002f, 0.19f), random.in(0.002f, 0.19f)); // cells are 0.2
        constexpr int kSteps = 200;
        double sum = 0;
        for (int i = 0; i < kSteps; ++i)
            for (int k = 0; k < kSteps; ++k) {
                Vec2f const in((static_cast<float>(i) + 0.5f) / kSteps - 0.5f,
                               (static_cast<float>(k) + 0.5f) / kSteps - 0.5f);
                sum += double(redOf(tileAt(host, t, {at.x + in.x * box.x, at.y + in.y * box.y})));
            }
        // Each of up to four edges in the box is missed by at most one step of the grid.
        EXPECT_NEAR(double(redOf(tileAt(host, t, at, box))), sum / (kSteps * kSteps), 4.0 / kSteps);
        for (float const wide : {0.2001f, 1.0f, 1e30f, INFINITY})
            EXPECT_NEAR(redOf(tileAt(host, t, at, {wide, wide})), kMean, 1e-5f);
    }
    // The transform widens what the footprint covers, here along the other axis.
    t.xform = Mat4f(0, 1, 0, 0, 1, 0, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1);
    EXPECT_NEAR(redOf(tileAt(host, t, {0.5f, 0.5f}, {1, 0})), 1 - 2 * 0.15f, 1e-5f);
    t.horizontalGap = 0.5f;
    EXPECT_EQ(redOf(tileAt(host, t, {0.41f, 0.41f})), 0.0f) << "mortar meets in the middle";
}

TEST(TileNode, HolesTakeTheirShareOfBricks)
{
    test::ScriptedHost host;
    test::giveNoise(host);
    constexpr int kSide = 60;
    Wall t = wall(kSide, kSide, 0.1f, 0.1f);
    t.edgeRoughness = 0.5f;
    t.colorVariance = 0.2f;
    struct Case {
        int holes;
        double missing;
    };
    for (Case const& c : {Case{0, 0}, {1, 0.5}, {3, 0.75}, {99, 0.99}, {100, 1}, {-5, 0}}) {
        t.holes = c.holes;
        int missing = 0;
        for (int i = 0; i < kSide * kSide; ++i) {
            // A quarter of the way, which is well inside a brick in every row of the bond.
            Vec2f const at((static_cast<float>(i % kSide) + 0.25f) / kSide,
                           (static_cast<float>(i / kSide) + 0.5f) / kSide);
            missing += tileAt(host, t, at).z == kMortar.z;
        }
        constexpr double kBricks = kSide * kSide;
        EXPECT_NEAR(missing / kBricks, c.missing,
                    4 * std::sqrt(c.missing * (1 - c.missing) / kBricks))
            << "holes " << c.holes;
    }
    t.holes = 100;
    expectSame(tileAt(host, t, {0.50417f, 0.5083f}), kMortar, "pure mortar");
}

TEST(TileNode, RoughEdgesAreDisplacedAndNothingElse)
{
    test::ScriptedHost host;
    host.onNoise = [](Vec4f) { return 1.0f; }; // as far up and right as it goes
    Wall t = wall(4, 4, 0.1f, 0.1f);
    t.lineShift = -0.5f;
    // Cells of a quarter, mortar for 0.025 at their ends.
    struct Case {
        char const* why;
        float roughness;
        Vec2f at;
        float brick;
    };
    constexpr Case kCases[] = {
        {"plain, in the mortar", 0, {0.27f, 0.375f}, 0},
        {"displaced by 0.01 onto the brick", 10, {0.27f, 0.375f}, 1},
        {"displaced by 0.04 over the end of the square, onto the next brick",
         40,
         {0.99f, 0.375f},
         1},
        {"the same along v", 40, {0.375f, 0.99f}, 1},
        {"hardly displaced: the picture without", 1e-6f, {0.999f, 0.375f}, 0},
        {"hardly displaced, at the other end", 1e-6f, {0.03f, 0.03f}, 1},
    };
    for (Case const& c : kCases) {
        t.edgeRoughness = c.roughness;
        EXPECT_EQ(redOf(tileAt(host, t, c.at)), c.brick) << c.why;
    }
}

TEST(TileNode, FootprintIsWhatAPixelSeesOfTheSurface)
{
    test::Random random;
    for (int round = 0; round < 50; ++round) {
        ShadeState s = test::plainHit();
        s.imageHeight = 700;
        s.P = {random.in(-1, 1), random.in(-1, 1), random.in(-1, 1)};
        do
            s.I = random.unit();
        while (std::fabs(s.I.z) < 0.1f);
        float const distance = random.in(1, 9), turn = random.in(0, 6), scale = random.in(0.2f, 4);
        s.E = s.P - s.I * distance;
        s.objectToWorld = Mat4f(scale, 0, 0, 0, 0, scale, 0, 0, 0, 0, scale, 0, 7, 8, 9, 1);
        Vec3f const T = Vec3f(std::cos(turn), std::sin(turn), 0) * random.in(0.5f, 2);
        Vec3f const B = Vec3f(-std::sin(turn), std::cos(turn), 0) * random.in(0.5f, 2);

        // Rays round the pixel's cone, met with the plane of the surface.
        double const radius = std::tan(3.14159265358979 / 8) / 700;
        Vec3f const side = normalize(cross(s.I, Vec3f(0.3f, 0.5f, 0.81f)));
        Vec3f const up = cross(side, s.I);
        double u = 0, v = 0;
        for (int i = 0; i < 360; ++i) {
            double const a = i * 3.14159265358979 / 180;
            double d[3], hit[3];
            for (int k = 0; k < 3; ++k)
                d[k] = double((&s.I.x)[k])
                    + radius
                        * (std::cos(a) * double((&side.x)[k]) + std::sin(a) * double((&up.x)[k]));
            double const t = double(s.P.z - s.E.z) / d[2];
            for (int k = 0; k < 3; ++k)
                hit[k] = double((&s.E.x)[k]) + t * d[k] - double((&s.P.x)[k]);
            auto const along = [&](Vec3f axis) {
                return (hit[0] * double(axis.x) + hit[1] * double(axis.y))
                    / (double(dot(axis, axis)) * double(scale));
            };
            u = std::max(u, 2 * along(T));
            v = std::max(v, 2 * along(B));
        }
        Vec2f const got = uvFootprint(s, T, B);
        EXPECT_NEAR(double(got.x) / u, 1, 0.02) << round; // the far side of a steep cone is longer
        EXPECT_NEAR(double(got.y) / v, 1, 0.02) << round;
    }
    ShadeState unknown = test::plainHit();
    EXPECT_EQ(uvFootprint(unknown, {1, 0, 0}, {0, 1, 0}).x, 0.0f) << "no image height";
    unknown.imageHeight = 100;
    EXPECT_NEAR(uvFootprint(unknown, {0, 0, 0}, {0, 0, 0}).y, 0.00828f, 1e-5f) << "no tangents";
}

} // namespace
} // namespace zsi
