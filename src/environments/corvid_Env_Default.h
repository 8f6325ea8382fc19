// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "environments/iblParameters.h"
#include "runtime/shaderTable.h"

namespace zsi {

/// Environment of image-based light: one graded cube for reflection rays, one for diffuse rays,
/// and a flat, transparent background for all others.
#define ENV_DEFAULT(P, U, A)                                                                  \
    IBL_GRADING(P, U, A)                                                                      \
    P(Vec3f, backgroundColor, (0.0f, 0.5f, 0.7f), "what other rays see, linear RGB, alpha 0") \
    P(TextureSamplerCube, reflectionCube, (), "environment of reflection rays")               \
    P(TextureSamplerCube, diffuseCube, (), "environment of diffuse rays")

class corvid_Env_Default final : public EnvironmentShader {
public:
    SHADER(corvid_Env_Default, kEnvironmentShade, ENV_DEFAULT)
    void shade(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
