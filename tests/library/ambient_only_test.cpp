#include "materials/utility/corvid_Mtl_AmbientOnly.h"
#include "support/record.h"
#include "support/scriptedHost.h"

#include <algorithm>
#include <gtest/gtest.h>

namespace zsi {
namespace {

enum Source { kNone, kTexture, kVertex, kHost };

struct Case {
    char const* why;
    bool show, precalc, raytraced;
    int mode;
    Source source; ///< which one is asked
};
constexpr Case kCases[] = {
    {"off: white", false, true, true, 1, kNone},
    {"texture", true, true, false, 1, kTexture},
    {"texture goes before the host", true, true, true, 1, kTexture},
    {"vertex colour", true, true, false, 2, kVertex},
    {"vertex colour goes before the host", true, true, true, 2, kVertex},
    {"no baked mode, no rays: white", true, true, false, 0, kNone},
    {"an unknown baked mode: white", true, true, false, 3, kNone},
    {"no baked mode: the host", true, true, true, 0, kHost},
    {"an unknown baked mode: the host", true, true, true, 7, kHost},
    {"baked source switched off: the host", true, false, true, 1, kHost},
    {"baked source switched off, no rays: white", true, false, false, 2, kNone},
};

TEST(AmbientOnly, TakesOneSourceAndShowsItsDarkestChannel)
{
    test::Random random;
    for (Case const& c : kCases)
        for (int i = 0; i < 50; ++i) {
            SCOPED_TRACE(c.why);
            corvid_Mtl_AmbientOnly shader;
            shader.showAmbientOnly = c.show;
            shader.usePrecalcAO = c.precalc;
            shader.usingRaytracedAO = c.raytraced;
            shader.ambientOcclusionMode = c.mode;
            shader.ambientOcclusionFactor = random.in(0, 1);
            shader.ambientOcclusionColor = random.color();
            shader.maskingMode = 0;
            shader.maskingColor = {1, 1, 1}; // no mask applies here

            Vec3f const open = random.color();
            test::FunctionTexture<Vec2f> map(
                [&](Vec2f) { return Vec4f(open.x, 0.1f, 0.2f, 0.3f); });
            shader.ambientOcclusionTexture.texture = &map;
            test::ScriptedHost host;
            host.onOcclusion = [&](Vec3f, Vec3f) { return open; };
            ShadeState state = test::plainHit();
            state.P = {1, 2, 3};
            state.N = {0.6f, 0, 0.8f};
            state.Ng = {0, 0, i % 2 ? 1.0f : -1.0f};
            test::setAttribute(state, 0, Vec2f(0.25f, 0.75f));
            test::setAttribute(state, 8, Vec4f(open.x, 0.1f, 0.2f, 0.3f));
            shader.shade(&host, state);

            double const f = double(shader.ambientOcclusionFactor);
            auto const channel = [&](float o, float color) {
                double const t = (1 - double(o)) * f;
                return 1 - t + t * double(color);
            };
            Vec3f const color = shader.ambientOcclusionColor;
            bool const perChannel = c.source == kHost;
            double const want = c.source == kNone
                ? 1
                : std::min({channel(open.x, color.x),
                            channel(perChannel ? open.y : open.x, color.y),
                            channel(perChannel ? open.z : open.x, color.z)});
            EXPECT_NEAR(double(state.Ci.x), want, 5e-7); // a handful of roundings below 1
            EXPECT_EQ(state.Ci.y, state.Ci.x);
            EXPECT_EQ(state.Ci.z, state.Ci.x);
            EXPECT_EQ(state.Ci.w, 1.0f);

            ASSERT_EQ(map.lookups.size(), c.source == kTexture);
            if (c.source == kTexture) {
                EXPECT_EQ(map.lookups[0].x, 0.25f);
                EXPECT_EQ(map.lookups[0].y, 0.75f);
            }
            ASSERT_EQ(host.calls.size(), c.source == kHost);
            if (c.source == kHost) {
                EXPECT_EQ(host.calls[0].service, "occlusion");
                EXPECT_EQ(host.calls[0].vectors[0], state.P);
                EXPECT_EQ(host.calls[0].vectors[1], i % 2 ? state.N : -state.N)
                    << "turned to the viewer by the geometric normal";
                EXPECT_EQ(host.calls[0].scalars[0], 1.0f) << "importance";
            }
        }
}

TEST(AmbientOnly, TellingValues)
{
    corvid_Mtl_AmbientOnly shader;
    shader.showAmbientOnly = true;
    shader.ambientOcclusionMode = 2;
    shader.ambientOcclusionColor = {1, 0, 0};
    test::ScriptedHost host;
    ShadeState state = test::plainHit();
    test::setAttribute(state, 8, Vec4f(0.25f, 1, 1, 1));
    shader.shade(&host, state);
    EXPECT_EQ(rgb(state.Ci), Vec3f(0.25f, 0.25f, 0.25f)) << "the darkest channel, not red";

    shader.ambientOcclusionMode = 1; // no texture: fully occluded, so the colour itself
    shader.ambientOcclusionColor = {0.75f, 0.5f, 1};
    shader.shade(&host, state);
    EXPECT_EQ(rgb(state.Ci), Vec3f(0.5f, 0.5f, 0.5f));

    shader.usePrecalcAO = false;
    shader.usingRaytracedAO = true;
    state.Ng = {1, 0, 0}; // edge on: asked with a zero normal
    shader.shade(&host, state);
    EXPECT_EQ(host.calls.back().vectors[1], Vec3f(0, 0, 0));
}

} // namespace
} // namespace zsi
