// SPDX-License-Identifier: Apache-2.0
#include "materials/utility/corvid_Mtl_Solid.h"

#include "materials/physical/shared/facedNormal.h"

namespace zsi {

static Vec3f patchColor(int patchState)
{
    switch (patchState) {
    case 0:
    case 1: // the same lilac on purpose
        return {0.69f, 0.58f, 0.69f};
    case 2:
        return {0.85f, 0.85f, 0.85f};
    default:
        return {0.0f, 0.0f, 0.0f};
    }
}

void corvid_Mtl_Solid::shade(IShaderAPI*, ShadeState& state) const
{
    float const d = std::fabs(dot(state.I, facedNormal(state, reverseNormal, faceForward)));
    writeRgb(state, clamp01(patchColor(patchState) * d));
}

} // namespace zsi
