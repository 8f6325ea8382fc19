// SPDX-License-Identifier: Apache-2.0
/// Rotation of a shading frame about its normal, for materials with stretched highlights.
#pragma once

#include "runtime/shaderTable.h"

#include <cmath>
#include <zsi/vecmath.h>

namespace zsi {

/// The frame with tangent and bitangent turned by `angle` radians, tangent towards bitangent. No
/// renormalisation.
inline SLArray<Vec3f> rotatedAboutNormal(SLArray<Vec3f> frame, float angle)
{
    float const c = std::cos(angle);
    float const s = std::sin(angle);
    Vec3f const T = frame[0];
    Vec3f const B = frame[1];
    frame[0] = T * c + B * s;
    frame[1] = T * -s + B * c;
    return frame;
}

/// `f_anisoRotateFrame` for a class that has the channel `u_anisoRotation*`. The amount that
/// scales its map is optional.
template <class Shader>
struct AnisoRotationFunctions {
    /// angle: radians; below 0.0001, so for every negative angle too, the channel counts instead.
    /// An angle that is not a number does not turn.
    void f_anisoRotateFrame(IShaderAPI*, ShadeState const& state, SLArray<Vec3f>& frame,
                            float angle) const
    {
        auto const& s = static_cast<Shader const&>(*this);
        if (angle < 0.0001f) {
            angle = s.u_anisoRotationValue;
            if (s.u_anisoRotationMapEnable) [[unlikely]] {
                Vec2f const uv =
                    transformUv(s.u_anisoRotationTransform, Shader::attribute_uv(state));
                angle = s.u_anisoRotationMap.lookup(uv).x;
                if constexpr (requires { s.u_anisoRotationAmount; })
                    angle *= s.u_anisoRotationAmount;
            }
        }
        if (angle != 0.0f && std::isfinite(angle))
            frame = rotatedAboutNormal(frame, angle);
    }
};

} // namespace zsi
