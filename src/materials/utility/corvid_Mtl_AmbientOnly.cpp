// SPDX-License-Identifier: Apache-2.0
#include "materials/utility/corvid_Mtl_AmbientOnly.h"

namespace zsi {

void corvid_Mtl_AmbientOnly::shade(IShaderAPI* api, ShadeState& state) const
{
    state.Ci = {1.0f, 1.0f, 1.0f, 1.0f};
    if (!showAmbientOnly)
        return;
    Vec3f const occlusion = f_calcAmbientOcclusion(api, state, 1.0f);
    // A baked mode that is neither texture nor vertex colour leaves white, which is its own
    // minimum.
    state.Ci = withAlpha(grey(minComponent(occlusion)), 1.0f);
}

} // namespace zsi
