// SPDX-License-Identifier: Apache-2.0
// How pictures and masks come to a surface.
#include "environments/textureMapping.h"
#include "materials/physical/shared/masking.h"
#include "support/textTable.h"

namespace zsi {
namespace {

/// The block alone, as any class may carry it.
struct Masked : MaskingFunctions<Masked> {
    MASKING(ZSI_ROW_FIELD, ZSI_ROW_UNSET, ZSI_ROW_NONE)
};

/// A point of texture space (1.5, 2, -1), whose uv are transformed to (2.5, 3.25).
struct Mapping {
    test::FunctionTexture<Vec2f> texture{[](Vec2f at) { return Vec4f(at.x, at.y, 0.25f, 0.75f); }};
    TextureSampler2D sampler;
    int mode = 0;
    Mat4f const matrix{0, 1, 0, 9, -2, 0, 0, 9, 0, 0, 4, 9, 0.5f, 1, -3, 1};
    Mat3f const uvMatrix{0, 2, 9, 1, 0, 9, 0.5f, 0.25f, 9};
    Vec3f position{1, -0.5f, 0.5f}, normal{0, 0, 1};
    bool alphaAsColor = false;
    MappedAxes axes{{7, 7, 7}, {7, 7, 7}, {7, 7, 7}};

    Mapping() { sampler.texture = &texture; }
    Vec4f operator()(bool planarBox = false)
    {
        if (planarBox)
            return TriplanarMappingFunctions{}.f_evalMapping(
                nullptr, test::plainHit(), mode, true, {3, 4, 5}, sampler, matrix, 3, position,
                normal, alphaAsColor, {1.5f, 2}, axes.box, axes.tangentU, axes.tangentV, uvMatrix);
        return TextureMappingFunctions{}.f_evalMapping(
            nullptr, test::plainHit(), mode, {3, 4, 5}, sampler, matrix, 3, position, normal,
            alphaAsColor, {1.5f, 2}, axes.box, axes.tangentU, axes.tangentV, uvMatrix);
    }
    /// The mask that is laid on the same way.
    Vec3f mask() const
    {
        Masked m;
        m.maskingMode = mode;
        m.maskingTexture = sampler;
        m.maskingTextureMatrix = matrix;
        m.maskingUVMatrix = uvMatrix;
        m.maskingAngularRepeat = 3;
        return m.f_calcMasking(nullptr, test::plainHit(), {1.5f, 2}, position, normal);
    }
};

TEST(Mapping, PicturesAndMasksLieWhereTheModeSays)
{
    // mode, normal: coordinate, axes of the box (7: not written)
    for (test::Line const& c : test::table(R"(
        unknown                        | | -7 0 0 1      0 0       7 7 7
        unknown                        | | 5  0 0 1      0 0       7 7 7
        uv                             | | 1  0 0 1      2.5 3.25  7 7 7
        planar                         | | 2  1 0 0      1.5 2     7 7 7
        around z, three times          | | 4  1 0 0      1.780751 -1  7 7 7
        box: z                         | | 3  0 0 1      1.5 2     0 1 2
        x, which is y of the object    | | 3  0 1 0      -1 2      2 1 0
        y, backwards                   | | 3  -1 0 0     1.5 -1    0 2 1
        x over an equal y              | | 3  2 1 0      -1 2      2 1 0
        y over an equal z              | | 3  4 0 -1     1.5 -1    0 2 1
        z over an equal x              | | 3  0 2 1      1.5 2     0 1 2
        x and y equal below z          | | 3  2 1 1      1.5 2     0 1 2
        all equal: z, told as axis 1   | | 3  -4 2 1     1.5 2     0 1 1
        none                           | | 3  0 0 0      1.5 2     0 1 1)")) {
        SCOPED_TRACE(c.why);
        Mapping m;
        m.mode = static_cast<int>(c.want[0]);
        m.normal = test::vec3(c.want, 1);
        m();
        EXPECT_EQ(Vec3f(float(m.axes.box.x), float(m.axes.box.y), float(m.axes.box.z)),
                  test::vec3(c.want, 6));
        m.mask();
        for (Vec2f const at : m.texture.lookups) {
            EXPECT_NEAR(at.x, c.want[4], 3e-6f);
            EXPECT_NEAR(at.y, c.want[5], 3e-6f);
        }
        EXPECT_EQ(m.texture.lookups.size(), 2u);
        if (m.mode == 3) {
            EXPECT_TRUE(test::near(m(true), {1.5f, 2, 0.25f, 0.75f}, 1e-6)) << "planar";
            EXPECT_TRUE(m.axes.box.x == 0 && m.axes.box.y == 1 && m.axes.box.z == 2);
        }
    }
}

TEST(Mapping, PlainModesAlphaAndTangentsOfTheCylinder)
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
    // About the origin, not about the seam's axis; not scaled on it.
    EXPECT_TRUE(test::near(m.axes.tangentU, {-0.8, 0.6, 0}, 1e-6));
    EXPECT_EQ(m.axes.tangentV, Vec3f(0, 0, 1));
    m.mode = 4;
    m.position = {-1, 0.25f, 0};
    m();
    EXPECT_EQ(m.axes.tangentU, Vec3f(0, 0, 0));
}

TEST(Masking, TakesColourOrAlphaThenInvertsThenCutsTheDepth)
{
    // mode, map, from alpha, invert, depth: mask, lookups; the texel is (0.25, 0.5, 0.75, 0.125)
    for (test::Line const& c : test::table(R"(
        off, whatever else is set              | | -1 1 1 1 5        0 0 0           0
        constant: never inverted, no lookup    | | 0 1 1 1 5         0.2 0.4 0.6     0
        map colour                             | | 1 1 0 0 5         0.25 0.5 0.75   1
        map alpha                              | | 1 1 1 0 5         0.125 0.125 0.125 1
        inverted                               | | 4 1 0 1 5         0.75 0.5 0.25   1
        unknown, below 0: not inverted         | | -2 1 0 1 5        0.25 0.5 0.75   1
        no map                                 | | 1 0 0 0 5         0 0 0           0
        no map, its alpha                      | | 1 0 1 0 5         1 1 1           0
        no map, its alpha inverted             | | 3 0 1 1 5         0 0 0           0
        planar at depth 1                      | | 2 1 0 0 1         0.25 0.5 0.75   1
        planar at depth -1                     | | 2 1 0 0 -1        0.25 0.5 0.75   1
        planar beyond                          | | 2 1 0 0 1.0001    1 1 1           1
        planar before: after the inversion     | | 2 0 0 1 -1.0001   1 1 1           0
        box has no depth                       | | 3 1 0 0 5         0.25 0.5 0.75   1)")) {
        test::FunctionTexture<Vec2f> map([](Vec2f) { return Vec4f(0.25f, 0.5f, 0.75f, 0.125f); });
        Masked m;
        m.maskingColor = {0.2f, 0.4f, 0.6f};
        m.maskingMode = static_cast<int>(c.want[0]);
        m.maskingTexture.texture = c.want[1] != 0 ? &map : nullptr;
        m.maskingTextureMatrix = Mat4f::identity();
        m.maskingFromAlpha = c.want[2] != 0;
        m.maskingInvertTexture = c.want[3] != 0;
        Vec3f const P(0, 0, c.want[4]);
        EXPECT_EQ(m.f_calcMasking(nullptr, test::plainHit(), {0, 0}, P, {0, 0, 1}),
                  test::vec3(c.want, 5))
            << c.why;
        EXPECT_EQ(float(map.lookups.size()), c.want[8]) << c.why;
    }
}

} // namespace
} // namespace zsi
