#include "lights/voSpotLight.h"
#include "support/record.h"
#include "support/scriptedHost.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

struct Cone {
    char const* why;
    float cosine;
    float want;
    bool writes;
};
constexpr Cone kCones[] = {
    {"on the axis", 1.0f, 1.0f, true},
    {"on the inner rim", 0.95f, 1.0f, true},
    {"half way: 3*(1/2)^2 - 2*(1/2)^3", 0.925f, 0.5f, true},
    {"outside: record untouched", 0.899f, 0.0f, false},
};

TEST(SpotLight, ConeIsFullInsideSmoothOnTheRimAndSilentOutside)
{
    voSpotLight light;
    light.color = {1, 1, 1};
    light.attenuationFactors = {100, 2, 0};
    for (Cone const& cone : kCones) {
        test::ScriptedHost host;
        ShadeState state = test::plainHit();
        state.lightColor = {7, 7, 7};
        state.lightAxis = {0, 0, -1};
        state.lightToPoint = {std::sqrt(1 - cone.cosine * cone.cosine), 0, -cone.cosine};
        state.lightDistance = 0.0f;
        light.illumination(&host, state);
        EXPECT_NEAR(state.lightColor.x, cone.writes ? cone.want : 7.0f, 1e-5f) << cone.why;
        EXPECT_EQ(host.count("shadowTransmission"), cone.writes ? 1 : 0) << cone.why;
    }
}

} // namespace
} // namespace zsi
