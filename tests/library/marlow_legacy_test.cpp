// SPDX-License-Identifier: Apache-2.0
// The legacy material by its properties; its numbers are in tests/data/shading/legacy.txt.
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
};

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
        l.set("trace=1,1,1 indirect=1,1,1 through=1,1,1,1");
        ASSERT_TRUE(test::near(l.shade(), Vec3f(1, 1, 1), 4e-6)) << "white room";

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

} // namespace
} // namespace zsi
