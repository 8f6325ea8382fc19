// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/physical/shared/ambientOcclusion.h"
#include "materials/physical/shared/masking.h"

namespace zsi {

/// Shows ambient occlusion as grey when switched on, plain white otherwise. The masking
/// parameters are there for hosts that set them on every material; this one does not read them.
#define AMBIENT_ONLY(P, U, A)  \
    AMBIENT_OCCLUSION(P, U, A) \
    MASKING(P, U, A)

class corvid_Mtl_AmbientOnly final : public MaterialShader,
                                     public AmbientOcclusionFunctions<corvid_Mtl_AmbientOnly> {
public:
    SHADER(corvid_Mtl_AmbientOnly, kShade, AMBIENT_ONLY)
    void shade(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
