#include "materials/physical/materialSkeleton.h"
#include "support/record.h"
#include "support/scriptedHost.h"

#include <gtest/gtest.h>
#include <numbers>

namespace zsi {
namespace {

/// The block alone, as any class may carry it.
struct Masked : MaskingFunctions<Masked> {
    MASKING(ZSI_ROW_FIELD, ZSI_ROW_UNSET, ZSI_ROW_NONE)
};

constexpr Vec4f kTexel(0.25f, 0.5f, 0.75f, 0.125f);

Vec3f mask(Masked const& m, Vec2f uv = {0, 0}, Vec3f P = {0, 0, 0}, Vec3f N = {0, 0, 1})
{
    test::ScriptedHost host;
    return m.f_calcMasking(&host, test::plainHit(), uv, P, N);
}

TEST(Masking, LooksTheMapUpWhereTheModeSays)
{
    test::Random random;
    test::FunctionTexture<Vec2f> map([](Vec2f) { return kTexel; });
    for (int mode : {1, 2, 3, 4, 5, -7})
        for (int i = 0; i < 200; ++i) {
            Masked m;
            m.maskingMode = mode;
            m.maskingTexture.texture = &map;
            m.maskingAngularRepeat = random.in(0.5f, 4);
            for (float& f : m.maskingUVMatrix.m)
                f = random.in(-1, 1);
            for (float& f : m.maskingTextureMatrix.m)
                f = random.in(-0.3f, 0.3f);
            Vec2f const uv(random.in(-1, 1), random.in(-1, 1));
            Vec3f const P = random.unit(), N = random.unit();
            mask(m, uv, P, N);

            auto const& t = m.maskingTextureMatrix.m;
            auto const row = [&](Vec3f v, int axis) {
                return test::dotOf(v, {t[axis], t[4 + axis], t[8 + axis]});
            };
            double q[3], n[3];
            for (int axis = 0; axis < 3; ++axis) {
                q[axis] = row(P, axis) + double(t[12 + axis]);
                n[axis] = std::fabs(row(N, axis));
            }
            double s = 0, r = 0;
            if (mode == 1) {
                auto const& u = m.maskingUVMatrix.m;
                s = test::dotOf({uv.x, uv.y, 1}, {u[0], u[3], u[6]});
                r = test::dotOf({uv.x, uv.y, 1}, {u[1], u[4], u[7]});
            } else if (mode == 2 || mode == 3) {
                int const axis = mode == 2 || (n[2] >= n[0] && n[2] >= n[1]) ? 2
                    : n[0] >= n[1]                                           ? 0
                                                                             : 1;
                s = axis == 0 ? q[2] : q[0];
                r = axis == 1 ? q[2] : q[1];
            } else if (mode == 4) {
                double const turn = std::atan2(q[0] - 0.5, q[1] - 0.5) / (2 * std::numbers::pi);
                s = (turn + 0.5) * double(m.maskingAngularRepeat);
                r = q[2];
            }
            // An unknown mode: (0, 0).
            EXPECT_NEAR(double(map.lookups.back().x), s, 3e-6) << mode;
            EXPECT_NEAR(double(map.lookups.back().y), r, 3e-6) << mode;
        }
}

TEST(Masking, BoxProjectionBreaksTies)
{
    struct Case {
        Vec3f N;
        Vec2f want; ///< for P = (1, 2, 3) / 10
    };
    constexpr Vec2f kX(0.3f, 0.2f), kY(0.1f, 0.3f), kZ(0.1f, 0.2f);
    constexpr Case kCases[] = {
        {{2, -2, 1}, kX}, {{1, -2, 2}, kY}, {{-2, 1, 2}, kZ}, {{1, 1, 1}, kZ},
        {{0, 0, 0}, kZ},  {{-3, 1, 2}, kX}, {{1, 3, -2}, kY}, {{1, 2, -3}, kZ},
    };
    test::FunctionTexture<Vec2f> map([](Vec2f) { return kTexel; });
    Masked m;
    m.maskingMode = 3;
    m.maskingTexture.texture = &map;
    m.maskingTextureMatrix = Mat4f::identity();
    for (Case const& c : kCases) {
        mask(m, {9, 9}, {0.1f, 0.2f, 0.3f}, c.N);
        EXPECT_EQ(map.lookups.back().x, c.want.x) << c.N.x << " " << c.N.y << " " << c.N.z;
        EXPECT_EQ(map.lookups.back().y, c.want.y) << c.N.x << " " << c.N.y << " " << c.N.z;
    }
}

TEST(Masking, TakesColourOrAlphaThenInvertsThenCutsTheDepth)
{
    struct Case {
        char const* why;
        int mode;
        bool bound, fromAlpha, invert;
        float depth;
        Vec3f want;
        int lookups;
    };
    constexpr Vec3f kNone(0, 0, 0), kFull(1, 1, 1), kColor(0.2f, 0.4f, 0.6f);
    constexpr Case kCases[] = {
        {"off, whatever else is set", -1, true, true, true, 5, kNone, 0},
        {"constant: never inverted, no lookup", 0, true, true, true, 5, kColor, 0},
        {"map colour", 1, true, false, false, 5, {0.25f, 0.5f, 0.75f}, 1},
        {"map alpha", 1, true, true, false, 5, {0.125f, 0.125f, 0.125f}, 1},
        {"inverted", 4, true, false, true, 5, {0.75f, 0.5f, 0.25f}, 1},
        {"an unknown mode below 0 is not inverted",
         -2,
         true,
         false,
         true,
         5,
         {0.25f, 0.5f, 0.75f},
         1},
        {"no map", 1, false, false, false, 5, kNone, 0},
        {"no map, its alpha", 1, false, true, false, 5, kFull, 0},
        {"no map, its alpha inverted", 3, false, true, true, 5, kNone, 0},
        {"planar at depth 1", 2, true, false, false, 1, {0.25f, 0.5f, 0.75f}, 1},
        {"planar at depth -1", 2, true, false, false, -1, {0.25f, 0.5f, 0.75f}, 1},
        {"planar beyond", 2, true, false, false, 1.0001f, kFull, 1},
        {"planar before: after the inversion", 2, false, false, true, -1.0001f, kFull, 0},
        {"box has no depth", 3, true, false, false, 5, {0.25f, 0.5f, 0.75f}, 1},
    };
    for (Case const& c : kCases) {
        SCOPED_TRACE(c.why);
        test::FunctionTexture<Vec2f> map([](Vec2f) { return kTexel; });
        Masked m;
        m.maskingColor = kColor;
        m.maskingMode = c.mode;
        m.maskingTexture.texture = c.bound ? &map : nullptr;
        m.maskingTextureMatrix = Mat4f::identity();
        m.maskingFromAlpha = c.fromAlpha;
        m.maskingInvertTexture = c.invert;
        EXPECT_EQ(mask(m, {0, 0}, {0, 0, c.depth}), c.want);
        EXPECT_EQ(map.lookups.size(), static_cast<std::size_t>(c.lookups));
    }
}

} // namespace
} // namespace zsi
