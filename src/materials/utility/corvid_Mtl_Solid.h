// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "runtime/shaderTable.h"

namespace zsi {

/// A flat colour chosen by a state, darkened with the viewing angle. No light, no services.
/// The normal switches never change the picture: the cosine is taken as an absolute value.
#define SOLID(P, U, A)                                                          \
    P(bool, reverseNormal, (false), "negate the shading normal")                \
    P(bool, faceForward, (false), "turn the shading normal towards the viewer") \
    P(int, patchState, (0), "0 and 1: lilac, 2: light grey, others: black", slider(0, 3))

class corvid_Mtl_Solid final : public MaterialShader {
public:
    SHADER(corvid_Mtl_Solid, kShade, SOLID)
    void shade(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
