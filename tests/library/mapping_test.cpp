// How pictures and masks come to a surface.
#include "environments/textureMapping.h"
#include "materials/physical/shared/masking.h"
#include "support/scriptedHost.h"

#include <numbers>

namespace zsi {
namespace {

/// The block alone, as any class may carry it.
struct Masked : MaskingFunctions<Masked> {
    MASKING(ZSI_ROW_FIELD, ZSI_ROW_UNSET, ZSI_ROW_NONE)
};

struct Mapping {
    test::FunctionTexture<Vec2f> texture{[](Vec2f at) { return Vec4f(at.x, at.y, 0.25f, 0.75f); }};
    TextureSampler2D sampler;
    int mode = 0;
    Mat4f matrix = Mat4f::identity();
    Mat3f uvMatrix = Mat3f::identity();
    float repeat = 1;
    Vec3f position{0, 0, 0}, normal{0, 0, 1};
    bool alphaAsColor = false;
    Vec2f uv{0, 0};
    Vec3i axes{7, 7, 7};
    Vec3f tangentU{7, 7, 7}, tangentV{7, 7, 7};

    Mapping() { sampler.texture = &texture; }
    Vec4f operator()()
    {
        return TextureMappingFunctions{}.f_evalMapping(
            nullptr, test::plainHit(), mode, {3, 4, 5}, sampler, matrix, repeat, position, normal,
            alphaAsColor, uv, axes, tangentU, tangentV, uvMatrix);
    }
    Vec4f triplanar(bool planar)
    {
        return TriplanarMappingFunctions{}.f_evalMapping(
            nullptr, test::plainHit(), mode, planar, {3, 4, 5}, sampler, matrix, repeat, position,
            normal, alphaAsColor, uv, axes, tangentU, tangentV, uvMatrix);
    }
    /// The mask that is laid on the same way.
    Vec3f mask() const
    {
        Masked m;
        m.maskingMode = mode;
        m.maskingTexture = sampler;
        m.maskingTextureMatrix = matrix;
        m.maskingUVMatrix = uvMatrix;
        m.maskingAngularRepeat = repeat;
        return m.f_calcMasking(nullptr, test::plainHit(), uv, position, normal);
    }
};

bool same(Vec3i a, Vec3i b) { return a.x == b.x && a.y == b.y && a.z == b.z; }

/// Row vectors times matrices, and which inputs each mode takes, over random transforms.
TEST(Mapping, PicturesAndMasksLieWhereTheModeSays)
{
    test::Random random;
    for (int i = 0; i < 2000; ++i) {
        Mapping m;
        m.mode = (i % 6) - 7 * (i % 6 == 0); // -7 and 5: unknown
        for (float& e : m.matrix.m)
            e = random.in(-0.3f, 0.3f);
        for (float& e : m.uvMatrix.m)
            e = random.in(-1, 1);
        m.repeat = random.in(0.5f, 4);
        m.uv = {random.in(-1, 1), random.in(-1, 1)};
        m.position = random.unit();
        m.normal = random.unit();

        auto const row = [&](Vec3f v, int axis) {
            auto const& t = m.matrix.m;
            return test::dotOf(v, {t[axis], t[4 + axis], t[8 + axis]});
        };
        double q[3], n[3], s = 0, t = 0;
        for (int axis = 0; axis < 3; ++axis) {
            q[axis] = row(m.position, axis) + double(m.matrix.m[12 + axis]);
            n[axis] = std::fabs(row(m.normal, axis));
        }
        if (m.mode == 1) {
            auto const& u = m.uvMatrix.m;
            s = test::dotOf({m.uv.x, m.uv.y, 1}, {u[0], u[3], u[6]});
            t = test::dotOf({m.uv.x, m.uv.y, 1}, {u[1], u[4], u[7]});
        } else if (m.mode == 2 || m.mode == 3) {
            int const along = m.mode == 2 ? 2 : static_cast<int>(std::max_element(n, n + 3) - n);
            s = q[along == 0 ? 2 : 0];
            t = q[along == 1 ? 2 : 1];
        } else if (m.mode == 4) {
            double const turn = std::atan2(q[0] - 0.5, q[1] - 0.5) / (2 * std::numbers::pi);
            s = (turn + 0.5) * double(m.repeat);
            t = q[2];
        }
        m();
        m.mask();
        ASSERT_EQ(m.texture.lookups.size(), 2u);
        for (Vec2f const at : m.texture.lookups) {
            EXPECT_NEAR(double(at.x), s, 3e-6) << "mode " << m.mode;
            EXPECT_NEAR(double(at.y), t, 3e-6) << "mode " << m.mode;
        }
        if (m.mode == 4) { // from the origin, not from the seam's axis
            EXPECT_TRUE(test::near(m.tangentU, test::unitOf({-q[1], q[0], 0}), 1e-4));
            EXPECT_EQ(m.tangentV, Vec3f(0, 0, 1));
        }
    }
    Mapping onAxis;
    onAxis.mode = 4;
    onAxis();
    EXPECT_EQ(onAxis.tangentU, Vec3f(0, 0, 0)) << "not scaled";
}

TEST(Mapping, BoxTakesTheAxisThatTheNormalIsNearestTo)
{
    struct Case {
        char const* why;
        Vec3f normal;
        Vec3i axes;
    };
    constexpr Case kCases[] = {
        {"z", {0, 0, 1}, {0, 1, 2}},
        {"x", {1, 0, 0}, {2, 1, 0}},
        {"y, backwards", {0, -1, 0}, {0, 2, 1}},
        {"x over an equal y", {1, -1, 0}, {2, 1, 0}},
        {"y over an equal z", {0, 1, -1}, {0, 2, 1}},
        {"z over an equal x", {1, 0, 1}, {0, 1, 2}},
        {"x and y equal below z", {1, 1, 2}, {0, 1, 2}},
        {"all equal: z, told as axis 1", {-1, 1, 1}, {0, 1, 1}},
        {"none", {0, 0, 0}, {0, 1, 1}},
    };
    for (Case const& c : kCases) {
        SCOPED_TRACE(c.why);
        Mapping m;
        m.mode = 3;
        m.normal = c.normal;
        m.position = {0.1f, 0.2f, 0.3f};
        float const q[] = {0.1f, 0.2f, 0.3f};
        m();
        m.mask();
        EXPECT_TRUE(same(m.axes, c.axes));
        m.axes = {7, 7, 7};
        m.triplanar(false);
        EXPECT_TRUE(same(m.axes, c.axes));
        for (Vec2f const at : m.texture.lookups) {
            EXPECT_EQ(at.x, q[c.axes.x]);
            EXPECT_EQ(at.y, q[c.axes.y]);
        }
        Vec4f const planar = m.triplanar(true);
        EXPECT_TRUE(same(m.axes, {0, 1, 2}));
        EXPECT_EQ(planar.x, q[0]);
        EXPECT_EQ(planar.y, q[1]);
    }
}

TEST(Mapping, PlainModesAndAlpha)
{
    Mapping m;
    m.mode = -1;
    EXPECT_TRUE(test::near(m(), {0, 0, 0, 1}, 0));
    m.mode = 0;
    m.alphaAsColor = true; // a plain colour has no texel to take alpha from
    EXPECT_TRUE(test::near(m(), {3, 4, 5, 1}, 0));
    EXPECT_TRUE(m.texture.lookups.empty());
    for (m.mode = 1; m.mode <= 4; ++m.mode)
        EXPECT_TRUE(test::near(m(), {0.75f, 0.75f, 0.75f, 0.75f}, 0)) << m.mode;
}

TEST(Masking, TakesColourOrAlphaThenInvertsThenCutsTheDepth)
{
    struct Case {
        char const* why;
        int mode;
        bool bound, fromAlpha, invert;
        float depth;
        Vec3f want;
        std::size_t lookups;
    };
    constexpr Vec3f kNone(0, 0, 0), kFull(1, 1, 1), kColor(0.2f, 0.4f, 0.6f);
    constexpr Vec3f kTexel(0.25f, 0.5f, 0.75f);
    constexpr Case kCases[] = {
        {"off, whatever else is set", -1, true, true, true, 5, kNone, 0},
        {"constant: never inverted, no lookup", 0, true, true, true, 5, kColor, 0},
        {"map colour", 1, true, false, false, 5, kTexel, 1},
        {"map alpha", 1, true, true, false, 5, {0.125f, 0.125f, 0.125f}, 1},
        {"inverted", 4, true, false, true, 5, {0.75f, 0.5f, 0.25f}, 1},
        {"unknown, below 0: not inverted", -2, true, false, true, 5, kTexel, 1},
        {"no map", 1, false, false, false, 5, kNone, 0},
        {"no map, its alpha", 1, false, true, false, 5, kFull, 0},
        {"no map, its alpha inverted", 3, false, true, true, 5, kNone, 0},
        {"planar at depth 1", 2, true, false, false, 1, kTexel, 1},
        {"planar at depth -1", 2, true, false, false, -1, kTexel, 1},
        {"planar beyond", 2, true, false, false, 1.0001f, kFull, 1},
        {"planar before: after the inversion", 2, false, false, true, -1.0001f, kFull, 0},
        {"box has no depth", 3, true, false, false, 5, kTexel, 1},
    };
    for (Case const& c : kCases) {
        test::FunctionTexture<Vec2f> map([&](Vec2f) { return withAlpha(kTexel, 0.125f); });
        Masked m;
        m.maskingColor = kColor;
        m.maskingMode = c.mode;
        m.maskingTexture.texture = c.bound ? &map : nullptr;
        m.maskingTextureMatrix = Mat4f::identity();
        m.maskingFromAlpha = c.fromAlpha;
        m.maskingInvertTexture = c.invert;
        EXPECT_EQ(m.f_calcMasking(nullptr, test::plainHit(), {0, 0}, {0, 0, c.depth}, {0, 0, 1}),
                  c.want)
            << c.why;
        EXPECT_EQ(map.lookups.size(), c.lookups) << c.why;
    }
}

} // namespace
} // namespace zsi
