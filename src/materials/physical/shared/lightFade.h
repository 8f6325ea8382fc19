// SPDX-License-Identifier: Apache-2.0
/// How lights fade in over the horizon.
#pragma once

#include <zsi/vecmath.h>

namespace zsi {

/// 0 up to a cosine of 0.05 above the horizon, a smoothstep over the next 0.2, then 1. NaN stays.
inline float lightFade(float cosine)
{
    float const rise = cosine - 0.05f;
    if (rise > 0.2f) // most lights
        return 1.0f;
    if (rise < 0.0f)
        return 0.0f;
    float const t = rise / 0.2f;
    return t * t * (3.0f - 2.0f * t);
}

} // namespace zsi
