// SPDX-License-Identifier: Apache-2.0
// Metallic paint: peel, pearl, flakes near and far, and what falls on the base alone.
#include "support/textTable.h"

#include <set>

namespace zsi {
namespace {

constexpr Vec3f kWhite(1, 1, 1);

struct Paint : test::Subject {
    explicit Paint(std::string const& settings = "")
        : Subject("corvid_Mtl_MetallicPaint")
    {
        set("baseColor=0,0,0 coatRoughValue=.1 I=.6,0,-.8");
        set(settings);
        host.onNoise = [](Vec4f p) {
            return 0.5f + 0.4f * std::sin(2.1f * p.x + 1.3f * p.y) * std::cos(2.9f * p.z - p.x);
        };
        host.onCellNoise = [](Vec3f p) {
            float const cell = std::floor(p.x) + 57 * std::floor(p.y) + 113 * std::floor(p.z);
            auto const random = [cell](float k) { return fract(std::sin(cell * k) * 4375.85f); };
            return Vec3f(random(1.3f), random(2.7f), random(3.1f));
        };
        state.imageHeight = 728; // a pixel of an opening of 40 degrees is 1/1000 rad
        place({0, 0, 0}, 1e6f);
    }
    /// Puts the hit where this many flakes of the default size share a pixel.
    void place(Vec3f P, float flakes)
    {
        state.P = state.Pref = P;
        state.E = P - state.I * (10 * std::sqrt(flakes * std::fabs(state.I.z)));
    }
};

TEST(MetallicPaint, PeelLeansTheCoatAlone)
{
    // A plane of slope 1 along x falls by 2 (1 + 1/2) of it in the two octaves; a sixth of -3 times
    // that leans the coat by 0.5, which mirrors from 0.8 aside. Coat, and a matt base.
    for (test::Line const& line : test::table(R"(
level       | finish=0 finishPeelamount=-.1666667 | 1 0
other       | finish=2 finishPeelamount=-.1666667 | 1 0
leans       | finish=1 finishPeelamount=-.1666667 | 0 1
back        | finish=1 finishPeelamount=.1666667  | 0 0
)")) {
        Paint coat("I=0,0,-1 flakeDensity=0 " + line.settings);
        coat.host.onNoise = [](Vec4f p) { return p.x; };
        EXPECT_EQ(coat.transfer({0, 0, 1}).x > 0.1f, line.want.at(0) > 0) << line.why;
        EXPECT_EQ(coat.transfer({0.8f, 0, 0.6f}).x > 0.1f, line.want.at(1) > 0) << line.why;
        EXPECT_EQ(coat.state.sampleCosine, 0.6f) << "the cosine is the base's";
    }
    // A slope at right angles to the viewer hides the coat, which then is level.
    Paint steep("I=0,0,-1 flakeDensity=0 finish=1 finishPeelamount=100");
    steep.host.onNoise = [](Vec4f p) { return p.x; };
    EXPECT_GT(steep.transfer({0, 0, 1}).x, 0.1f) << "no black rim";
}

TEST(MetallicPaint, PearlShowsOnFlakesMetEdgeOn)
{
    // Half a white pearl on black flakes of a narrow lobe: half the squared sine of the facet.
    auto const ratio = [](Vec3f I, Vec3f L) {
        Paint pearl("flakeColor=0,0,0 pearlColor=1,1,1,.5 coatReflectivity=0 flakeSpread=.02"),
            white("flakeColor=1,1,1 pearlColor=0,0,0,0 coatReflectivity=0 flakeSpread=.02");
        pearl.state.I = white.state.I = I;
        return double(pearl.transfer(L).x) / double(white.transfer(L).x);
    };
    EXPECT_NEAR(ratio({0, 0, -1}, {0, 0, 1}), 0, 0.005);
    EXPECT_NEAR(ratio({0.6f, 0, -0.8f}, {0.6f, 0, 0.8f}), 0.18, 0.01);
    EXPECT_NEAR(ratio({0.8f, 0, -0.6f}, {0.8f, 0, 0.6f}), 0.32, 0.015);
}

TEST(MetallicPaint, FlakesStickToTheObjectAndMeltIntoTheirMean)
{
    Vec3f const l = normalize({0.35f, 0.2f, 0.8f});
    // The same place of an object that moved shows the same flakes, places beside it show others.
    Paint paint;
    std::set<float> brightness;
    for (int i = 0; i < 50; ++i) {
        paint.place(Vec3f(0.1f * static_cast<float>(i), 0, 0), 0.01f);
        float const here = paint.transfer(l).z;
        paint.state.P = paint.state.P + Vec3f(5, 3, 2);
        paint.state.E = paint.state.E + Vec3f(5, 3, 2);
        EXPECT_NEAR(paint.transfer(l).z, here, 1e-5f);
        brightness.insert(here);
    }
    EXPECT_GT(brightness.size(), 15u);

    // All rays but the camera's see the mean.
    test::Random random;
    paint.place({0, 0, 0}, 1);
    float const shown = paint.transfer(l).z;
    paint.state.rayType = kRayDiffuse;
    double const crowd = double(paint.transfer(l).z);
    for (std::uint32_t const type :
         {std::uint32_t(kRayReflection), std::uint32_t(kRayTransmission)}) {
        paint.state.rayType = type;
        EXPECT_NE(paint.transfer(l).z, shown);
        EXPECT_EQ(double(paint.transfer(l).z), crowd);
    }
    paint.state.rayType = kRayCamera;
    double previous = 1e9;
    for (float const flakes : {1.0f, 8.0f, 64.0f, 512.0f, 1e6f}) {
        double sum = 0, squares = 0;
        constexpr int kPlaces = 10000;
        for (int i = 0; i < kPlaces; ++i) {
            paint.place(random.unit() * 40, flakes);
            double const x = double(paint.transfer(l).z);
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

    // Off the highlight too: where the most part has bounced between flakes, where hardly any has,
    // and where flakes of one azimuth that lean more than most are seen.
    for (test::Line const& line : test::table(R"(
bounced    | flakeSpread=.5 flakeRoughValue=.3 I=0,0,-1              | .98 0 .17
level      | flakeSpread=.5 flakeRoughValue=.3 I=0,0,-1              | 0 0 1
little     | flakeSpread=.076 flakeRoughValue=.05 I=.743,0,-.669     | -.13 -.86 .5
far aside  | flakeSpread=.605 flakeRoughValue=.1 I=.8988,0,-.4384    | -.0886 -.8615 .5
)")) {
        Paint steep("coatReflectivity=0 flakeDensity=1 " + line.settings);
        Vec3f const direction = normalize(test::vec3(line.want));
        double sum = 0;
        int flake = 0;
        steep.host.onNoise = [&](Vec4f) { // each value of the decimals behind the first 1/64 once
            return 0.25f + (static_cast<float>(flake) + 0.5f) * 0x1p-24f;
        };
        steep.place({0, 0, 0}, 1);
        for (; flake < 1 << 18; ++flake)
            sum += double(steep.transfer(direction).z) * 0x1p-18;
        steep.place({0, 0, 0}, 1e6f);
        double const many = double(steep.transfer(direction).z);
        EXPECT_NEAR(sum, many, 0.03 * many) << line.why;
    }
}

TEST(MetallicPaint, SamplesOfAPixelMeetTheSameFlakes)
{
    test::Random random;
    Paint paint;
    Vec3f const l = normalize({0.4f, 0.2f, 0.8f});
    auto const shown = [&](float x, float y, int height) {
        // A hundred flakes a pixel: a tenth of a unit, jittered within the pixel.
        paint.place({0.1f * x, 0.1f * y, 0.3f}, 100);
        paint.state.rasterX = 300 + x;
        paint.state.rasterY = 200 + y;
        paint.state.imageHeight = height;
        return double(paint.transfer(l).z);
    };
    double const mean = shown(0, 0, 1);
    double fine = 0, coarse = 0;
    for (int i = 0; i < 400; ++i) {
        auto const x = static_cast<float>(i % 20), y = static_cast<float>(i / 20 + 1);
        double const first = shown(x + random.in(0, 0.99f), y + random.in(0, 0.99f), 728);
        for (int k = 0; k < 4; ++k)
            EXPECT_NEAR(shown(x + random.in(0, 0.99f), y + random.in(0, 0.99f), 728), first,
                        0.02 * first);
        fine += (first - mean) * (first - mean);
        double const off = shown(x, y, 182) - mean; // pixels four times as wide
        coarse += off * off;
    }
    EXPECT_NEAR(std::sqrt(coarse / fine), 0.25, 0.06);
}

TEST(MetallicPaint, FacesLightsAndGatheredLight)
{
    // Lights count above both normals of the viewer's side, on both faces.
    for (test::Line const& line : test::table(R"(
in front            | N=0,0,1      | 0 0 1    .5 0 .8660254   1
behind              | N=0,0,-1     | 0 0 -1   .5 0 .8660254   1
below the true face | N=0,0,1      | -.8 0 .6 .8660254 0 .5   0
below the bent face | N=-.8,0,.6   | 0 0 1    .8660254 0 .5   0
)")) {
        Paint paint("baseColor=1,1,1 flakeDensity=0 coatReflectivity=0 I=0,0,-1 " + line.settings);
        paint.state.Ng = test::vec3(line.want);
        paint.host.addLight(test::vec3(line.want, 3), kWhite);
        EXPECT_EQ(paint.shade().x > 0.3f, line.want.at(6) > 0) << line.why;
    }
    // Ambient and gathered light fall on the base alone, half of it, the first occluded.
    Paint paint("I=0,0,-1 baseColor=.1,.4,.8 coatReflectivity=0 baseRoughValue=0 flakeDensity=.5 "
                "flakeColor=0,0,0");
    paint.host.onTrace = [](Vec3f, Vec3f) { return grey(0.25f); };
    paint.host.onAmbient = [](Vec3f, Vec3f) { return grey(0.5f); };
    paint.host.onIndirect = [](Vec3f, Vec3f) { return grey(0.25f); };
    paint.host.onOcclusion = [](Vec3f, Vec3f) { return Vec3f(0.25f, 0.5f, 1); };
    EXPECT_TRUE(test::near(paint.shade(), {0.01875f, 0.1f, 0.3f}, 0.004));
    // Where only what mirrors is asked for, there is no base.
    Paint base("baseColor=1,1,1 flakeDensity=0 coatReflectivity=0 I=0,0,-1");
    base.state.allowReflection[0] = base.state.allowReflection[1] = 0;
    base.material().sample(&base.host, base.state);
    EXPECT_EQ(base.state.sampleType, kSampleStraight);
    EXPECT_LT(base.state.outBrdf.x, 0.1f);
}

} // namespace
} // namespace zsi
