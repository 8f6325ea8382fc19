// SPDX-License-Identifier: Apache-2.0
/// How a channel's colour comes to a point of a surface: a plain colour, or a picture laid on by
/// UV, planar, box or cylindrical projection.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

enum MappingMode : int {
    kMapNone = -1, ///< black
    kMapColor = 0, ///< the plain colour; the texture is not read
    kMapUv = 1,
    kMapPlanar = 2, ///< along the z axis of texture space
    kMapBox = 3, ///< along the axis of texture space that the normal is nearest to
    kMapAngular = 4, ///< around the z axis of texture space
};

/// Projection of kMapBox. n: absolute values of the normal's components in texture space.
/// First and second entry: the axes that are u and v; third: the axis projected along. x wins
/// over an equal y and y over an equal z; three equal components give (0, 1, 1).
constexpr Vec3i boxProjection(Vec3f n)
{
    bool const yOverX = n.y > n.x, zOverY = n.z > n.y, xOverZ = n.x > n.z;
    if (xOverZ && !yOverX)
        return {2, 1, 0};
    if (yOverX && !zOverY)
        return {0, 2, 1};
    return {0, 1, zOverY ? 2 : 1};
}

/// A channel of a material as its parameters give it.
struct MappedChannel {
    int mode; ///< a MappingMode; others look up (0, 0)
    Vec3f color; ///< of kMapColor
    TextureSampler2D const& texture;
    Mat4f const&
        textureMatrix; ///< position to texture space (row vectors), kMapPlanar to kMapAngular
    float angularRepeat; ///< repeats of the picture around the axis, kMapAngular
    Mat3f const& uvMatrix; ///< transform of uv, kMapUv
};

/// How a projecting mode laid the picture, in texture space.
struct MappedAxes {
    Vec3i box{0, 1, 2}; ///< written by kMapBox, as `boxProjection` says
    /// Written by kMapAngular: against the direction of rising u, unit unless on the axis; and
    /// along rising v.
    Vec3f tangentU{0.0f, 0.0f, 0.0f}, tangentV{0.0f, 0.0f, 0.0f};
};

/// The mapping itself; shaders have it as `f_evalMapping` through the structures below.
///
/// planarBox: kMapBox projects along z whatever the normal.
/// alphaAsColor: the texel's alpha in all four channels, where a texture is read.
inline Vec4f evalMapping(int mode, bool planarBox, Vec3f const& color,
                         TextureSampler2D const& texture, Mat4f const& textureMatrix,
                         float angularRepeat, Vec3f const& position, Vec3f const& normal,
                         bool alphaAsColor, Vec2f const& uv, Vec3i& boxAxes, Vec3f& tangentU,
                         Vec3f& tangentV, Mat3f const& uvMatrix)
{
    if (mode == kMapNone)
        return {0.0f, 0.0f, 0.0f, 1.0f};
    if (mode == kMapColor)
        return withAlpha(color, 1.0f);

    Vec2f at(0.0f, 0.0f);
    if (mode == kMapUv) {
        at = transformUv(uvMatrix, uv);
    } else if (mode == kMapPlanar || mode == kMapBox || mode == kMapAngular) {
        Vec3f const q = transformPoint(textureMatrix, position);
        if (mode == kMapPlanar) {
            at = {q.x, q.y};
        } else if (mode == kMapBox) {
            Vec3f const n = transformDirection(textureMatrix, normal);
            boxAxes = planarBox ? Vec3i(0, 1, 2)
                                : boxProjection({std::fabs(n.x), std::fabs(n.y), std::fabs(n.z)});
            at = {boxAxes.x == 2 ? q.z : q.x, boxAxes.y == 2 ? q.z : q.y};
        } else {
            constexpr float kInvTwoPi = 0.15915490686893463f;
            // The angle from the y axis: x first on purpose.
            at.x = angularRepeat * (std::atan2(q.x - 0.5f, q.y - 0.5f) * kInvTwoPi + 0.5f);
            at.y = q.z;
            tangentU = {-q.y, q.x, 0.0f};
            float const radius = std::sqrt(q.x * q.x + q.y * q.y);
            if (radius > 0.0f)
                tangentU *= 1.0f / radius;
            tangentV = {0.0f, 0.0f, 1.0f};
        }
    }
    Vec4f const texel = texture.lookup(at);
    return alphaAsColor ? withAlpha(grey(texel.w), texel.w) : texel;
}

/// `f_evalMapping` of a shader that derives from this.
struct TextureMappingFunctions {
    Vec4f f_evalMapping(IShaderAPI*, ShadeState const&, int mode, Vec3f const& color,
                        TextureSampler2D const& texture, Mat4f const& textureMatrix,
                        float angularRepeat, Vec3f const& position, Vec3f const& normal,
                        bool alphaAsColor, Vec2f const& uv, Vec3i& boxAxes, Vec3f& tangentU,
                        Vec3f& tangentV, Mat3f const& uvMatrix) const
    {
        return evalMapping(mode, false, color, texture, textureMatrix, angularRepeat, position,
                           normal, alphaAsColor, uv, boxAxes, tangentU, tangentV, uvMatrix);
    }
    /// A channel at a hit. normal: chooses the axis of a box.
    Vec4f evalChannel(IShaderAPI* api, ShadeState const& state, MappedChannel const& c,
                      Vec3f const& normal, Vec2f const& uv, MappedAxes& axes) const
    {
        return f_evalMapping(api, state, c.mode, c.color, c.texture, c.textureMatrix,
                             c.angularRepeat, state.Pref, normal, false, uv, axes.box,
                             axes.tangentU, axes.tangentV, c.uvMatrix);
    }
};

/// The variant with a switch: with `triplanarXY` the box is planar, along z.
struct TriplanarMappingFunctions {
    Vec4f f_evalMapping(IShaderAPI*, ShadeState const&, int mode, bool triplanarXY,
                        Vec3f const& color, TextureSampler2D const& texture,
                        Mat4f const& textureMatrix, float angularRepeat, Vec3f const& position,
                        Vec3f const& normal, bool alphaAsColor, Vec2f const& uv, Vec3i& boxAxes,
                        Vec3f& tangentU, Vec3f& tangentV, Mat3f const& uvMatrix) const
    {
        return evalMapping(mode, triplanarXY, color, texture, textureMatrix, angularRepeat,
                           position, normal, alphaAsColor, uv, boxAxes, tangentU, tangentV,
                           uvMatrix);
    }
    /// A channel at a hit.
    Vec4f evalChannel(IShaderAPI* api, ShadeState const& state, MappedChannel const& c,
                      bool triplanarXY, bool alphaAsColor, Vec2f const& uv, MappedAxes& axes) const
    {
        return f_evalMapping(api, state, c.mode, triplanarXY, c.color, c.texture, c.textureMatrix,
                             c.angularRepeat, state.Pref, state.Nref, alphaAsColor, uv, axes.box,
                             axes.tangentU, axes.tangentV, c.uvMatrix);
    }
};

} // namespace zsi
