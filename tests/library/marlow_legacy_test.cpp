// SPDX-License-Identifier: Apache-2.0
// The legacy material by numbers worked out by hand: masks, panes, lights, cubes and output.
#include "support/reference.h"
#include "support/textTable.h"

namespace zsi {
namespace {

/// Opaque white paint without highlights, out of range kept.
struct Legacy : test::Subject {
    explicit Legacy(std::string const& settings = "")
        : Subject("MarlowLegacy")
    {
        set("diffuseColor=1,1,1 specularColor=0,0,0 specular2Color=0,0,0 transparencyMode=-1 "
            "usingHDRbuffer=1");
        set(settings);
    }
    Vec4f shadeAll() { return (shade(), state.Ci); }
    void whiteRoom()
    {
        host.onTrace = host.onIndirect = [](Vec3f, Vec3f) { return grey(1); };
        host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 1, 1, 1); };
    }
};
void expectColor(Vec4f got, Vec3f want, float alpha, std::string const& why)
{
    EXPECT_TRUE(test::near(got, withAlpha(want, alpha), 4e-6)) << why;
}

TEST(MarlowLegacy, ShadowRaysKeepWhatMaskAndTransparencyLeave)
{
    // Red of the transmission.
    for (test::Line const& line : test::table(R"(
as made, 80 % clear            |                                                  | .8
inverted                       | transparencyInvert=1                             | .2
colour of the diffuse          | transparencyFromDiffuse=1                        | .3
alpha of its map               | transparencyFromDiffuse=1 diffuseMode=1          | .25
that inverted                  | transparencyFromDiffuse=1 diffuseMode=1 transparencyInvert=1 | .75
mask: 1 - .2 .4                | maskingColor=.6,0,0                                                 | .92
a plain mask is not inverted   | maskingColor=.6,0,0 maskingInvertTexture=1                            | .92
mask map: 1 - .2 .5            | maskingMode=1                                                   | .9
inverted alpha: 1 - .2 .75     | maskingMode=1 maskingFromAlpha=1 maskingInvertTexture=1         | .85
both: 1 - .25 .25              | maskingMode=1 maskingFromAlpha=1 transparencyFromDiffuse=1 diffuseMode=1 transparencyInvert=1 | .9375
what mirrors: .8 .5            | reflectivityColor=.5,0,0                                        | .4
less where clear: .8 (1 - .1)  | reflectivityColor=.5,0,0 transparencyBlocksHighlights=1         | .72
a pane: .8 exp(-2)             | simulatedThickness=2 absorbanceRGB=1,0,0                        | .1082682
)"))
        for (bool const reversed : {false, true}) {
            Legacy l("transparencyMode=0 diffuseColor=.3,0,0 diffuseTexture=.1,.1,.1,.25 "
                     "maskingTexture=.5,.5,.5,.75 "
                     + line.settings);
            l.set("reverseNormal", reversed);
            l.material().transmission(&l.host, l.state);
            EXPECT_NEAR(l.state.transmissionColor.x, line.want[0], 1e-6f) << line.why;
        }
}

TEST(MarlowLegacy, PaneAbsorbsAlongTheWayInsideAndBodyBends)
{
    // Seen at 0.6; green is half clear. In a pane of index 1.5 and thickness 0.5 the way is
    // 0.5 / sqrt(1 - 0.16). What is seen, and the direction there.
    for (test::Line const& line : test::table(R"(
pane              | simulatedThickness=.5 refractiveIndex=1.5 absorbanceRGB=0,2,1    | 1 .1679252 .5795260  .6 -.8
its index below 0 | simulatedThickness=.5 refractiveIndex=-1 absorbanceRGB=0,0,1     | 1 .5 .5352614  .6 -.8
never set         | simulatedThickness=.5 refractiveIndex=1.5                        | 0 0 0          0 1
no pane, no loss  | refractiveIndex=1 absorbanceRGB=0,2,1                            | 1 .5 1         .6 -.8
into the body     | refractiveIndex=1.5                                              | 1 .5 1         .48 -.8772685
out of it         | refractiveIndex=1.5 reverseNormal=1                              | 1 .5 1         .6923077 -.7216024
kept inside       | refractiveIndex=2.6 reverseNormal=1                              | 1 .5 1         .6 .8
)")) {
        Legacy l("transparencyMode=0 transparencyColor=1,.5,1 diffuseColor=0,0,0 I=.6,0,-.8 "
                 + line.settings);
        l.whiteRoom();
        l.state.incomingIor = 1.2f;
        l.state.beyondIor = 1.3f;
        expectColor(l.shadeAll(), test::vec3(line.want), 1, line.why);
        Vec3f const T =
            normalize(l.host.calls.back().vectors[1]); // of lights, where there is no ray
        EXPECT_TRUE(test::near(T, {line.want.at(3), 0, line.want.at(4)}, 1e-5)) << line.why;
    }
}

/// Lights and rays of random layers: shares of white add up to 1 on every channel, and a light
/// shows what a path tracer gets from `transfer`, whatever faces where.
TEST(MarlowLegacy, WhiteVanishesInAWhiteRoomAndLightsShadeAsTransferSays)
{
    test::Random random;
    int lit = 0;
    for (int i = 0; i < 2000; ++i) {
        Legacy l("transparencyMode=0 fresnel=.05,.9,3,1");
        for (char const* color : {"specularColor", "specular2Color", "transparencyColor",
                                  "reflectivityColor", "maskingColor"}) {
            Vec3f const c = random.color() * 0.7f;
            l.set(color, {c.x, c.y, c.z});
        }
        l.set("specularREG", {random.in(0, 1), random.in(0.1f, 0.9f), random.in(0, 1.5f)});
        l.set("specular2REG", {random.in(0, 1), random.in(0.1f, 0.9f), random.in(0, 1.5f)});
        l.set("surfaceRoughness", random.in(0.1f, 0.8f));
        l.set("refractiveIndex", i % 3 ? 1.0f : 1.3f);
        for (char const* flag : {"transparencyBlocksHighlights", "useUniformReflectivity",
                                 "reflectLight", "reverseNormal", "faceForward", "faceLight"})
            l.set(flag, random.in(0, 1) < 0.5f);
        l.state = test::randomHit(random, i % 4 < 2);
        l.whiteRoom();
        expectColor(l.shadeAll(), grey(1), 1, "white room");

        l.host.onTrace = l.host.onIndirect = nullptr;
        l.host.onThrough = nullptr;
        Vec3f const L = random.unit(), color = random.color();
        Vec3f const value = l.transfer(L);
        Vec3f const want = value * color * (l.state.sampleCosine * 3.14159265f);
        if (want == Vec3f(0, 0, 0)) // a host does not list lights behind the normal
            continue;
        l.host.addLight(L, color, grey(1), l.state.sampleCosine);
        ASSERT_TRUE(test::near(l.shade(), want, 1e-4 * double(length(want)) + 1e-6)) << i;
        ++lit;
    }
    EXPECT_GT(lit, 1000);
}

TEST(MarlowLegacy, RaysThatGatherLightSeeWideHighlightsAndMattMirrors)
{
    Legacy camera("diffuseColor=0,0,0 specularColor=1,1,1"),
        gathering("diffuseColor=0,0,0 specularColor=1,1,1");
    gathering.state.rayType = kRayDiffuse;
    Vec3f const L = normalize({0, 0.02f, 1});
    auto const value = [&](Legacy& l, float width) {
        return (l.set("specularREG", {0, width, 1}), l.transfer(L).x);
    };
    EXPECT_EQ(value(gathering, 0.02f), value(camera, 0.3f));
    EXPECT_EQ(value(gathering, 0.3f), value(camera, 0.3f));
    EXPECT_EQ(value(gathering, 0.4f), value(camera, 0.4f));
    EXPECT_GT(value(camera, 0.02f), 10 * value(camera, 0.3f));

    Legacy l("diffuseColor=0,0,0 specularColor=.5,.5,.5 specularREG=0,.1,1 "
             "reflectivityColor=.25,.25,.25");
    l.host.onIndirect = [](Vec3f, Vec3f) { return grey(4); };
    EXPECT_EQ(l.shade().x, 0);
    l.state.rayType = kRayDiffuse;
    EXPECT_NEAR(l.shade().x, 4 * 0.75f, 1e-6f); // highlight and reflection
    EXPECT_EQ(l.host.count("traceSpecular"), 0);
}

TEST(MarlowLegacy, BumpLeansByItsDepth)
{
    Legacy l("bumpMode=1 bumpTexture=1,.5,1,1"); // 45 degrees towards rising u
    for (float const depth : {1.0f, 2.0f, -0.5f, 0.0f})
        for (bool const reversed : {false, true}) {
            l.set("bumpDepth", depth);
            l.set("reverseNormal", reversed);
            l.shade();
            Vec3f const want = normalize(Vec3f(depth, 0, reversed ? -1.0f : 1.0f));
            EXPECT_TRUE(test::near(l.host.calls.at(0).vectors[1], want, 1e-6)) << depth;
        }
}

TEST(MarlowLegacy, ReceivesLightsAndTheirTintedShadow)
{
    // The light's shadow; what a light of (2, 1, 4) shows.
    for (test::Line const& line : test::table(R"(
open            |                      | 1 1 1    2 1 4
shadow as it is |                      | .5 0 1   1 0 4
half as strong  | shadowIntensity=.5   | 0 0 0    1 .5 2
tinted          | shadowColor=0,0,.5   | 0 .5 0   0 .5 2
gain            | diffuseLightGainValue=3 | 1 1 1 6 3 12
)"))
        for (bool const reversed : {false, true}) {
            Legacy l(line.settings + " faceLight=1"); // which makes both sides one
            l.host.addLight({0, 0.6f, 0.8f}, {4, 2, 8}, test::vec3(line.want), 0.5f);
            l.set("reverseNormal", reversed);
            expectColor(l.shadeAll(), test::vec3(line.want, 3), 1, line.why);
            EXPECT_EQ(l.host.calls.at(0).scalars[0], -1024.0f);
            EXPECT_EQ(l.host.count("getLightSamples"), 2);
            l.set("faceLight=0");
            l.shade();
            EXPECT_EQ(l.host.calls.at(0).vectors[1], Vec3f(0, 0, reversed ? -1.0f : 1.0f));
        }
}

TEST(MarlowLegacy, OutputSwitches)
{
    // Red, blue and alpha, lit by 2 and seeing white of alpha 0.5 behind.
    for (test::Line const& line : test::table(R"(
lit             |                                          | 1 4 1
clamped         | usingHDRbuffer=0                         | 1 1 1
shines          | selfIlluminance=1                        | 1.5 6 1
unlit           | unlitSurface=1                           | .5 2 1
cut and clear   | unlitSurface=1 maskingColor=.5,.5,.5 transparencyMode=0 transparencyColor=.5,.5,.5 | .875 1.25 .625
without alpha   | unlitSurface=1 maskingColor=.5,.5,.5 useAlpha=0 | .75 1.5 1
cut out         | maskingColor=1,1,1                       | 0 0 0
)")) {
        Legacy l("diffuseColor=.5,.25,2 " + line.settings);
        l.host.addLight({0, 0, 1}, {2, 2, 2});
        l.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(1, 1, 1, 0.5f); };
        Vec4f const c = l.shadeAll();
        EXPECT_TRUE(test::near(Vec3f(c.x, c.z, c.w), test::vec3(line.want), 1e-6)) << line.why;
        EXPECT_EQ(l.state.discardHit, line.why.starts_with("cut out"));
    }
}

TEST(MarlowLegacy, ShowsNormalsAndOcclusionAsTheUtilityMaterialsDo)
{
    for (char const* name : {"corvid_Mtl_NormalsOnly", "corvid_Mtl_AmbientOnly"})
        for (std::string const settings : name[11] == 'N'
                 ? std::vector{"", "reverseNormal=1", "faceForward=1 I=0,0,1", "I=0,0,1",
                               "faceLight=1 I=0,0,1"}
                 : std::vector{"", "usingRaytracedAO=1", "ambientOcclusionMode=2"}) {
            std::string const show = std::string(" show") + (name + 11) + "=1";
            Legacy legacy(settings + show);
            test::Subject utility(name);
            utility.set(settings + (name[11] == 'N' ? "" : show));
            legacy.host.onOcclusion = utility.host.onOcclusion = [](Vec3f, Vec3f n) {
                return Vec3f(0.5f, 0.6f, 0.7f) + n * 0.1f;
            };
            EXPECT_EQ(legacy.shade(), utility.shade()) << settings << show;
        }
}

TEST(MarlowLegacy, CubesReplaceOrAddAndAreGradedFromTheGeneralToTheParticular)
{
    auto const cube = [](Vec3f v) { return Vec4f(0.2f + 0.1f * v.x, 0.5f, 0.3f - 0.1f * v.y, 1); };
    for (float const mode : {-1.0f, 0.0f, 1.0f}) {
        Legacy l("globalIllumIntensity=2");
        l.host.onIndirect = l.host.onTrace = [](Vec3f, Vec3f) { return Vec3f(0.25f, 0, 0); };
        l.set("IBLDiffMode", mode);
        l.set("IBLSpecMode", mode);
        for (char const* name : {"diffuseIBLCube", "specularIBLCube", "reflectionCubeIBL"})
            l.cube(name, cube);
        // Neutral at the defaults: +z looks up (0, 1, 0).
        Vec3f const hosts = mode == 0 ? Vec3f(0, 0, 0) : Vec3f(0.5f, 0, 0);
        Vec3f const cubes = mode < 0 ? Vec3f(0, 0, 0) : Vec3f(0.2f, 0.5f, 0.2f);
        expectColor(l.shadeAll(), hosts + cubes, 1, "diffuse");
        l.set("specularColor=1,1,1 specularREG=0,.3,1"); // a mirror but for its width
        expectColor(l.shadeAll(), hosts * 0.5f + cubes, 1, "highlight");
        l.set("specularColor=0,0,0 reflectivityColor=1,1,1");
        l.set("useReflectionCubeIBL", mode >= 0);
        expectColor(l.shadeAll(), mode < 0 ? Vec3f(0.25f, 0, 0) : cubes, 1, "reflection");
    }
    // 0.4, 1, 0.4 by the gain of all; 0.6, 1.8, 0.6 by the contrast of the channel.
    Legacy l("IBLDiffMode=0 globalIBLGainValue=2 diffuseIBLChannelContrastPivot=.2,.2,.2 "
             "diffuseIBLChannelContrastValue=2 diffuseIBLGainColor=1,.5,0 diffuseIBLGainSource=1");
    l.cube("diffuseIBLCube", cube);
    expectColor(l.shadeAll(), {0.6f, 0.9f, 0}, 1, "one after the other");
}

} // namespace
} // namespace zsi
