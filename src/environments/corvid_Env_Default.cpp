#include "environments/corvid_Env_Default.h"

namespace zsi {

// Apart from `shade`, so that the flat background pays for no stack frame; arguments where `shade`
// has them.
[[gnu::noinline]] static void shadeDiffuse(corvid_Env_Default const& shader, IShaderAPI*,
                                           ShadeState& state)
{
    state.Ci = diffuseIbl(shader, shader.diffuseCube, state.I);
}
[[gnu::noinline]] static void shadeReflection(corvid_Env_Default const& shader, IShaderAPI*,
                                              ShadeState& state)
{
    state.Ci = reflectIbl(shader, shader.reflectionCube, state.I);
}

void corvid_Env_Default::shade(IShaderAPI* api, ShadeState& state) const
{
    // A ray of any kind at the depth limit is answered from the reflection cube.
    if (!(state.rayDepth < state.maxRayDepth) || state.rayType == kRayReflection)
        shadeReflection(*this, api, state);
    else if (state.rayType == kRayDiffuse)
        shadeDiffuse(*this, api, state);
    else
        state.Ci = withAlpha(backgroundColor, 0.0f);
}

} // namespace zsi
