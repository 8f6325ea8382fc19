// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "runtime/shaderTable.h"

namespace zsi {

/// Point light with a range and a power-law fall-off.
/// At its defaults it is black: the fall-off there is 1 - d^0 = 0.
#define POINT_LIGHT(P, U, A)                                                        \
    P(Vec3f, color, (1.0f, 0.5f, 0.1f), "colour and intensity, linear RGB")         \
    P(bool, castShadows, (true), "ask the host for shadow transmission")            \
    P(float, range, (10000.0f), "world units; dark beyond", slider(0, 10000))       \
    P(Vec3f, attenuationFactors, (1.0f, 0.0f, 0.0f),                                \
      "times 1 - (distance / x)^y within 0..1, dark where y is 0; x: world units; " \
      "z: not used")

class voPointLight final : public LightShader {
public:
    SHADER(voPointLight, kIllumination, POINT_LIGHT)
    void illumination(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
