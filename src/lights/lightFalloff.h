// SPDX-License-Identifier: Apache-2.0
/// What the point light and the spot light share.
#pragma once

#include <cmath>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace zsi {

/// 1 at the light, 0 from the reference distance on: 1 - (d / reference)^exponent in [0, 1].
inline float distanceFalloff(float distance, Vec3f const& attenuationFactors)
{
    return clamp01(1.0f - std::pow(distance / attenuationFactors.x, attenuationFactors.y));
}

inline Vec3f lightShadow(IShaderAPI* api, ShadeState const& state, bool castShadows)
{
    if (!castShadows)
        return {1.0f, 1.0f, 1.0f};
    return api->shadowTransmission(&state.P, &state.lightPosition);
}

} // namespace zsi
