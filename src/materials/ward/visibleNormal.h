// SPDX-License-Identifier: Apache-2.0
/// Bumped normals turned back to where the viewer sees them.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// A bumped normal that the viewer can see. viewer: towards the viewer; plain: the unbumped normal
/// on the viewer's side. Where the tilt between plain and bumped normal carries it more than 89
/// degrees away from the viewer (measured in the plane of the tilt), or from the plain normal, it
/// is turned back along that arc. Unit length.
inline Vec3f f_adjustBumpNormal(IShaderAPI*, ShadeState const&, Vec3f viewer, Vec3f plain,
                                Vec3f bumped)
{
    constexpr float kMaxAngle = 1.553343f; // 89 degrees
    constexpr float kSmallTilt = 0.08f; // below: sin(a)/sin(b) loses digits
    Vec3f const v = normalize(viewer);
    Vec3f const n = normalize(plain);
    Vec3f const m = normalize(bumped);
    float const cosTilt = clamp(dot(n, m), -1.0f, 1.0f);
    Vec3f const across = normalize(m - n * cosTilt);
    float const tilt = std::acos(cosTilt);
    // Where the viewer stands along the arc, seen from the plain normal.
    float const seen = std::atan2(dot(v, across), dot(v, n));
    float const kept = clamp(minOf(tilt, seen + kMaxAngle), 0.0f, kMaxAngle);
    if (!(kept < tilt))
        return m;
    if (tilt < kSmallTilt) {
        float const w = (1.0f - std::cos(kept)) / (1.0f - cosTilt);
        return normalize(n * (1.0f - w) + m * w);
    }
    float const sinTilt = std::sin(tilt);
    return normalize(n * (std::sin(tilt - kept) / sinTilt) + m * (std::sin(kept) / sinTilt));
}

} // namespace zsi
