// SPDX-License-Identifier: Apache-2.0
/// The mask that cuts a material out: parameters and evaluation.
#pragma once

#include "runtime/shaderTable.h"

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi {

#define MASKING(P, U, A)                                                                          \
    P(Vec3f, maskingColor, (0.0f, 0.0f, 0.0f), "mask of mode 0: 0 keeps the material, 1 removes", \
      group("masking"))                                                                           \
    P(int, maskingMode, (0), "-1 off, 0 constant, 1 UV, 2 planar, 3 box, 4 cylindrical",          \
      slider(-1, 4))                                                                              \
    P(TextureSampler2D, maskingTexture, (), "mask map")                                           \
    U(Mat4f, maskingTextureMatrix, "position to texture", when("maskingMode", 2, 4))              \
    P(bool, maskingInvertTexture, (false), "invert the mask", when("maskingMode", 1, 4))          \
    P(float, maskingAngularRepeat, (1.0f), "repeats around the axis", slider(0, 16),              \
      when("maskingMode", 4, 4))                                                                  \
    U(Mat3f, maskingUVMatrix, "UV transform", when("maskingMode", 1, 1), when("maskingTexture"))  \
    P(bool, maskingFromAlpha, (false), "take the mask from the alpha of the map", groupEnd())

enum MaskingMode : int {
    kMaskOff = -1,
    kMaskConstant = 0,
    kMaskUv = 1,
    kMaskPlanar = 2,
    kMaskBox = 3,
    kMaskCylindrical = 4,
};

/// Map coordinate of a projecting mode. q: projected position; n: projected normal.
inline Vec2f maskCoordinate(int mode, Vec3f q, Vec3f n, float angularRepeat)
{
    switch (mode) {
    case kMaskPlanar:
        return {q.x, q.y};
    case kMaskBox: {
        float const x = std::fabs(n.x), y = std::fabs(n.y), z = std::fabs(n.z);
        if (y <= x && x > z) // x wins over an equal y
            return {q.z, q.y};
        if (y > x && z <= y) // y wins over an equal z
            return {q.x, q.z};
        return {q.x, q.y};
    }
    case kMaskCylindrical: {
        constexpr float kInvTwoPi = 0.1591549f;
        float const turn = std::atan2(q.x - 0.5f, q.y - 0.5f) * kInvTwoPi; // x first on purpose
        return {(turn + 0.5f) * angularRepeat, q.z};
    }
    default:
        return {0.0f, 0.0f};
    }
}

/// `f_calcMasking` for a class that has the rows of MASKING; derive with the class as argument.
template <class Shader>
struct MaskingFunctions {
    /// Mask per channel: 0 keeps the material, 1 replaces it by what lies behind.
    /// P, N: the position and normal that the projecting modes project.
    Vec3f f_calcMasking(IShaderAPI*, ShadeState const&, Vec2f uv, Vec3f P, Vec3f N) const
    {
        auto const& s = static_cast<Shader const&>(*this);
        int const mode = s.maskingMode;
        if (mode == kMaskOff)
            return {0.0f, 0.0f, 0.0f};
        if (mode == kMaskConstant)
            return s.maskingColor; // never inverted

        Vec3f q(0.0f, 0.0f, 0.0f);
        Vec2f coordinate;
        if (mode == kMaskUv) {
            coordinate = transformUv(s.maskingUVMatrix, uv);
        } else {
            q = transformPoint(s.maskingTextureMatrix, P);
            coordinate = maskCoordinate(mode, q, transformDirection(s.maskingTextureMatrix, N),
                                        s.maskingAngularRepeat);
        }

        Vec4f texel(0.0f, 0.0f, 0.0f, 1.0f);
        if (s.maskingTexture.texture)
            texel = s.maskingTexture.lookup(coordinate);
        Vec3f mask = s.maskingFromAlpha ? grey(texel.w) : rgb(texel);
        if (s.maskingInvertTexture && mode > 0)
            mask = grey(1.0f) - mask;
        // Outside the projector's depth the surface is masked out.
        if (mode == kMaskPlanar && (q.z < -1.0f || q.z > 1.0f))
            mask = {1.0f, 1.0f, 1.0f};
        return mask;
    }
};

} // namespace zsi
