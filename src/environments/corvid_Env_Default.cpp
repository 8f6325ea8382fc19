// SPDX-License-Identifier: Apache-2.0
#include "environments/corvid_Env_Default.h"

namespace zsi {

void corvid_Env_Default::shade(IShaderAPI*, ShadeState& state) const
{
    // A ray of any kind at the depth limit is answered from the reflection cube.
    if (!(state.rayDepth < state.maxRayDepth) || state.rayType == kRayReflection)
        state.Ci = reflectIbl(*this, reflectionCube, state.I);
    else if (state.rayType == kRayDiffuse)
        state.Ci = diffuseIbl(*this, diffuseCube, state.I);
    else
        state.Ci = withAlpha(backgroundColor, 0.0f);
}

} // namespace zsi
