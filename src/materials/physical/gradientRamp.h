// SPDX-License-Identifier: Apache-2.0
/// A gradient ramp over the square: black, grey, white from the middle to the rim.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// A colour at a position in [0, 1]; keys stand in rising order.
struct RampKey {
    float position;
    Vec4f color;
};

/// Piecewise-linear colour of the keys at t, held before the first and behind the last.
template <int N>
inline Vec4f rampColor(SLArray<RampKey, N> const& keys, float t)
{
    if (!(t > keys[0].position))
        return keys[0].color;
    for (int i = 1; i < N; ++i) {
        if (t > keys[i].position)
            continue;
        float const k = (t - keys[i - 1].position) / (keys[i].position - keys[i - 1].position);
        return keys[i - 1].color * (1.0f - k) + keys[i].color * k;
    }
    return keys[N - 1].color;
}

/// Distance from the middle of the unit square to its rim in the maximum norm, in [0, 1].
inline float boxDistance(Vec2f p)
{
    return clamp01(maxOf(2.0f * std::fabs(p.x - 0.5f), 2.0f * std::fabs(p.y - 0.5f)));
}

/// Colour of a box-shaped ramp at p in the unit square.
template <int N>
inline Vec4f f_elm_rtpb_gradient_ramp_color(IShaderAPI*, ShadeState const&,
                                            SLArray<RampKey, N> const& keys, Vec2f p)
{
    return rampColor(keys, boxDistance(p));
}

} // namespace zsi
