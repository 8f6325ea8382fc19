// SPDX-License-Identifier: Apache-2.0
#include "environments/corvid_Env_Backplate.h"

namespace zsi {

Vec3f corvid_Env_Backplate::screenPlate(ShadeState const& state) const
{
    float const height =
        render_size.y < 0.0f ? static_cast<float>(state.imageHeight) : render_size.y;
    float const u = state.rasterX * uv_scale.x + uv_offset.x;
    float const v = (height - state.rasterY) * uv_scale.y + uv_offset.y; // v up, raster rows down
    if (u < 0.0f || u > 1.0f || v < 0.0f || v > 1.0f) // the rim belongs to the image
        return backgroundColor;
    return rgb(backgroundImage.lookup({u, v}));
}

Vec3f corvid_Env_Backplate::cubePlate(ShadeState const& state) const
{
    float const sx = (state.rasterX * uv_scale.x + uv_offset.x) * 2.0f;
    // The offset is subtracted here, where the screen plate adds it.
    float const sy = (1.0f - uv_offset.y - state.rasterY * uv_scale.y) * 2.0f;
    float const zoom = 1.0f / backplateCloseUp;
    float const a = (sx - 1.0f) * 0.5f * camerawindowsize.x * zoom;
    float const b = (sy - 1.0f) * 0.5f * camerawindowsize.y * zoom + backplateHorizon;
    Vec3f const d = rotate(Mat3f(backplatetransform), {a, b, 1.0f});
    Vec3f const r = rotate(backplateCubeRotation, d);
    // The window looks along +z with x to the right: x and y turn round before the axis swap.
    return rgb(backplateCube.lookup(cubeCoordinate({-r.x, -r.y, r.z})));
}

void corvid_Env_Backplate::shade(IShaderAPI*, ShadeState& state) const
{
    if (state.rayType == kRayReflection && useCubeReflection) {
        state.Ci = reflectIbl(*this, reflectionCube, state.I);
        return;
    }
    bool const primary = state.rayType == kRayTransmission || state.rayType == kRayCamera;
    if (useBackgroundImage && primary) {
        state.Ci = withAlpha(useCubeBackplate ? cubePlate(state) : screenPlate(state), 0.0f);
        return;
    }
    state.Ci = state.rayType == kRayDiffuse ? diffuseIbl(*this, diffuseCube, state.I)
                                            : withAlpha(backgroundColor, 0.0f);
}

} // namespace zsi
