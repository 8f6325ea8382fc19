// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "runtime/shaderTable.h"

namespace zsi {

/// A constant colour that only camera rays see; every other ray goes on behind it.
#define UNLIT(P, U, A) P(Vec3f, diffuseColor, (1.0f, 1.0f, 0.0f), "linear RGB; yellow until set")

class corvid_Mtl_Unlit final : public MaterialShader {
public:
    SHADER(corvid_Mtl_Unlit, kShade | kTransmission, UNLIT)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transmission(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
