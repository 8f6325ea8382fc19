// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "runtime/shaderTable.h"

namespace zsi {

/// Spot light: a cone with a smooth rim, a range and a power-law fall-off.
/// At its defaults it is black: the fall-off there is 1 - d^0 = 0.
#define SPOT_LIGHT(P, U, A)                                                                    \
    P(Vec3f, color, (0.1f, 1.0f, 0.5f), "colour and intensity, linear RGB")                    \
    P(float, range, (10000.0f), "world units; dark beyond", slider(0, 10000))                  \
    P(Vec3f, attenuationFactors, (1.0f, 0.0f, 0.0f),                                           \
      "times 1 - (distance / x)^y within 0..1, dark where y is 0; x: world units; "            \
      "times (cosine off the axis)^z")                                                         \
    P(bool, castShadows, (true), "ask the host for shadow transmission")                       \
    P(float, cosPenumbra, (0.9f), "cosine of the outer cone; dark outside", slider(0, 1))      \
    P(float, cosUmbra, (0.95f), "cosine of the inner cone; full inside, a smoothstep between", \
      slider(0, 1))

class voSpotLight final : public LightShader {
public:
    SHADER(voSpotLight, kIllumination, SPOT_LIGHT)
    void illumination(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
