// Metallic paint: energy, reciprocity, sampling, frames, flakes near and far, lights.
#include "materials/physical/corvid_Mtl_MetallicPaint.h"
#include "support/lobeSampling.h"
#include "support/scriptedHost.h"

#include <gtest/gtest.h>
#include <set>

namespace zsi {
namespace {

using Paint = corvid_Mtl_MetallicPaint;
using test::Vec3d;
constexpr long kTangent = 36;
constexpr Vec3f kWhite(1, 1, 1);

/// A host whose noise is smooth, and whose cells are random.
struct NoisyHost {
    test::ScriptedHost host;

    NoisyHost()
    {
        host.onNoise = [](Vec4f p) {
            float const waves = std::sin(2.1f * p.x + 1.3f * p.y)
                + std::sin(1.7f * p.y - 2.9f * p.z) + std::sin(2.3f * p.z + 0.7f * p.x);
            return 0.5f + waves / 6.1f;
        };
        host.onCellNoise = [](Vec3f p) {
            float const cell = std::floor(p.x) + 57 * std::floor(p.y) + 113 * std::floor(p.z);
            auto const random = [cell](float k) { return fract(std::sin(cell * k) * 4375.85f); };
            return Vec3f(random(1.3f), random(2.7f), random(3.1f));
        };
        host.randoms.resize(3);
    }
};

Vec3d viewAt(double cosine, double azimuth)
{
    double const s = std::sqrt(1 - cosine * cosine);
    return {s * std::cos(azimuth), s * std::sin(azimuth), cosine};
}
ShadeState hitFrom(Vec3d v, Vec3f place = {0.3f, 0.7f, 0.2f}, float distance = 1)
{
    ShadeState s = test::plainHit();
    s.I = -test::toFloat(v);
    s.P = s.Pref = place;
    s.E = s.P - s.I * distance;
    s.imageHeight = 728; // a pixel of an opening of 40 degrees is 1/1000 rad
    test::setAttribute(s, kTangent, Vec3f(1, 0, 0));
    std::memset(s.allowReflection, 1, sizeof s.allowReflection);
    return s;
}
/// Distance from which this many flakes of the default size share a pixel, seen at the cosine.
float distanceOf(double flakes, double cosine)
{
    return 0.01f / 0.001f * static_cast<float>(std::sqrt(flakes * cosine));
}
Paint whitePaint()
{
    Paint p;
    p.u_baseColor = p.u_flakeColor = {1, 1, 1};
    p.u_coatRoughValue = 0.1f;
    return p;
}
Vec3f transferTo(Paint const& paint, ShadeState s, Vec3f l)
{
    NoisyHost noisy;
    s.sampleDirection = l;
    paint.transfer(&noisy.host, s);
    return s.outBrdf * s.sampleCosine;
}
double albedo(Paint const& paint, ShadeState const& s, Vec3d v, int grid)
{
    return test::hemisphere({0.15, 0.15, v}, grid, [&](Vec3d l) {
        return double(transferTo(paint, s, test::toFloat(l)).x) / l.z;
    });
}

TEST(MetallicPaint, ReturnsNoMoreThanItGetsAndWhiteAlmostAll)
{
    test::Random random;
    for (int i = 0; i < 120; ++i) {
        Paint paint = whitePaint();
        paint.u_baseRoughValue = i % 4 ? random.in(0, 1) : 1;
        paint.u_flakeDensity = i % 3 == 0 ? 0 : i % 5 == 0 ? 1 : random.in(0, 1);
        paint.u_flakeSpread = random.in(0, i % 4 ? 0.4f : 1);
        paint.u_flakeRoughValue = random.in(0.08f, 0.4f);
        paint.u_coatReflectivity = i % 7 == 0 ? 1 : random.in(0, 0.3f);
        paint.u_coatRoughValue = random.in(0.06f, 0.5f);
        paint.u_finish = i % 2;
        paint.u_finishPeelamount = random.in(0, 0.1f);
        double const cosine = double(random.in(0.05f, 1));
        Vec3d const v = viewAt(cosine, double(random.in(0, 6)));
        float const distance = distanceOf(double(i % 3 ? random.in(0.5f, 30) : 1e6f), cosine);
        double const a = albedo(paint, hitFrom(v, random.unit(), distance), v, 64);
        // Within 0.005, and what the grid is off.
        EXPECT_LT(a, 1.008) << i << " cosine " << cosine << " peel " << paint.u_finish;
        bool const bare = paint.u_flakeDensity == 0 && paint.u_finish == 0;
        EXPECT_GT(a, bare ? 0.967 : 0.7) << i << " cosine " << cosine;
    }
}

TEST(MetallicPaint, IsReciprocalUnderALevelCoat)
{
    test::Random random;
    for (int i = 0; i < 1000; ++i) {
        Paint paint;
        paint.u_baseColor = random.color();
        paint.u_flakeColor = random.color();
        paint.u_pearlColor = {random.in(0, 1), random.in(0, 1), random.in(0, 1), random.in(0, 1)};
        paint.u_flakeSpread = random.in(0, 1);
        paint.u_coatRoughValue = random.in(0.02f, 0.5f);
        Vec3f a = random.unit(), b = random.unit(), place = random.unit();
        a.z = std::fabs(a.z);
        b.z = std::fabs(b.z);
        float const distance = i % 2 ? 1 : 1e9f; // one flake or the crowd
        Vec3d const v{double(a.x), double(a.y), double(a.z)},
            l{double(b.x), double(b.y), double(b.z)};
        Vec3f const there = transferTo(paint, hitFrom(v, place, distance), b) * (1 / b.z);
        Vec3f const back = transferTo(paint, hitFrom(l, place, distance), a) * (1 / a.z);
        EXPECT_LT(length(there - back), 2e-3f * (length(there) + 1e-3f)) << i;
    }
}

TEST(MetallicPaint, SamplesFollowTheirDensityAndCarryTheValueOfTransfer)
{
    test::Random random;
    NoisyHost noisy;
    struct Case {
        char const* why;
        double cosine;
        float flakes, coatRough, peel;
        bool glossyOnly;
    };
    for (Case const& c : {Case{"one flake", 0.8, 0.5f, 0.1f, 0, false},
                          {"five flakes under a peel", 0.6, 5, 0.2f, 0.2f, false},
                          {"crowd at a grazing angle", 0.2, 1e9f, 0.05f, 0, false},
                          {"glossy lobes", 0.7, 12, 0.1f, 0.1f, true}}) {
        SCOPED_TRACE(c.why);
        Paint paint = whitePaint();
        paint.u_baseColor = {0.6f, 0.2f, 0.1f};
        paint.u_pearlColor = {0.1f, 1, 0.2f, 0.5f};
        paint.u_coatReflectivity = 0.3f;
        paint.u_coatRoughValue = c.coatRough;
        paint.u_flakeSpread = 0.3f;
        paint.u_flakeRoughValue = 0.15f;
        paint.u_flakeDensity = 0.7f;
        paint.u_finish = 1;
        paint.u_finishPeelamount = c.peel;
        Vec3d const v = viewAt(c.cosine, 0.4);
        // A place with some flakes under the footprint.
        ShadeState const hit =
            hitFrom(v, {0.31f, 0.22f, 0.1f}, distanceOf(double(c.flakes), c.cosine));
        test::DensityCheck check{{0.25, 0.25, v}};
        double red = 0, redSquares = 0;
        constexpr int kDraws = 60000;
        for (int i = 0; i < kDraws; ++i) {
            ShadeState s = hit;
            if (c.glossyOnly)
                s.allowReflection[0] = s.allowReflection[1] = 0;
            for (float& u : noisy.host.randoms)
                u = random.in(0, 1);
            paint.sample(&noisy.host, s);
            if (s.sampleType == kSampleNone) {
                check.reject();
                continue;
            }
            ASSERT_EQ(s.sampleType, c.glossyOnly ? 4u : 2u);
            Vec3f const d = s.sampleDirection;
            check.accept({double(d.x), double(d.y), double(d.z)}, double(s.sampleInvPdf));
            double const weight = double(s.outBrdf.x) * double(s.sampleCosine * s.sampleInvPdf);
            red += weight;
            redSquares += weight * weight;
            if (i % 64 || c.glossyOnly)
                continue;
            Vec3f const want = transferTo(paint, hit, d);
            EXPECT_LE(length(s.outBrdf * s.sampleCosine - want), 1e-4f * length(want));
        }
        int cells;
        double const deviation = check.deviation(cells);
        EXPECT_GT(cells, 20);
        EXPECT_LT(deviation, cells + 4 * std::sqrt(2.0 * cells)); // chi-square, 4 deviations
        Paint rest = paint;
        if (c.glossyOnly)
            rest.u_baseColor = {0, 0, 0};
        double const mean = red / kDraws;
        double const error = std::sqrt((redSquares / kDraws - mean * mean) / kDraws);
        EXPECT_NEAR(mean, albedo(rest, hit, v, 192), 4 * error + 0.003);
    }
}

TEST(MetallicPaint, PeelBendsTheFrameOfTheCoatAlone)
{
    test::Random random;
    for (int i = 0; i < 100; ++i) {
        test::ScriptedHost host;
        Vec3f const slope = random.unit();
        std::vector<Vec3f> asked;
        host.onNoise = [&](Vec4f p) {
            asked.push_back({p.x, p.y, p.z});
            return dot(slope, {p.x, p.y, p.z});
        };
        Paint paint;
        paint.u_finish = i % 3;
        paint.u_finishPeelamount = random.in(-0.5f, 0.5f);
        Vec3f const N = random.unit(), tangent = random.unit(), P = random.unit() * 3;
        ShadeState s = test::plainHit();
        test::setAttribute(s, kTangent, tangent);
        SLArray<Vec3f> frame, peel;
        paint.f_computeShadingFrame(&host, s, P, N, Mat3f(0, 1, 0, -1, 0, 0, 0, 0, 1), frame, peel);
        Vec3f const turned(-tangent.y, tangent.x, tangent.z);
        Vec3f const T = normalize(turned - N * dot(turned, N)), B = cross(N, T);
        EXPECT_LT(length(frame[0] - T) + length(frame[1] - B), 1e-5f);
        EXPECT_EQ(frame[2], N);
        if (paint.u_finish != 1) {
            for (int k = 0; k < 3; ++k)
                EXPECT_EQ(peel[k], frame[k]);
            EXPECT_TRUE(asked.empty());
            continue;
        }
        ASSERT_FALSE(asked.empty());
        EXPECT_LT(length(asked[0] - P * (0.8f * 2.6f)), 1e-5f);
        // A plane of this slope falls by 2 (1 + 1/2) of it in the two octaves.
        float const k = -3 * paint.u_finishPeelamount;
        Vec3f const bent = N + (T * dot(slope, T) + B * dot(slope, B)) * k;
        EXPECT_LT(length(peel[2] - bent), 1e-3f);
        Vec3f const across = normalize(T - bent * dot(T, bent));
        EXPECT_LT(length(peel[0] - across), 1e-3f);
        EXPECT_LT(length(peel[1] - normalize(cross(bent, across))), 1e-3f);
    }
}

TEST(MetallicPaint, FlakesStickToTheObjectAndMeltIntoTheirMean)
{
    Paint paint;
    paint.u_baseColor = {0, 0, 0};
    Vec3d const v = viewAt(0.8, 0);
    Vec3f const l = normalize({-0.35f, 0.2f, 0.8f});
    // The same place of an object that moved shows the same flakes, places beside it show others.
    std::set<float> brightness;
    for (int i = 0; i < 50; ++i) {
        ShadeState const here = hitFrom(v, Vec3f(0.1f * static_cast<float>(i), 0, 0));
        ShadeState moved = here;
        moved.P = moved.P + Vec3f(5, 3, 2);
        moved.E = moved.E + Vec3f(5, 3, 2);
        EXPECT_NEAR(transferTo(paint, here, l).z, transferTo(paint, moved, l).z, 1e-5f);
        brightness.insert(transferTo(paint, here, l).z);
    }
    EXPECT_GT(brightness.size(), 15u);

    test::Random random;
    double previous = 1e9;
    ShadeState gathered = hitFrom(v);
    gathered.rayType = kRayDiffuse;
    double const crowd = double(transferTo(paint, gathered, l).z);
    for (double flakes : {1.0, 8.0, 64.0, 512.0, 4096.0, 1e6}) {
        double sum = 0, squares = 0;
        constexpr int kPlaces = 20000;
        for (int i = 0; i < kPlaces; ++i) {
            Vec3f const place = random.unit() * 40;
            ShadeState const s = hitFrom(v, place, distanceOf(flakes, 0.8));
            double const x = double(transferTo(paint, s, l).z);
            sum += x;
            squares += x * x;
        }
        double const mean = sum / kPlaces;
        double const deviation = std::sqrt(std::max(0.0, squares / kPlaces - mean * mean));
        EXPECT_NEAR(mean, crowd, 4 * deviation / std::sqrt(kPlaces) + 0.01 * crowd) << flakes;
        // Eight times the flakes have at most 0.45 of the contrast: 1/sqrt(8), and some for the
        // sampling error.
        EXPECT_LT(deviation, 0.45 * previous) << flakes;
        previous = deviation;
    }
    EXPECT_LT(previous, 1e-3 * crowd);
}

TEST(MetallicPaint, SamplesOfAPixelMeetTheSameFlakesAndOtherRaysTheirMean)
{
    Paint paint;
    paint.u_baseColor = {0, 0, 0};
    test::Random random;
    Vec3d const v = viewAt(0.8, 0);
    Vec3f const l = normalize({-0.4f, 0.2f, 0.8f});
    auto const shown = [&](float x, float y, std::uint32_t type, int height) {
        // A hundred flakes a pixel: a tenth of a unit, jittered within the pixel.
        ShadeState s = hitFrom(v, {0.1f * x, 0.1f * y, 0.3f}, distanceOf(100, 0.8));
        s.rasterX = 300 + x;
        s.rasterY = 200 + y;
        s.rayType = type;
        s.rayDepth = type == kRayReflection ? 1 : 0;
        s.imageHeight = static_cast<std::uint32_t>(height);
        return double(transferTo(paint, s, l).z);
    };
    double sum = 0, squares = 0, coarse = 0;
    constexpr int kPixels = 400;
    double const mean = shown(0.5f, 0.5f, kRayReflection, 728);
    for (int i = 0; i < kPixels; ++i) {
        auto const x = static_cast<float>(i % 20), y = static_cast<float>(i / 20 + 1);
        double const first = shown(x + random.in(0, 0.99f), y + random.in(0, 0.99f), 1, 728);
        for (int k = 0; k < 4; ++k)
            EXPECT_NEAR(shown(x + random.in(0, 0.99f), y + random.in(0, 0.99f), 1, 728), first,
                        0.02 * first);
        sum += first;
        squares += first * first;
        double const off = shown(x, y, 1, 182) - mean; // pixels four times as wide
        coarse += off * off;
        for (std::uint32_t type : {std::uint32_t(kRayReflection), std::uint32_t(kRayDiffuse),
                                   std::uint32_t(kRayTransmission)})
            EXPECT_NEAR(shown(x, y, type, 728), mean, 1e-3 * mean);
    }
    double const deviation = std::sqrt(squares / kPixels - sum * sum / kPixels / kPixels);
    EXPECT_NEAR(sum / kPixels, mean, 4 * deviation / std::sqrt(double(kPixels)));
    EXPECT_NEAR(std::sqrt(coarse / kPixels) / deviation, 0.25, 0.06);
}

TEST(MetallicPaint, LightsAndSurroundingsShowWhatPathsFind)
{
    NoisyHost noisy;
    test::ScriptedHost& host = noisy.host;
    constexpr float kHalfTurn = 3.14159265f;
    Paint paint = whitePaint();
    paint.u_baseColor = {0.1f, 0.4f, 0.8f};
    paint.u_finish = 1;
    ShadeState s = hitFrom(viewAt(0.7, 0.5), {0.3f, 0.7f, 0.2f}, distanceOf(3, 0.7));
    Vec3f const L = normalize({-0.5f, -0.3f, 0.1f}); // low: no light fades before the horizon
    for (float side : {1.0f, -1.0f}) { // both faces are painted
        s.N = s.Ng = {0, 0, side};
        host.addLight(L, {2, 3, 4}, {1, 0.5f, 0.25f}, 0.6f);
        paint.shade(&host, s);
        Vec3f const want = transferTo(paint, s, L) * Vec3f(2, 1.5f, 1) * (kHalfTurn * 0.6f / L.z);
        EXPECT_LT(length(rgb(s.Ci) - want), 1e-4f * length(want));
        s.Ng = normalize({0.3f, 0.2f, -side}); // now the light is below the surface
        host.lights.clear();
    }
    Paint white = whitePaint();
    white.u_flakeDensity = 0;
    host.addLight({0, 0, 1}, {1, 1, 1});
    s = hitFrom(viewAt(0.7, 0));
    white.shade(&host, s);
    EXPECT_NEAR(s.Ci.x, 1, 0.02); // a white surface facing a light of colour 1
    s.Ng = normalize({0, 1, -0.1f});
    white.shade(&host, s);
    EXPECT_EQ(s.Ci.x, 0); // below the true surface
    host.lights.clear();

    // A world that is brighter on one side: the mean of `shade` is what samples find there.
    test::Random random;
    auto const world = [](Vec3f, Vec3f d) { return grey(1 + 0.5f * d.x); };
    host.onTrace = world;
    for (float density : {0.0f, 0.5f, 1.0f})
        for (double cosine : {0.15, 0.8}) {
            paint.u_flakeDensity = density;
            paint.u_baseColor = density == 1 ? kWhite : kBlack; // the base gathers by itself
            s = hitFrom(viewAt(cosine, 0.5), {0.3f, 0.7f, 0.2f}, distanceOf(3, cosine));
            double shaded = 0, found = 0;
            constexpr int kDraws = 20000;
            for (int i = 0; i < kDraws; ++i) {
                for (float& u : host.randoms)
                    u = random.in(0, 1);
                host.calls.clear();
                paint.shade(&host, s);
                EXPECT_LE(host.count("traceSpecular"), 2);
                shaded += double(s.Ci.x) / kDraws;
                paint.sample(&host, s);
                if (s.sampleType != kSampleNone)
                    found += double(s.outBrdf.x * s.sampleCosine * s.sampleInvPdf
                                    * world({}, s.sampleDirection).x)
                        / kDraws;
            }
            EXPECT_NEAR(shaded, found, 0.02 * found) << density << " cosine " << cosine;
        }
    // Ambient and gathered light fall on the base alone, the first occluded.
    host.onTrace = nullptr;
    host.onAmbient = [](Vec3f, Vec3f) { return Vec3f(0.5f, 0.5f, 0.5f); };
    host.onIndirect = [](Vec3f, Vec3f) { return Vec3f(0.25f, 0.25f, 0.25f); };
    host.onOcclusion = [](Vec3f, Vec3f) { return Vec3f(0.25f, 0.5f, 1); };
    paint.u_baseColor = {0.1f, 0.4f, 0.8f};
    paint.u_coatReflectivity = paint.u_baseRoughValue = 0;
    paint.u_flakeDensity = 0.5f;
    s = hitFrom({0, 0, 1}, {0, 0, 0}, 1e9f);
    paint.shade(&host, s);
    Vec3f const want = paint.u_baseColor * Vec3f(0.1875f, 0.25f, 0.375f);
    EXPECT_LT(length(rgb(s.Ci) - want), 0.005f * length(want));
}

TEST(MetallicPaint, StaysFiniteAtTheEndsOfEveryRange)
{
    NoisyHost noisy;
    test::Random random;
    constexpr float kEnds[] = {-1, 0, 1e-40f, 1e-6f, 0.5f, 1, 1e6f};
    for (int i = 0; i < 6000; ++i) {
        auto const end = [&] { return kEnds[static_cast<int>(random.in(0, 6.99f))]; };
        Paint paint;
        paint.u_baseColor = {end(), end(), end()};
        paint.u_pearlColor = {end(), end(), end(), end()};
        for (float Paint::*field :
             {&Paint::u_baseRoughValue, &Paint::u_flakeSize, &Paint::u_flakeDensity,
              &Paint::u_flakeSpread, &Paint::u_flakeRoughValue, &Paint::u_coatReflectivity,
              &Paint::u_coatRoughValue, &Paint::u_finishPeelamount})
            paint.*field = end();
        paint.u_finish = i % 2;
        Vec3f d = random.unit();
        d.z = std::max(std::fabs(d.z), 1e-6f) * (i % 3 ? 1.0f : 1e-5f);
        d = normalize(d);
        ShadeState s = hitFrom({double(d.x), double(d.y), double(d.z)});
        if (i % 5 == 0)
            test::setAttribute(s, kTangent, Vec3f(0, 0, i % 2 ? 1.0f : 0.0f)); // no tangent
        for (float& u : noisy.host.randoms)
            u = i % 7 ? random.in(0, 1) : 0;
        paint.sample(&noisy.host, s);
        if (s.sampleType) {
            EXPECT_TRUE(std::isfinite(dot(s.outBrdf, s.sampleDirection) * s.sampleInvPdf)) << i;
            EXPECT_NEAR(length(s.sampleDirection), 1, 1e-4f) << i;
        }
        s.sampleDirection = i % 2 ? Vec3f(-d.x, -d.y, d.z) : random.unit();
        paint.transfer(&noisy.host, s);
        EXPECT_TRUE(std::isfinite(s.outBrdf.x + s.outBrdf.y + s.outBrdf.z)) << i;
        EXPECT_GE(minComponent(s.outBrdf), 0.0f) << i;
    }
}

} // namespace
} // namespace zsi
