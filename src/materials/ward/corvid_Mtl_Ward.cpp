#include "materials/ward/corvid_Mtl_Ward.h"

namespace zsi {

void corvid_Mtl_Ward::shade(IShaderAPI* api, ShadeState& state) const { shadeWard(api, state); }

void corvid_Mtl_Ward::transmission(IShaderAPI* api, ShadeState& state) const
{
    transmissionWard(api, state);
}

void corvid_Mtl_Ward::transfer(IShaderAPI* api, ShadeState& state) const
{
    transferWard(api, state);
}

void corvid_Mtl_Ward::sample(IShaderAPI* api, ShadeState& state) const { sampleWard(api, state); }

} // namespace zsi
