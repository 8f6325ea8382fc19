/// How lights fade in over the horizon.
#pragma once

#include <zsi/vecmath.h>

namespace zsi {

/// 0 up to a cosine of 0.05 above the horizon, a smoothstep over the next 0.2, then 1.
inline float lightFade(float cosine)
{
    float const t = clamp(cosine - 0.05f, 0.0f, 0.2f) / 0.2f;
    return t * t * (3.0f - 2.0f * t);
}

} // namespace zsi
