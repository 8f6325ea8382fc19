#include "lights/voPointLight.h"
#include "lights/voSpotLight.h"
#include "support/scriptedHost.h"

#include <limits>

namespace zsi {
namespace {

constexpr Vec3f kUntouched(7, 7, 7);
constexpr Vec3f kShadow(0.25f, 0.5f, 0.75f);
constexpr Vec3f kColor(1, 2, -4);

/// Lights a point at distance d whose direction makes the given cosine with the axis.
/// want: factor on the colour; lit: else the record stays as it is and no ray is spent.
template <class Light>
void expectLit(Light light, float d, float cosine, float want, bool lit)
{
    test::ScriptedHost host;
    host.onShadow = [](Vec3f, Vec3f) { return kShadow; };
    ShadeState s = test::plainHit();
    s.P = {1, 2, 3};
    s.lightPosition = {4, 5, 6};
    s.lightAxis = {0, 0, -1};
    s.lightToPoint = {std::sqrt(1 - cosine * cosine), 0, -cosine};
    s.lightDistance = d;
    light.color = kColor;
    for (light.castShadows = true;; light.castShadows = false) {
        s.lightColor = s.lightShadow = kUntouched;
        host.calls.clear();
        light.illumination(&host, s);
        bool const asks = lit && light.castShadows;
        ASSERT_EQ(host.calls.size(), asks);
        if (asks) {
            EXPECT_EQ(host.calls[0],
                      (test::Call{"shadowTransmission", {s.P, s.lightPosition}, {}}));
        }
        EXPECT_EQ(s.lightShadow, !lit ? kUntouched : asks ? kShadow : Vec3f(1, 1, 1));
        if (std::isnan(want))
            EXPECT_TRUE(std::isnan(s.lightColor.x) && std::isnan(s.lightColor.z));
        else // on a cone's rim, 0.95 - 0.9 has lost four bits
            EXPECT_TRUE(test::near(s.lightColor, lit ? kColor * want : kUntouched, 1.6e-5));
        if (!light.castShadows)
            return;
    }
}

TEST(PointLight, FallsOffByThePowerLawUpToItsRange)
{
    struct Case {
        char const* why;
        float range, reference, exponent, d, want;
        bool lit;
    };
    constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
    constexpr Case kCases[] = {
        {"1 - (1/2)^2", 1e4f, 100, 2, 50, 0.75f, true},
        {"clamped, not negative", 1e4f, 100, 2, 150, 0, true},
        {"at the range: lit", 50, 100, 1, 50, 0.5f, true},
        {"just beyond the range: silent", 50, 100, 1, 50.000004f, 0, false},
        {"d^0 = 1", 1e4f, 1, 0, 50, 0, true},
        {"0/0 stays NaN through the clamp", 1e4f, 0, 2, 0, kNan, true},
        {"a NaN distance is not beyond the range", 1e4f, 100, 2, kNan, kNan, true},
        {"d/0 = infinity", 1e4f, 0, 2, 1, 0, true},
    };
    for (Case const& c : kCases) {
        SCOPED_TRACE(c.why);
        voPointLight light;
        light.range = c.range;
        light.attenuationFactors = {c.reference, c.exponent, 9};
        expectLit(light, c.d, 1, c.want, c.lit);
    }
}

TEST(SpotLight, ConeIsFullInsideSmoothOnTheRimAndSilentOutside)
{
    struct Cone {
        char const* why;
        float penumbra, umbra, exponent, cosine, want;
        bool lit;
    };
    constexpr Cone kCones[] = {
        {"on the inner rim", 0.9f, 0.95f, 0, 0.95f, 1.0f, true},
        {"half way: 3*(1/2)^2 - 2*(1/2)^3", 0.9f, 0.95f, 0, 0.925f, 0.5f, true},
        {"a quarter: 3/16 - 2/64", 0.5f, 0.75f, 0, 0.5625f, 0.15625f, true},
        {"cosine to the exponent", 0.25f, 0.25f, 2, 0.5f, 0.25f, true},
        {"the same on the rim: half of 0.6^2", 0.5f, 0.7f, 2, 0.6f, 0.18f, true},
        {"on the outer rim", 0.5f, 0.75f, 0, 0.5f, 0.0f, true},
        {"outside", 0.9f, 0.95f, 0, 0.899f, 0, false},
        {"inner cone wider than outer: hard edge", 0.75f, 0.5f, 0, 0.75f, 1, true},
        {"hard edge, outside", 0.75f, 0.5f, 0, 0.7499f, 0, false},
        {"behind the axis, wide open: 0^0", 0, 0, 0, -0.5f, 1, true},
        {"behind the axis, wide open: 0^1", -1, -1, 1, -0.5f, 0, true},
        {"behind the axis of a narrow cone", 0.1f, 0.2f, 0, -0.5f, 0, false},
    };
    voSpotLight light;
    for (Cone const& c : kCones) {
        SCOPED_TRACE(c.why);
        light.attenuationFactors = {100, 2, c.exponent};
        light.cosPenumbra = c.penumbra;
        light.cosUmbra = c.umbra;
        expectLit(light, 0, c.cosine, c.want, c.lit);
    }
    light = {};
    light.range = 10;
    light.attenuationFactors = {20, 1, 0};
    expectLit(light, 10, 1, 0.5f, true);
    expectLit(light, 10.000001f, 1, 0, false);
}

} // namespace
} // namespace zsi
