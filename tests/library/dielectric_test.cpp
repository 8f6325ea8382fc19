// SPDX-License-Identifier: Apache-2.0
// Numbers of the tables: Walter et al. 2007, eq. 21, 33 and 34, and Schlick's reflectance, in
// double precision, for an index of 1.5 and a reflectance of 1/4.
#include "materials/physical/corvid_Mtl_Dielectric.h"
#include "support/textTable.h"

namespace zsi {
namespace {

/// The tangent leans out of the surface and the object is turned: in the world, the frame of the
/// front is (0, 1, 0), (-1, 0, 0), (0, 0, 1). The geometric normal is not the shading normal.
struct Glass : test::Trial<corvid_Mtl_Dielectric> {
    explicit Glass(Vec3f I)
    {
        shader.maskingMode = -1;
        shader.u_ior = 1.5f;
        shader.u_reflectance = 0.25f;
        state.I = I;
        state.Ng = {0, 0.28f, 0.96f};
        state.objectToWorld = Mat4f(0, 2, 0, 0, -2, 0, 0, 0, 0, 0, 2, 0, 9, 9, 9, 1);
        test::setAttribute(state, 36, Vec3f(1, 0, 1));
        test::setAttribute(state, 48, Vec2f(0.5f, 0.25f));
    }
};

TEST(Dielectric, TransferIsTheFacetModelOnBothSides)
{
    // I, direction, index, index outside: value
    for (test::Line const& c : test::table(R"(
        mirror                        | | 0.6,0,-0.8  0.6,0,0.8       1.5 1     0.1164087
        off the mirror                | | 0.6,0,-0.8  0,0.6,0.8       1.5 1     0.04231901
        as Snell bends                | | 0.6,0,-0.8  0.4,0,-0.916515 1.5 1     6.214723
        straight on                   | | 0.6,0,-0.8  0.6,0,-0.8      2   1.25  2.293094
        from inside, reflected        | | 0.6,0,0.8   0,0.6,-0.8      1.5 1     0.04231901
        from inside nothing comes out | | 0.6,0,0.8   0.6,0,0.8       1.5 1.25  0)")) {
        Glass g(test::vec3(c.want));
        g.shader.u_ior = c.want[6];
        g.shader.u_roughValue = 0.5f;
        (g.state.I.z < 0 ? g.state.incomingIor : g.state.beyondIor) = c.want[7];
        g.state.sampleDirection = test::vec3(c.want, 3);
        g.shader.transfer(&g.host, g.state);
        EXPECT_TRUE(test::near(g.state.outBrdf, grey(c.want[8]), 1e-5 * double(c.want[8])))
            << c.why;
        EXPECT_NEAR(g.state.sampleCosine, std::fabs(c.want[5]), 1e-6f) << c.why;
    }
}

/// Facets are drawn from the first two numbers, the event from the last.
TEST(Dielectric, SamplesFacetThenEvent)
{
    // I, roughness, reflection and transmission allowed, numbers drawn (-1: none): type, direction,
    // value, index of the medium that it goes on in
    for (test::Line const& c : test::table(R"(
        nothing allowed    | | 0.6,0,-0.8 0       0 0 -1 -1 -1      0
        reflection         | | 0.6,0,-0.8 0       1 0 -1 -1 -1      32 0.6,0,0.8        0.25024 1
        refraction         | | 0.6,0,-0.8 0       0 1 -1 -1 -1      32 0.4,0,-0.916515  0.74976 1.5
        chance             | | 0.6,0,-0.8 0       1 1 0.2501 -1 -1  32 0.6,0,0.8        1 1
        other chance       | | 0.6,0,-0.8 0       1 1 0.2503 -1 -1  32 0.4,0,-0.916515  1 1.5
        a tie reflects     | | 0,0,-1     0       1 1 0.25 -1 -1    32 0,0,1            1 1
        0.01 is rough      | | 0,0,-1     0.01    1 0 0 0 -1        16 0,0,1            0.25 1
        less is not        | | 0,0,-1     0.00999 1 0 -1 -1 -1      32 0,0,1            0.25 1
        out, never rough   | | 0.28,0,0.96 0.5    0 1 -1 -1 -1      32 0.35,0,0.936750  0.75 1.2
        total              | | 0.96,0,0.28 0.5    1 1 0.99 -1 -1    32 0.96,0,-0.28     1 1.5
        total, not allowed | | 0.96,0,0.28 0.5    0 1 -1 -1 -1      0
        rough reflection   | | 0.6,0,-0.8 0.5     1 0 0.5 0.25 -1   16 -0.28,0,0.96     0.331015 1
        rough refraction   | | 0.6,0,-0.8 0.5     1 1 0.5 0.25 0.5  16 0.550689,0,-0.834711 1.295456 1.5
        weight of 7 ends at 4 | | 0,-0.998749,-0.05 0.2 1 0 0.95 0 -1   16 0,-0.0866601,0.996238 3.321343 1
        facet faces away   | | 0,-0.998749,-0.05 0.2 1 0 0.95 0.5 -1 0)"))
        for (int which : {0, 1, 2}) { // any of the three switches
            SCOPED_TRACE(c.why);
            Glass g(test::vec3(c.want));
            g.shader.u_roughValue = c.want[3];
            g.state.beyondIor = 1.2f;
            g.state.allowReflection[which] = c.want[4] != 0;
            g.state.allowTransmission[2 - which] = c.want[5] != 0;
            g.host.randoms = {c.want[6], c.want[7], c.want[8], -1};
            auto const drawn = std::find(g.host.randoms.begin(), g.host.randoms.end(), -1.0f);
            g.shader.sample(&g.host, g.state);
            EXPECT_EQ(g.host.randomCalls, drawn - g.host.randoms.begin());
            ASSERT_EQ(g.state.sampleType, static_cast<unsigned>(c.want[9]));
            if (g.state.sampleType == 0)
                continue;
            EXPECT_TRUE(test::near(g.state.sampleDirection, test::vec3(c.want, 10), 2e-6));
            EXPECT_TRUE(test::near(g.state.outBrdf, grey(c.want[13]), 1e-5));
            EXPECT_EQ(g.state.beyondIor, c.want[14]);
            EXPECT_EQ(g.state.sampleCosine * g.state.sampleInvPdf, 1);
        }
}

TEST(Dielectric, ShadesLightsReflectionAndAbsorbedRefraction)
{
    // Rays bring (1, 1, 1); the light's weight is 3/4; absorption is along a path of 1/4.
    // I, light, reflection and refraction colour, absorbs, mapped, refracted ray: result
    for (test::Line const& c : test::table(R"(
        light         | L   | 0.6,0,-0.8  0.6,0,0.8             0   0   1 1  0,0,0  0.0873066 0.0873066 0.0873066
        low light     | L   | 0.6,0,-0.8  0.988686,0.042,0.144  0   0   1 1  0,0,0  0.0528830 0.0528830 0.0528830
        light below   | L   | 0.6,0,-0.8  0.4,0,-0.916515       0   0   1 1  0,0,0  0 0 0
        from outside  | LSR | 0.6,0,-0.8  0.4,0,-0.916515       0.5 0.5 1 1  0.4,0,-0.916515     0.5 0.37488 0.37488
        from inside   | LR  | 0.28,0,0.96 0,0.28,0.96           0.5 0.5 0 1  0.42,0,0.907524     0.5 0.5 0.5
        absorbed      | LR  | 0.28,0,0.96 0.4,0,-0.916515       0.5 1   1 0  0.42,0,0.907524     0.794328 0.630957 0.501187
        by the map    | LR  | 0.28,0,0.96 0.4,0,-0.916515       0.5 1   1 1  0.42,0,0.907524     0.136008 0.517201 0.717124
        total         | LR  | 0.96,0,0.28 0.4,0,-0.916515       0.5 1   0 0  0.96,0,-0.28        1 1 1)")) {
        SCOPED_TRACE(c.why);
        Glass g(test::vec3(c.want));
        bool const front = g.state.I.z < 0, absorbs = c.want[8] != 0, mapped = c.want[9] != 0;
        float const refracts = c.want[7];
        test::FunctionTexture<Vec2f> map([](Vec2f) { return Vec4f(0.5f, 0.8f, 1, 1); });
        g.shader.u_roughValue = 0.25f;
        g.shader.u_reflectColor = {c.want[6], 0, 0};
        g.shader.u_refractColor = grey(refracts);
        g.shader.u_absorptionCoef = {0.4f, 0.8f, 1.2f};
        g.shader.u_falloffEnable = absorbs;
        g.shader.u_transmittanceMapEnable = mapped;
        g.shader.u_transmittanceAmount = 0.5f;
        g.shader.u_transmittanceMap.texture = &map;
        g.state.P = {1, 2, 3};
        g.state.E = {1, 2.25f, 3};
        g.host.addLight(test::vec3(c.want, 3), {2, 1, 1}, {0.5f, 1, 1}, 0.75f);
        g.host.onTrace = [](Vec3f, Vec3f) { return Vec3f(1, 1, 1); };
        g.shade();
        EXPECT_TRUE(test::near(g.state.Ci, withAlpha(test::vec3(c.want, 13), 1), 2e-6));
        EXPECT_EQ(map.lookups.size(), !front && absorbs && mapped);
        std::string calls = " ";
        for (test::Call const& call : g.host.calls) {
            bool const lights = call.service == "getLightSamples";
            bool const refracted = call.service == "traceRefraction";
            calls += lights ? 'L' : refracted ? 'R' : 'S';
            EXPECT_EQ(call.vectors[0], g.state.P);
            if (lights) {
                EXPECT_EQ(call.vectors[1], g.state.N) << "as it is, from inside too";
                continue;
            }
            Vec3f const d = refracted ? test::vec3(c.want, 10) : Vec3f(0.6f, 0, 0.8f);
            EXPECT_TRUE(test::near(call.vectors[1], d, 1e-6));
            EXPECT_EQ(call.scalars[0], 0.25f) << "spread";
            float const F = front ? 0.25024f : 0;
            EXPECT_NEAR(call.scalars[1], refracted ? refracts * (1 - F) : c.want[6] * F, 1e-6f);
        }
        EXPECT_EQ(calls, c.settings.substr(0, calls.size()));

        // Shadow rays are absorbed inside whatever the switch says, and know no map.
        g.shader.transmission(&g.host, g.state);
        float const left = front ? 0.74976f : (g.state.I.z > 0.5f ? 0.75f : 0.6048812f) * 0.630957f;
        EXPECT_NEAR(g.state.transmissionColor.y, refracts * left, 1e-6f);
    }
}

/// Downhill is -x for the maps (slope 0.04 x 2 x 3.33), -y for the ripple (0.2 x 2 x 1.5 x 0.25),
/// whose normal stays unnormalised.
TEST(Dielectric, BendsItsFrameByTheFirstMapOrTheRippleThenTheSecondMap)
{
    // first map, second map, ripple mode: ripples, normal
    for (test::Line const& c : test::table(R"(
        other ripple modes             | | 0 1 2  0  -0.257422 0 0.966299
        ripple                         | | 0 0 1  1  0 -0.15 1
        the first map stops the ripple | | 1 0 1  0  -0.257422 0 0.966299
        the second does not            | | 0 1 1  1  -0.254760 -0.143446 0.956306
        both maps                      | | 1 1 1  0  -0.497492 0 0.867468)")) {
        SCOPED_TRACE(c.why);
        bool const hasFirst = c.want[0] != 0, hasSecond = c.want[1] != 0;
        auto const slope = [](Vec2f p) { return Vec4f(40 * p.x, 0, 0, 1); };
        test::FunctionTexture<Vec2f> first(slope), second(slope);
        Glass t({0, 0, -1});
        t.state.objectToWorld = Mat4f::identity();
        t.host.onNoise = [](Vec4f p) { return 0.2f * p.y; };
        corvid_Mtl_Dielectric& glass = t.shader;
        glass.u_normal0MapEnable = hasFirst;
        glass.u_normal1MapEnable = hasSecond;
        glass.u_procedureMapEnable = int(c.want[2]);
        glass.u_normal0Map.texture = &first;
        glass.u_normal1Map.texture = &second;
        glass.u_normal0Transform = glass.u_normal1Transform = Mat3f::identity();
        glass.u_normal0UVScale = 0.5f;
        glass.u_normal0Amount = glass.u_normal1Amount = 2;
        glass.u_procedureMapAmount = 0.25f;
        // `sample` reads the bumps, then the roughness, and draws at last; `shade` in that order.
        std::string order;
        first.texel = [&](Vec2f p) { return order += "1", slope(p); };
        second.texel = [&](Vec2f p) { return order += "2", slope(p); };
        test::FunctionTexture<Vec2f> rough([&](Vec2f) {
            EXPECT_EQ(t.host.randomCalls, 0);
            EXPECT_EQ(t.host.noiseCalls % 12, c.want[3] != 0 ? 6 : 0);
            t.host.noiseCalls = 0;
            return order += "r", Vec4f(0.5f, 0, 0, 1);
        });
        glass.u_roughMapEnable = true;
        glass.u_roughMap.texture = &rough;
        t.shade();
        EXPECT_TRUE(!hasFirst || first.lookups[0].x == 0.25f) << "its own scale";
        EXPECT_TRUE(!hasSecond || second.lookups[0].x == 0.5f) << "always scale 1";
        EXPECT_TRUE(test::near(t.host.calls[0].vectors[1], test::vec3(c.want, 4), 1e-4));
        t.state.allowReflection[0] = t.state.allowTransmission[0] = 1;
        glass.sample(&t.host, t.state);
        std::string const once =
            std::string(hasFirst ? "111" : "") + (hasSecond ? "222" : "") + "r";
        EXPECT_EQ(order, once + once);
        EXPECT_EQ(t.host.randomCalls, 3);
    }
}

/// What breaks a formula gives nothing, not NaN: facets of no width met exactly, no tangent, equal
/// indices, a ripple's long normal under wide facets.
TEST(Dielectric, DegenerateInputIsNeutral)
{
    Vec3f const mirrored(0.6f, 0, 0.8f), straight(0.6f, 0, -0.8f),
        tangents[] = {{1, 0, 0}, {0, 0, 1}};
    for (int i = 0; i < 24; ++i) {
        Glass g(straight);
        g.shader.u_roughValue = i % 3 == 0 ? 0.0f : i % 3 == 1 ? 1e-30f : 4.0f;
        g.shader.u_ior = i & 4 ? 1 : 1.5f;
        g.shader.u_procedureMapEnable = i / 12;
        g.shader.u_procedureMapAmount = 3;
        g.host.onNoise = [](Vec4f p) { return 0.5f * p.x; };
        test::setAttribute(g.state, 36, tangents[i % 2]);
        for (Vec3f const& d : {mirrored, straight}) {
            g.host.addLight(d, {1, 1, 1});
            g.state.sampleDirection = d;
            g.shader.transfer(&g.host, g.state);
            EXPECT_TRUE(std::isfinite(g.shade().x + g.state.outBrdf.x)) << i;
        }
    }
}

} // namespace
} // namespace zsi
