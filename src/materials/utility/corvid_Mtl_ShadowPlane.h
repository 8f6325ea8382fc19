// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "runtime/shaderTable.h"

namespace zsi {

/// Shadow catcher: invisible but for the shadow and occlusion that fall on it; the alpha is the
/// strength of the shadow, ready to be laid over a plate.
#define SHADOW_PLANE(P, U, A)                                                               \
    P(Vec3f, shadowColor, (0.0f, 0.0f, 0.0f), "what full shadow and occlusion tend to")     \
    P(float, shadowIntensity, (0.7f), "how far full shadow goes from white to shadowColor", \
      slider(0, 1))

class corvid_Mtl_ShadowPlane final : public MaterialShader {
public:
    SHADER(corvid_Mtl_ShadowPlane, kShade | kTransmission | kSample, SHADOW_PLANE)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transmission(IShaderAPI* api, ShadeState& state) const override;
    void sample(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
