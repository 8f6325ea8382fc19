#include "materials/utility/corvid_Mtl_Mirror.h"
#include "support/reference.h"
#include "support/scriptedHost.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

using test::D3;
using test::minus;
using test::times;

TEST(Mirror, ShadesTheTintedReflectionAndBlendsTheMask)
{
    test::Random random;
    for (int i = 0; i < 600; ++i) {
        ShadeState s = test::randomHit(random, i % 2);
        corvid_Mtl_Mirror mirror;
        mirror.u_tintColor = random.color();
        constexpr Vec3f kMasks[] = {{0, 0, 0}, {1, 1, 1}, {0.25f, 0.5f, 1}};
        Vec3f const mask = mirror.maskingColor = kMasks[i % 3];
        test::ScriptedHost host;
        Vec3f const seen = random.color();
        Vec4f const behind = withAlpha(random.color(), 0.375f);
        host.onTrace = [&](Vec3f, Vec3f) { return seen; };
        host.onThrough = [&](Vec3f, Vec3f) { return behind; };
        ShadeState const before = s;
        mirror.shade(&host, s);
        if (mask == Vec3f(1, 1, 1)) {
            EXPECT_EQ(s.discardHit, 1);
            EXPECT_TRUE(host.calls.empty());
            EXPECT_EQ(test::strayWrite(before, s,
                                       std::array{std::pair<std::size_t, std::size_t>(476, 1)}),
                      "");
            continue;
        }
        double const c = std::fabs(test::dotOf(s.I, s.N));
        double const F = 0.92 + 0.08 * std::pow(1 - c, 5);
        Vec3f const T = mirror.u_tintColor;
        test::Call const& ray = host.calls[0];
        ASSERT_EQ(ray.service, "traceReflection");
        EXPECT_EQ(ray.vectors[0], s.P);
        EXPECT_NEAR(double(ray.scalars[0]), F * double(maxComponent(T)), 1e-6);
        D3 const straight = minus(s.I, times(s.N, 2 * test::dotOf(s.I, s.N)));
        double const height = inner(straight, s.Ng) * (i % 2 ? 1 : -1);
        if (height > 0.05) {
            EXPECT_LT(test::distance(ray.vectors[1], straight), 1e-6);
        } else if (height < 0.0499) { // the margin's own test has the rest
            EXPECT_NEAR(std::fabs(test::dotOf(ray.vectors[1], s.Ng)), 0.05, 1e-4);
        }
        bool const blended = !(mask == Vec3f(0, 0, 0));
        EXPECT_EQ(host.count("traceThrough"), blended);
        EXPECT_NEAR(s.Ci.y, float(F) * T.y * seen.y * (1 - mask.y) + mask.y * behind.y, 1e-6f);
        EXPECT_EQ(s.Ci.w, blended ? behind.w : 1);
    }
}

TEST(Mirror, SamplesTheMirrorDirectionForTheThirdSwitchOnly)
{
    test::Random random;
    test::ScriptedHost host;
    corvid_Mtl_Mirror mirror;
    mirror.u_tintColor = {0.5f, 0.25f, 1};
    for (int i = 0; i < 200; ++i) {
        ShadeState s = test::randomHit(random, i % 2);
        s.allowReflection[0] = s.allowReflection[1] = s.allowTransmission[2] = 1;
        ShadeState const before = s;
        mirror.transfer(&host, s);
        EXPECT_EQ(test::strayWrite(before, s, std::array<std::pair<std::size_t, std::size_t>, 0>{}),
                  "");
        s.sampleType = 77;
        mirror.sample(&host, s);
        EXPECT_EQ(
            test::strayWrite(before, s, std::array{std::pair<std::size_t, std::size_t>(396, 4)}),
            "");
        EXPECT_EQ(s.sampleType, 0u);

        s.allowReflection[2] = 1;
        mirror.sample(&host, s);
        double const d = std::fabs(test::dotOf(s.I, s.N));
        EXPECT_EQ(s.sampleType, 4u);
        EXPECT_EQ(s.sampleInvPdf, 1);
        EXPECT_NEAR(double(s.sampleCosine), d, 1e-6);
        EXPECT_LT(
            test::distance(s.sampleDirection, minus(s.I, times(s.N, 2 * test::dotOf(s.I, s.N)))),
            1e-6);
        EXPECT_NEAR(double(s.outBrdf.y) * d, 0.25, 1e-5) << "value times cosine is the tint";
    }
    // Along the surface nothing is faced: straight on, with a value that divides by a zero. Of
    // I.(-0 N) only three terms of -0 sum to -0; what is negated then is the cosine.
    for (float x : {1.0f, -1.0f}) {
        ShadeState s = test::plainHit();
        s.I = {x, 0, 0};
        s.allowReflection[2] = 1;
        mirror.sample(&host, s);
        EXPECT_EQ(s.sampleDirection, s.I);
        EXPECT_EQ(s.outBrdf.x, x * std::numeric_limits<float>::infinity());
    }
}

} // namespace
} // namespace zsi
