// SPDX-License-Identifier: Apache-2.0
// Metal: what its maps do to the lobe, its two faces and its holes.
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

TEST(Metal, LobeTurnsWithItsRotation)
{
    // The brushed lobe head-on: lights turned with it show the same.
    for (float const angle : {0.3f, -1.2f, 1.5707963f}) {
        Metal turned("I=0,0,-1"), plain("I=0,0,-1");
        turned.set("u_anisoRotationValue", angle);
        Vec3f const L(0.6f * std::cos(angle), 0.6f * std::sin(angle), 0.8f);
        EXPECT_NEAR(turned.transfer(L).x, plain.transfer({0.6f, 0, 0.8f}).x, 1e-5f);
    }
    Metal lost("anisoRotationValue=nan"), far("anisoRotationValue=inf"), level;
    EXPECT_EQ(lost.transfer({0.6f, 0, 0.8f}), level.transfer({0.6f, 0, 0.8f}));
    EXPECT_EQ(far.transfer({0.6f, 0, 0.8f}), level.transfer({0.6f, 0, 0.8f}));
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
