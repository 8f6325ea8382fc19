// SPDX-License-Identifier: Apache-2.0
#include "materials/utility/corvid_Mtl_Unlit.h"

#include "materials/physical/shared/facedNormal.h"

namespace zsi {

void corvid_Mtl_Unlit::shade(IShaderAPI*, ShadeState& state) const
{
    if (state.rayType == kRayCamera)
        writeRgb(state, diffuseColor);
    else
        state.discardHit = 1;
}

void corvid_Mtl_Unlit::transmission(IShaderAPI*, ShadeState& state) const
{
    state.transmissionColor = {1.0f, 1.0f, 1.0f};
}

} // namespace zsi
