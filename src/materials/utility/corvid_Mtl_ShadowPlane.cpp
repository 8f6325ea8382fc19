// SPDX-License-Identifier: Apache-2.0
#include "materials/utility/corvid_Mtl_ShadowPlane.h"

#include "materials/physical/shared/straightThrough.h"

#include <zsi/vecmath.h>

namespace zsi {

void corvid_Mtl_ShadowPlane::shade(IShaderAPI* api, ShadeState& state) const
{
    Vec3f const kOne(1.0f, 1.0f, 1.0f);

    float unshadowed = 0.0f; // one number: its three channels would always be equal
    Vec3f shadowed(0.0f, 0.0f, 0.0f);
    for (LightSample const* l = api->getLightSamples(0, &state.P, &state.N); l; l = l->next) {
        unshadowed += maxComponent(l->color);
        shadowed += l->shadow * maxComponent(l->color * l->shadow);
    }
    Vec3f const open = api->occlusion(&state.P, &state.N, 1.0f);

    // NaN compares unequal, so a broken light shows instead of vanishing.
    if (shadowed == grey(unshadowed) && open == kOne) {
        state.discardHit = 1;
        return;
    }

    Vec3f const ratio = unshadowed == 0.0f ? kOne : shadowed / unshadowed;
    Vec3f const tint = shadowColor * shadowIntensity + grey(1.0f - shadowIntensity);
    Vec3f const shadow = tint * (kOne - ratio) + ratio;
    Vec3f const occlusion = open + (kOne - open) * shadowColor; // the intensity is not for this one
    Vec3f const x = shadow * occlusion;

    // A camera ray goes on as a transmission ray, so that an environment can tell the two.
    int const rayType =
        static_cast<int>(state.rayType == kRayCamera ? kRayTransmission : state.rayType);
    Vec3f const behind = api->traceContinue(rayType, &state.P, &state.I, 1.0f);
    state.Ci = withAlpha(behind * x, 1.0f - minComponent(x));
}

void corvid_Mtl_ShadowPlane::transmission(IShaderAPI*, ShadeState& state) const
{
    state.transmissionColor = grey(state.rayType == kRayShadow ? 0.0f : 1.0f);
}

void corvid_Mtl_ShadowPlane::sample(IShaderAPI*, ShadeState& state) const
{
    sampleStraightThrough(state);
}

} // namespace zsi
