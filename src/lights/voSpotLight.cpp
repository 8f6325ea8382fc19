// SPDX-License-Identifier: Apache-2.0
#include "lights/voSpotLight.h"

#include "lights/lightFalloff.h"

namespace zsi {

void voSpotLight::illumination(IShaderAPI* api, ShadeState& state) const
{
    if (state.lightDistance > range) // strict: a point exactly at range is lit
        return;
    float const cosine = clamp01(dot(state.lightToPoint, state.lightAxis));
    if (cosPenumbra > cosine) // before the shadow query: dark points cost no ray
        return;
    state.lightShadow = lightShadow(api, state, castShadows);

    float cone = 1.0f;
    if (cosUmbra > cosine) {
        float const s = clamp01((cosine - cosPenumbra) / (cosUmbra - cosPenumbra));
        cone = s * s * (3.0f - s - s);
    }
    float const falloff = distanceFalloff(state.lightDistance, attenuationFactors)
        * std::pow(cosine, attenuationFactors.z);
    state.lightColor = color * cone * falloff;
}

} // namespace zsi
