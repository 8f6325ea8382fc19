// SPDX-License-Identifier: Apache-2.0
#include "lights/voPointLight.h"
#include "lights/voSpotLight.h"
#include "support/textTable.h"

namespace zsi {
namespace {

/// Lights a point at distance d whose direction makes the given cosine with the axis.
/// want: factor on the colour; below 0: the record stays as it is and no ray is spent.
template <class Light>
void expectLit(Light light, float d, float cosine, float want)
{
    static constexpr Vec3f kUntouched(7, 7, 7), kShadow(0.25f, 0.5f, 0.75f);
    test::ScriptedHost host;
    host.onShadow = [](Vec3f, Vec3f) { return kShadow; };
    ShadeState s = test::plainHit();
    s.P = {1, 2, 3};
    s.lightPosition = {4, 5, 6};
    s.lightAxis = {0, 0, -1};
    s.lightToPoint = {std::sqrt(1 - cosine * cosine), 0, -cosine};
    s.lightDistance = d;
    light.color = {1, 2, -4};
    for (bool const casts : {true, false}) {
        light.castShadows = casts;
        s.lightColor = s.lightShadow = kUntouched;
        host.calls.clear();
        light.illumination(&host, s);
        std::vector<test::Call> calls;
        if (casts && !(want < 0))
            calls.push_back({"shadowTransmission", {s.P, s.lightPosition}, {}});
        EXPECT_EQ(host.calls, calls);
        EXPECT_EQ(s.lightShadow, want < 0 ? kUntouched : casts ? kShadow : Vec3f(1, 1, 1));
        if (std::isnan(want))
            EXPECT_TRUE(std::isnan(s.lightColor.x) && std::isnan(s.lightColor.z));
        else // on a cone's rim, 0.95 - 0.9 has lost four bits
            EXPECT_TRUE(test::near(s.lightColor, want < 0 ? kUntouched : light.color * want, 2e-5));
    }
}

TEST(PointLight, FallsOffByThePowerLawUpToItsRange)
{
    constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
    // range, reference distance, exponent, distance: factor
    for (test::Line const& c : test::table(R"(
        1 - (1/2)^2                             | | 1e4 100 2 50        0.75
        clamped, not negative                   | | 1e4 100 2 150       0
        at the range: lit                       | | 50  100 1 50        0.5
        just beyond the range: silent           | | 50  100 1 50.000004 -1
        d^0 = 1                                 | | 1e4 1   0 50        0
        d/0 = infinity                          | | 1e4 0   2 1         0)")) {
        SCOPED_TRACE(c.why);
        voPointLight light;
        light.range = c.want[0];
        light.attenuationFactors = {c.want[1], c.want[2], 9};
        expectLit(light, c.want[3], 1, c.want[4]);
    }
    voPointLight light;
    light.attenuationFactors = {0, 2, 9};
    expectLit(light, 0, 1, kNan); // 0/0 stays NaN through the clamp
    light.attenuationFactors.x = 100;
    expectLit(light, kNan, 1, kNan); // and is not beyond the range
}

TEST(SpotLight, ConeIsFullInsideSmoothOnTheRimAndSilentOutside)
{
    // outer cosine, inner cosine, exponent of the cosine, cosine: factor
    for (test::Line const& c : test::table(R"(
        on the inner rim                         | | 0.9  0.95 0 0.95   1
        half way: 3*(1/2)^2 - 2*(1/2)^3          | | 0.9  0.95 0 0.925  0.5
        a quarter: 3/16 - 2/64                   | | 0.5  0.75 0 0.5625 0.15625
        cosine to the exponent                   | | 0.25 0.25 2 0.5    0.25
        the same on the rim: half of 0.6^2       | | 0.5  0.7  2 0.6    0.18
        on the outer rim                         | | 0.5  0.75 0 0.5    0
        outside                                  | | 0.9  0.95 0 0.899  -1
        inner cone wider than outer: hard edge   | | 0.75 0.5  0 0.75   1
        hard edge, outside                       | | 0.75 0.5  0 0.7499 -1
        behind the axis, wide open: 0^0          | | 0    0    0 -0.5   1
        behind the axis, wide open: 0^1          | | -1   -1   1 -0.5   0
        behind the axis of a narrow cone         | | 0.1  0.2  0 -0.5   -1)")) {
        SCOPED_TRACE(c.why);
        voSpotLight light;
        light.attenuationFactors = {100, 2, c.want[2]};
        light.cosPenumbra = c.want[0];
        light.cosUmbra = c.want[1];
        expectLit(light, 0, c.want[3], c.want[4]);
    }
    voSpotLight light;
    light.range = 10;
    light.attenuationFactors = {20, 1, 0};
    expectLit(light, 10, 1, 0.5f);
    expectLit(light, 10.000001f, 1, -1);
}

} // namespace
} // namespace zsi
