#include "lights/voPointLight.h"
#include "lights/voSpotLight.h"
#include "support/record.h"
#include "support/scriptedHost.h"

#include <gtest/gtest.h>
#include <limits>

namespace zsi {
namespace {

constexpr Vec3f kUntouched(7, 7, 7);
constexpr Vec3f kShadow(0.25f, 0.5f, 0.75f);

struct Lit {
    Vec3f color, shadow;
    int queries;
};

/// A light at distance d whose axis makes the given cosine with the direction to the point.
template <class Light>
Lit illuminate(Light const& light, float d, float cosine = 1.0f)
{
    test::ScriptedHost host;
    host.onShadow = [](Vec3f, Vec3f) { return kShadow; };
    ShadeState state = test::plainHit();
    state.P = {1, 2, 3};
    state.lightPosition = {4, 5, 6};
    state.lightAxis = {0, 0, -1};
    state.lightToPoint = {std::sqrt(1 - cosine * cosine), 0, -cosine};
    state.lightDistance = d;
    state.lightColor = state.lightShadow = kUntouched;
    light.illumination(&host, state);
    for (test::Call const& call : host.calls) {
        EXPECT_EQ(call.service, "shadowTransmission");
        EXPECT_EQ(call.vectors[0], Vec3f(1, 2, 3)) << "from the point";
        EXPECT_EQ(call.vectors[1], Vec3f(4, 5, 6)) << "to the light";
    }
    return {state.lightColor, state.lightShadow, static_cast<int>(host.calls.size())};
}

double clamped(double t) { return 0 > t ? 0 : t > 1 ? 1 : t; }

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
        {"dark at the reference distance", 1e4f, 100, 2, 100, 0, true},
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
        light.color = {1, 2, -4};
        light.range = c.range;
        light.attenuationFactors = {c.reference, c.exponent, 9};
        Lit const got = illuminate(light, c.d);
        EXPECT_EQ(got.queries, c.lit);
        EXPECT_EQ(got.shadow, c.lit ? kShadow : kUntouched);
        if (!c.lit)
            EXPECT_EQ(got.color, kUntouched);
        else if (std::isnan(c.want))
            EXPECT_TRUE(std::isnan(got.color.x) && std::isnan(got.color.z));
        else
            EXPECT_EQ(got.color, Vec3f(c.want, 2 * c.want, -4 * c.want));
    }
    voPointLight unshadowed;
    unshadowed.castShadows = false;
    Lit const got = illuminate(unshadowed, 1);
    EXPECT_EQ(got.queries, 0);
    EXPECT_EQ(got.shadow, Vec3f(1, 1, 1));
}

TEST(SpotLight, ConeIsFullInsideSmoothOnTheRimAndSilentOutside)
{
    struct Cone {
        char const* why;
        float penumbra, umbra, exponent, cosine, want;
        bool lit;
    };
    constexpr Cone kCones[] = {
        {"on the axis", 0.9f, 0.95f, 0, 1.0f, 1.0f, true},
        {"on the inner rim", 0.9f, 0.95f, 0, 0.95f, 1.0f, true},
        {"half way: 3*(1/2)^2 - 2*(1/2)^3", 0.9f, 0.95f, 0, 0.925f, 0.5f, true},
        {"a quarter: 3/16 - 2/64", 0.5f, 0.75f, 0, 0.5625f, 0.15625f, true},
        {"on the outer rim", 0.5f, 0.75f, 0, 0.5f, 0.0f, true},
        {"outside: record untouched, no query", 0.9f, 0.95f, 0, 0.899f, 0, false},
        {"inner cone wider than outer: hard edge", 0.75f, 0.5f, 0, 0.75f, 1, true},
        {"hard edge, outside", 0.75f, 0.5f, 0, 0.7499f, 0, false},
        {"cosine to the exponent", 0.25f, 0.25f, 2, 0.5f, 0.25f, true},
        {"behind the axis, wide open: 0^0", 0, 0, 0, -0.5f, 1, true},
        {"behind the axis, wide open: 0^1", -1, -1, 1, -0.5f, 0, true},
        {"behind the axis of a narrow cone", 0.1f, 0.2f, 0, -0.5f, 0, false},
    };
    for (Cone const& c : kCones) {
        SCOPED_TRACE(c.why);
        voSpotLight light;
        light.color = {1, 2, -4};
        light.attenuationFactors = {100, 2, c.exponent};
        light.cosPenumbra = c.penumbra;
        light.cosUmbra = c.umbra;
        Lit const got = illuminate(light, 0, c.cosine);
        EXPECT_EQ(got.queries, c.lit);
        EXPECT_EQ(got.shadow, c.lit ? kShadow : kUntouched);
        Vec3f const want = c.lit ? Vec3f(c.want, 2 * c.want, -4 * c.want) : kUntouched;
        EXPECT_NEAR(got.color.x, want.x, 4e-6f); // 0.95 - 0.9 has lost four bits
        EXPECT_NEAR(got.color.y, want.y, 8e-6f);
        EXPECT_NEAR(got.color.z, want.z, 16e-6f);
    }
    voSpotLight light;
    light.range = 10;
    EXPECT_EQ(illuminate(light, 10).queries, 1);
    EXPECT_EQ(illuminate(light, 10.000001f).queries, 0);
    light.castShadows = false;
    EXPECT_EQ(illuminate(light, 10).queries, 0);
    EXPECT_EQ(illuminate(light, 10).shadow, Vec3f(1, 1, 1));
}

TEST(SpotLight, AgreesWithTheFormulaInDouble)
{
    test::Random random;
    int lit = 0;
    for (int i = 0; i < 2000; ++i) {
        voSpotLight light;
        light.color = random.color();
        light.attenuationFactors = {random.in(5, 20), random.in(0.5f, 3), random.in(0, 4)};
        light.cosPenumbra = random.in(0, 0.8f);
        light.cosUmbra = light.cosPenumbra + random.in(0.1f, 0.2f);
        ShadeState state = test::plainHit();
        state.lightAxis = random.unit();
        state.lightToPoint = random.unit();
        state.lightDistance = random.in(0, 25);
        state.lightColor = {0, 0, 0};
        test::ScriptedHost host;
        light.illumination(&host, state);

        Vec3f const f = light.attenuationFactors;
        double const c = clamped(test::dotOf(state.lightToPoint, state.lightAxis));
        if (c < double(light.cosPenumbra)) {
            EXPECT_TRUE(host.calls.empty());
            continue;
        }
        double const width = double(light.cosUmbra) - double(light.cosPenumbra);
        double const s = clamped((c - double(light.cosPenumbra)) / width);
        double const falloff =
            clamped(1 - std::pow(double(state.lightDistance) / double(f.x), double(f.y)));
        double const k = s * s * (3 - 2 * s) * falloff * std::pow(c, double(f.z));
        // 1 - x near x = 1 and the rim's width are where single precision loses most: 1e-5.
        EXPECT_NEAR(double(state.lightColor.x), double(light.color.x) * k, 1e-5);
        EXPECT_NEAR(double(state.lightColor.y), double(light.color.y) * k, 1e-5);
        EXPECT_NEAR(double(state.lightColor.z), double(light.color.z) * k, 1e-5);
        ++lit;
    }
    EXPECT_GT(lit, 300);
}

} // namespace
} // namespace zsi
