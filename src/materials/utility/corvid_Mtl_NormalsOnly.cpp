// SPDX-License-Identifier: Apache-2.0
#include "materials/utility/corvid_Mtl_NormalsOnly.h"

#include "materials/physical/shared/facedNormal.h"

namespace zsi {

void corvid_Mtl_NormalsOnly::shade(IShaderAPI*, ShadeState& state) const
{
    state.Ci = withAlpha(facingColor(state, reverseNormal, faceForward, faceLight), 1.0f);
}

} // namespace zsi
