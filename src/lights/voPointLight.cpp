// SPDX-License-Identifier: Apache-2.0
#include "lights/voPointLight.h"

#include "lights/lightFalloff.h"

namespace zsi {

void voPointLight::illumination(IShaderAPI* api, ShadeState& state) const
{
    if (state.lightDistance > range) // strict: a point exactly at range is lit
        return;
    state.lightShadow = lightShadow(api, state, castShadows);
    state.lightColor = color * distanceFalloff(state.lightDistance, attenuationFactors);
}

} // namespace zsi
