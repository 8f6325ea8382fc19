// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/physical/shared/materialSkeleton.h"

namespace zsi {

/// A perfect mirror whose reflection rises a little towards grazing angles. At its defaults it is
/// black. The ambient-occlusion parameters are there for hosts that set them on every material;
/// this one does not read them.
#define MIRROR(P, U, A)                                                               \
    AMBIENT_OCCLUSION(P, U, A)                                                        \
    MASKING(P, U, A)                                                                  \
    P(Vec3f, u_tintColor, (0.0f, 0.0f, 0.0f), "colour of the reflection, linear RGB") \
    A(Vec2f, uv)

class corvid_Mtl_Mirror final : public MaterialShader, public MaskingFunctions<corvid_Mtl_Mirror> {
public:
    SHADER(corvid_Mtl_Mirror, kShade | kTransfer | kSample, MIRROR)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    /// A perfect mirror scatters nothing into a given direction: writes nothing.
    void transfer(IShaderAPI* api, ShadeState& state) const override;
    void sample(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
