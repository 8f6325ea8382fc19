#include "environments/corvid_Env_Default.h"

namespace zsi {

void corvid_Env_Default::shade(IShaderAPI*, ShadeState& state) const
{
    // A ray of any kind at the depth limit is answered from the reflection cube.
    bool const depthLeft = state.rayDepth < state.maxRayDepth;
    if (depthLeft && state.rayType != kRayReflection) {
        state.Ci = state.rayType == kRayDiffuse ? diffuseIbl(*this, diffuseCube, state.I)
                                                : withAlpha(backgroundColor, 0.0f);
        return;
    }
    state.Ci = reflectIbl(*this, reflectionCube, state.I);
}

} // namespace zsi
