#include "environments/corvid_Env_Default.h"

namespace zsi {

// Apart from `shade`, so that the flat background pays for no stack frame.
[[gnu::noinline]] static void shadeIbl(corvid_Env_Default const& shader, ShadeState& state,
                                       bool diffuse)
{
    state.Ci = diffuse ? diffuseIbl(shader, shader.diffuseCube, state.I)
                       : reflectIbl(shader, shader.reflectionCube, state.I);
}

void corvid_Env_Default::shade(IShaderAPI*, ShadeState& state) const
{
    // A ray of any kind at the depth limit is answered from the reflection cube.
    bool const depthLeft = state.rayDepth < state.maxRayDepth;
    bool const diffuse = depthLeft && state.rayType == kRayDiffuse;
    if (diffuse || !depthLeft || state.rayType == kRayReflection)
        shadeIbl(*this, state, diffuse);
    else
        state.Ci = withAlpha(backgroundColor, 0.0f);
}

} // namespace zsi
