#include "materials/utility/corvid_Mtl_NormalsOnly.h"
#include "materials/utility/corvid_Mtl_Solid.h"
#include "materials/utility/corvid_Mtl_Unlit.h"
#include "support/record.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

double clamped(double t) { return t < 0 ? 0 : t > 1 ? 1 : t; }

struct Expected {
    double r, g, b;
};
/// Single-precision dot products of unit vectors are good to a few 1e-7.
void expectNear(Vec4f got, Expected want)
{
    EXPECT_NEAR(double(got.x), want.r, 1e-6);
    EXPECT_NEAR(double(got.y), want.g, 1e-6);
    EXPECT_NEAR(double(got.z), want.b, 1e-6);
}

ShadeState randomHit(test::Random& random)
{
    ShadeState state = test::plainHit();
    state.I = random.unit();
    state.N = random.unit();
    state.Ng = random.unit();
    state.Ci = {7, 7, 7, 7};
    return state;
}

TEST(Solid, IsTheColourOfItsStateTimesTheCosineWhicheverWayTheNormalIsTurned)
{
    constexpr Expected kLilac{0.69, 0.58, 0.69}, kGrey{0.85, 0.85, 0.85}, kBlack{0, 0, 0};
    struct State {
        int state;
        Expected base;
    };
    constexpr State kStates[] = {{-1, kBlack}, {0, kLilac}, {1, kLilac},
                                 {2, kGrey},   {3, kBlack}, {5, kBlack}};
    test::Random random;
    for (State const& s : kStates)
        for (int i = 0; i < 200; ++i) {
            corvid_Mtl_Solid solid;
            solid.patchState = s.state;
            solid.reverseNormal = i & 1;
            solid.faceForward = i & 2;
            ShadeState state = randomHit(random);
            if (i < 4)
                state.N = -state.I; // head-on
            if (i >= 196)
                state.N = state.N * 3.0f; // a cosine above 1 must not brighten beyond 1
            solid.shade(nullptr, state);
            double const d = std::abs(test::dotOf(state.I, state.N));
            expectNear(state.Ci,
                       {clamped(s.base.r * d), clamped(s.base.g * d), clamped(s.base.b * d)});
            EXPECT_EQ(state.Ci.w, 7.0f) << "alpha is not its own";
        }
}

TEST(Unlit, ShowsToCameraRaysOnlyAndLetsLightThrough)
{
    corvid_Mtl_Unlit const fresh;
    for (std::uint32_t const rayType : {0u, 1u, 2u, 4u, 5u, 16u, 32u}) {
        ShadeState state = test::plainHit();
        state.rayType = rayType;
        state.Ci = {7, 7, 7, 7};
        fresh.shade(nullptr, state);
        bool const seen = rayType == 1;
        EXPECT_EQ(rgb(state.Ci), seen ? Vec3f(1, 1, 0) : Vec3f(7, 7, 7)) << rayType;
        EXPECT_EQ(state.Ci.w, 7.0f);
        EXPECT_EQ(state.discardHit, !seen) << rayType;
        fresh.transmission(nullptr, state);
        EXPECT_EQ(state.transmissionColor, Vec3f(1, 1, 1));
    }
}

TEST(NormalsOnly, ColoursBySideAndScheme)
{
    test::Random random;
    int yellow = 0, blue = 0, disagree = 0;
    for (int i = 0; i < 4000; ++i) {
        corvid_Mtl_NormalsOnly shader;
        shader.reverseNormal = i & 1;
        shader.faceForward = i & 2;
        shader.faceLight = i & 4;
        ShadeState state = randomHit(random);
        if (i % 16 >= 8)
            state.Ng = state.N; // as in most scenes; otherwise the two disagree half the time
        shader.shade(nullptr, state);

        double const sign = shader.reverseNormal ? -1 : 1;
        double const d = sign * test::dotOf(state.I, state.N),
                     side = sign * test::dotOf(state.I, state.Ng);
        double const a = std::abs(d);
        if (shader.faceForward)
            expectNear(state.Ci, {0.05 * a, 0.8 * a, 0.05 * a});
        else if (shader.faceLight)
            expectNear(state.Ci, {0.45 * a, 0.65 * a, 0.35 * a});
        else if (side > 0) {
            expectNear(state.Ci, {clamped(d), clamped(d), 0});
            ++yellow;
            disagree += d < 0;
        } else {
            expectNear(state.Ci, {clamped(-0.05 * d), clamped(-0.05 * d), clamped(-0.8 * d)});
            ++blue;
        }
        EXPECT_EQ(state.Ci.w, 1.0f);
    }
    EXPECT_GT(yellow, 300);
    EXPECT_GT(blue, 300);
    EXPECT_GT(disagree, 50) << "back faces whose shading normal leans to the viewer: black";
}

TEST(NormalsOnly, EdgeOnAndNanGeometryCountsAsFront)
{
    corvid_Mtl_NormalsOnly const shader;
    for (Vec3f const ng : {Vec3f(1, 0, 0), Vec3f(std::nanf(""), 0, 0)}) {
        ShadeState state = test::plainHit();
        state.Ng = ng;
        shader.shade(nullptr, state);
        expectNear(state.Ci, {0.05, 0.05, 0.8});
    }
}

} // namespace
} // namespace zsi
