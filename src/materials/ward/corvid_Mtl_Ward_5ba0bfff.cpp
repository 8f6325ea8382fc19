// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/corvid_Mtl_Ward_5ba0bfff.h"

namespace zsi {

Vec4f WardFields_5ba0bfff::normal0_map(NetworkSite const& at) const
{
    return NOISE_VALUE(at, _ward_normal0_map, _ward_normal0_map_Noise_color1,
                       _ward_normal0_map_Noise_color2);
}

template class WardMaterial<WardFields_5ba0bfff>;

} // namespace zsi
