// SPDX-License-Identifier: Apache-2.0
// Metal: what its maps and bumps do to the lobe, its Fresnel curve, its two faces and its holes.
#include "support/textTable.h"

namespace zsi {
namespace {

constexpr Vec3f kWhite(1, 1, 1);

struct Metal : test::Subject {
    explicit Metal(std::string const& settings = "")
        : Subject("corvid_Mtl_Metal")
    {
        set("reflectColor=1,1,1 roughValue=.4 anisotropyValue=.25 I=-.28,0,-.96");
        set(settings);
    }
};

TEST(Metal, MapsReplaceTheirValuesTimesTheirAmounts)
{
    // What the map is to equal, and the map.
    for (test::Line const& line : test::table(R"(
roughValue=.6           | roughMapEnable=1 roughMap=.3,9,9,9 roughAmount=2                  |
roughValue=1            | roughMapEnable=1 roughMap=.7,9,9,9 roughAmount=2                  |
roughValue=.001         | roughValue=0                                                      |
anisotropyValue=.5      | anisotropyMapEnable=1 anisotropyMap=.25,9,9,9 anisotropyAmount=2  |
anisotropyValue=.1      | anisotropyValue=.0001                                             |
reflectColor=.2,.4,1    | reflectMapEnable=1 reflectMap=.1,.2,3,9 reflectAmount=2           |
edgeColor=.2,.4,1       | edgeMapEnable=1 edgeMap=.1,.2,3,9 edgeAmount=2                    |
anisoRotationValue=1.2  | anisoRotationValue=9 anisoRotationMapEnable=1 anisoRotationMap=1.2,9,9,9 |
)"))
        for (Vec3f const L : {Vec3f(0.6f, 0, 0.8f), Vec3f(0, 0.9539392f, 0.3f)}) {
            Vec3f const value = Metal(line.settings).transfer(L);
            EXPECT_TRUE(
                test::near(value, Metal(line.why).transfer(L), 1e-6 + 1e-4 * double(value.x)))
                << line.settings;
        }
}

TEST(Metal, LobeTurnsAndLeansWithItsFrame)
{
    // The brushed lobe head-on: lights turned with it show the same.
    for (float const angle : {0.3f, -1.2f, 1.5707963f}) {
        Metal turned("I=0,0,-1"), plain("I=0,0,-1");
        turned.set("u_anisoRotationValue", angle);
        Vec3f const L(0.6f * std::cos(angle), 0.6f * std::sin(angle), 0.8f);
        EXPECT_NEAR(turned.transfer(L).x, plain.transfer({0.6f, 0, 0.8f}).x, 1e-5f);
    }
    // Cosines to directions of equal x and z, and of equal y and z, tell the normal's slopes. The
    // pattern's height rises along u so that an amount of 1 is a slope of -1, a facet's by 1.
    for (test::Line const& line : test::table(R"(
flat                        | patternAmount=.5                                     | 0 0
pattern                     | patternAmount=.5 patternEnable=1                     | -.5 0
pattern, either way         | patternAmount=-.25 patternEnable=1                   | .25 0
right half of a facet       | patternAmount=.5 bumpSwitcher=1 uv=1.5,1             | .5 0
left half                   | patternAmount=.5 bumpSwitcher=1 uv=.5,1              | -.5 0
upper half                  | patternAmount=.5 bumpSwitcher=1 uv=1,1.5             | 0 .5
three facets in two units   | patternAmount=.5 bumpSwitcher=1 uv=.5,.33333333 uvScale=3 | .5 0
facets on the pattern       | patternAmount=.5 bumpSwitcher=1 patternEnable=1 uv=1.5,1 | 0 0
other switches              | patternAmount=.5 bumpSwitcher=2 uv=1.5,1             | 0 0
)")) {
        Metal metal("I=0,0,-1 " + line.settings);
        metal.texture("u_patternMap", [](Vec2f p) { return Vec4f(p.x, p.x, p.x, 1) * 100.1f; });
        auto const cosine = [&](Vec3f L) { return (metal.transfer(L), metal.state.sampleCosine); };
        float const up = cosine({0, 0, 1});
        EXPECT_NEAR(cosine({1, 0, 1}) / up - 1, line.want.at(0), 2e-3f) << line.why;
        EXPECT_NEAR(cosine({0, 1, 1}) / up - 1, line.want.at(1), 2e-3f) << line.why;
    }
}

TEST(Metal, BothFacesReflectAndNothingComesFromBelow)
{
    Metal front("N=-.28,0,.96"), back("N=.28,0,-.96");
    back.state.Ng = {0, 0, -1};
    for (float const height : {0.6f, 0.01f, -0.01f}) {
        float const across = -std::sqrt(1 - height * height); // the normal leans there
        Vec3f const value = front.transfer({across, 0, height});
        EXPECT_EQ(value.x > 0, height > 0);
        EXPECT_NEAR(back.transfer({across, 0, height}).x, value.x, 1e-5f);
        front.host.lights.clear();
        front.host.addLight({across, 0, height}, kWhite);
        EXPECT_EQ(front.shade().x > 0, height > 0);
    }
    // Bent so far that the plain mirror direction is below the surface.
    Metal rim("roughValue=.02 anisotropyValue=1 I=-.9165151,0,-.4 N=-.8955,.199,.398");
    rim.host.onTrace = [&](Vec3f, Vec3f d) {
        EXPECT_GT(d.z, 0);
        return kWhite;
    };
    EXPECT_GT(rim.shade().x, 0.7f) << "no black rim";
}

TEST(Metal, ReflectanceGoesFromTheColourThroughTheTintToWhite)
{
    // At the cosine 1/7 Schlick's curve is r0 + (1 - r0) (6/7)^5, times the tint.
    for (test::Line const& line : test::table(R"(
facing       | edgeColor=1,.5,.1  I=0,0,-1                     | .9 .5 .2
grazing      | edgeColor=1,.9,.9  I=-.999992,0,-.004           | .998 .985 .980
tint 1       | edgeColor=1,1,1    I=-.98974332,0,-.14285714    | .946266 .731332 .570131
tint .5, .1  | edgeColor=.5,.5,.1 I=-.98974332,0,-.14285714    | .473133 .365666 .057013
)")) {
        Metal metal("roughValue=0 anisotropyValue=1 reflectColor=.9,.5,.2 " + line.settings);
        metal.host.onTrace = [](Vec3f, Vec3f) { return kWhite; };
        EXPECT_TRUE(test::near(metal.shade(), test::vec3(line.want), 1e-2)) << line.why;
    }
}

TEST(Metal, HolesShowLetThroughAndAreSampledInTheirShare)
{
    // Part of the surface that is left; the table of sampling has what draws show in the mean.
    for (test::Line const& line : test::table(R"(
no metal | cutoutAmount=0 | 0
a half   | cutoutAmount=1 | .5
no more  | cutoutAmount=9 | 1
)")) {
        float const keep = line.want[0];
        Metal solid, metal("cutoutMapEnable=1 cutoutMap=.5,0,0,1 " + line.settings);
        metal.host.onTrace = solid.host.onTrace = [](Vec3f, Vec3f) { return kWhite; };
        metal.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(0, 0, 1, 0.5f); };
        Vec3f const ray = solid.shade(); // always by the same random numbers
        EXPECT_TRUE(test::near(metal.shade(), ray * keep + Vec3f(0, 0, 1 - keep), 1e-5));
        EXPECT_EQ(metal.host.count("traceThrough"), keep < 1);
        EXPECT_EQ(metal.host.count("traceSpecular"), keep > 0);
        metal.material().transmission(&metal.host, metal.state);
        EXPECT_EQ(metal.state.transmissionColor, grey(1 - keep));
        auto const sample = [&](bool reflects, bool transmits) {
            std::fill_n(metal.state.allowReflection, 3, reflects);
            std::fill_n(metal.state.allowTransmission, 3, transmits);
            metal.material().sample(&metal.host, metal.state);
            return metal.state.sampleType;
        };
        EXPECT_EQ(sample(false, false), kSampleNone);
        EXPECT_EQ(sample(true, false), keep > 0 ? kSampleMixture : kSampleNone);
        EXPECT_EQ(sample(false, true), keep < 1 ? kSampleStraight : kSampleNone);
        EXPECT_TRUE(keep == 1 || metal.state.outBrdf == grey(1 - keep)) << "the hole's share";
    }
}

} // namespace
} // namespace zsi
