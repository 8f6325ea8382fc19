#include "environments/BackgroundGeometry.h"
#include "support/record.h"
#include "support/scriptedHost.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

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
};

bool same(Vec4f a, Vec4f b) { return a.x == b.x && a.y == b.y && a.z == b.z && a.w == b.w; }
bool same(Vec3i a, Vec3i b) { return a.x == b.x && a.y == b.y && a.z == b.z; }

TEST(TextureMapping, PlainModesAndAlpha)
{
    Mapping m;
    m.mode = -1;
    EXPECT_TRUE(same(m(), {0, 0, 0, 1}));
    m.mode = 0;
    m.alphaAsColor = true; // a plain colour has no texel to take alpha from
    EXPECT_TRUE(same(m(), {3, 4, 5, 1}));
    EXPECT_TRUE(m.texture.lookups.empty());
    for (int mode = 1; mode <= 4; ++mode) {
        m.mode = mode;
        EXPECT_TRUE(same(m(), {0.75f, 0.75f, 0.75f, 0.75f})) << mode;
    }
    m.sampler = {};
    EXPECT_TRUE(same(m(), {1, 1, 1, 1}));
    m.alphaAsColor = false;
    EXPECT_TRUE(same(m(), {0, 0, 0, 1}));
    Mapping far;
    far.mode = 9;
    far.position = {0.5f, 0.5f, 0.5f};
    EXPECT_TRUE(same(far(), {0, 0, 0.25f, 0.75f}));
}

TEST(TextureMapping, BoxTakesTheAxisThatTheNormalIsNearestTo)
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
        {"x over an equal y", {1, 1, 0}, {2, 1, 0}},
        {"y over an equal z", {0, 1, -1}, {0, 2, 1}},
        {"z over an equal x", {1, 0, 1}, {0, 1, 2}},
        {"x and y equal below z", {1, 1, 2}, {0, 1, 2}},
        {"all equal: z, told as axis 1", {-1, 1, 1}, {0, 1, 1}},
        {"none", {0, 0, 0}, {0, 1, 1}},
    };
    for (Case const& c : kCases) {
        Mapping m;
        m.mode = 3;
        m.normal = c.normal;
        m.position = {0.1f, 0.2f, 0.3f};
        float const q[] = {0.1f, 0.2f, 0.3f};
        Vec4f const got = m();
        EXPECT_TRUE(same(m.axes, c.axes)) << c.why;
        EXPECT_EQ(got.x, q[c.axes.x]) << c.why;
        EXPECT_EQ(got.y, q[c.axes.y]) << c.why;
        m.axes = {7, 7, 7};
        m.triplanar(false);
        EXPECT_TRUE(same(m.axes, c.axes)) << c.why;
        Vec4f const planar = m.triplanar(true);
        EXPECT_TRUE(same(m.axes, {0, 1, 2})) << c.why;
        EXPECT_EQ(planar.x, q[0]);
        EXPECT_EQ(planar.y, q[1]);
        EXPECT_EQ(m.tangentU, Vec3f(7, 7, 7));
    }
}

TEST(TextureMapping, AngularRunsFromYToX)
{
    struct Case {
        Vec3f position;
        float repeat, s, t;
        Vec3f tangentU;
    };
    float const r = std::sqrt(2.5f); // of (0.5, 1.5), from the origin and not from the seam's axis
    Case const cases[] = {
        {{0.5f, 1.5f, 0.2f}, 1, 0.5f, 0.2f, {-1.5f / r, 0.5f / r, 0}},
        {{1.5f, 0.5f, 0.0f}, 1, 0.75f, 0.0f, {-0.5f / r, 1.5f / r, 0}},
        {{1.5f, 0.5f, 3.0f}, 4, 3.0f, 3.0f, {-0.5f / r, 1.5f / r, 0}},
        {{-0.5f, 0.5f, 1.0f}, 2, 0.5f, 1.0f, {-0.5f, -0.5f, 0}},
        {{0, 0, 1}, 1, 0.125f, 1, {0, 0, 0}}, // on the axis: not scaled
    };
    for (Case c : cases) {
        if (c.tangentU.x == -0.5f && c.tangentU.y == -0.5f)
            c.tangentU *= std::sqrt(2.0f);
        Mapping m;
        m.mode = 4;
        m.position = c.position;
        m.repeat = c.repeat;
        Vec4f const got = m();
        EXPECT_NEAR(got.x, c.s, 1e-6f);
        EXPECT_EQ(got.y, c.t);
        EXPECT_NEAR(length(m.tangentU - c.tangentU), 0.0f, 1e-6f);
        EXPECT_EQ(m.tangentV, Vec3f(0, 0, 1));
        EXPECT_TRUE(same(m.axes, {7, 7, 7}));
    }
}

/// The row-vector convention, and which inputs each mode takes, over random transforms.
TEST(TextureMapping, TransformsAreRowVectorTimesMatrix)
{
    test::Random random;
    auto const d = [](float v) { return static_cast<double>(v); };
    for (int i = 0; i < 2000; ++i) {
        Mapping m;
        for (float& e : m.matrix.m)
            e = random.in(-2, 2);
        for (float& e : m.uvMatrix.m)
            e = random.in(-2, 2);
        m.position = random.unit() * 3.0f;
        m.normal = random.unit();
        m.uv = {random.in(0, 1), random.in(0, 1)};
        m.repeat = random.in(0.5f, 4);
        m.mode = 1 + i % 4;
        double const p[] = {d(m.position.x), d(m.position.y), d(m.position.z), 1};
        double const nIn[] = {d(m.normal.x), d(m.normal.y), d(m.normal.z)};
        double q[3] = {}, n[3] = {}, s = 0, t = 0;
        for (int k = 0; k < 12; ++k)
            q[k % 3] += p[k / 3] * d(m.matrix.m[k / 3 * 4 + k % 3]);
        for (int k = 0; k < 9; ++k)
            n[k % 3] += nIn[k / 3] * d(m.matrix.m[k / 3 * 4 + k % 3]);
        for (double& c : n)
            c = std::fabs(c);
        if (m.mode == 1) {
            double const w[] = {d(m.uv.x), d(m.uv.y), 1};
            for (int k = 0; k < 3; ++k) {
                s += w[k] * d(m.uvMatrix.m[3 * k]);
                t += w[k] * d(m.uvMatrix.m[3 * k + 1]);
            }
        } else if (m.mode == 4) {
            s = d(m.repeat) * (std::atan2(q[0] - 0.5, q[1] - 0.5) / (2 * std::acos(-1.0)) + 0.5);
            t = q[2];
        } else {
            int const up = m.mode == 2 ? 2 : n[0] > n[1] && n[0] > n[2] ? 0 : n[1] > n[2] ? 1 : 2;
            s = q[up == 0 ? 2 : 0];
            t = q[up == 1 ? 2 : 1];
        }
        Vec4f const got = m();
        // Sums of four terms below 6; the angle loses more near its axis and its seam.
        double const distance = std::hypot(q[0] - 0.5, q[1] - 0.5);
        bool const seam =
            m.mode == 4 && (distance < 0.1 || (q[1] < 0.5 && std::fabs(q[0] - 0.5) < 0.01));
        if (!seam) {
            ASSERT_NEAR(d(got.x), s, 4e-5) << "mode " << m.mode;
        }
        ASSERT_NEAR(d(got.y), t, 4e-6) << "mode " << m.mode;
        ASSERT_EQ(m.texture.lookups.size(), 1u);
    }
}

} // namespace
} // namespace zsi
