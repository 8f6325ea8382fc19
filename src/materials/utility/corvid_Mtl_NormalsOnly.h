// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "runtime/shaderTable.h"

namespace zsi {

/// Shows which way normals face: blue fronts and yellow backs, or a two-sided green or orange.
#define NORMALS_ONLY(P, U, A)                                                            \
    P(bool, reverseNormal, (false), "negate the shading normal")                         \
    P(bool, faceForward, (false), "turn the normal towards the viewer; two-sided green") \
    P(bool, faceLight, (false), "two-sided orange; faceForward goes first")

class corvid_Mtl_NormalsOnly final : public MaterialShader {
public:
    SHADER(corvid_Mtl_NormalsOnly, kShade, NORMALS_ONLY)
    void shade(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
