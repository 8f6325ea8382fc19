// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/corvid_Mtl_Ward_aa598cb4.h"

namespace zsi {

Vec4f WardFields_aa598cb4::normal0_map(NetworkSite const& at) const
{
    return NOISE_VALUE(at, _ward_normal0_map, BITMAP_VALUE(at, _ward_normal0_map_Noise_color1),
                       BITMAP_VALUE(at, _ward_normal0_map_Noise_color2));
}

Vec4f WardFields_aa598cb4::diffuse_color(NetworkSite const& at) const
{
    return NOISE_VALUE(at, _ward_diffuse_color, BITMAP_VALUE(at, _ward_diffuse_color_Noise_color1),
                       BITMAP_VALUE(at, _ward_diffuse_color_Noise_color2));
}

template class WardMaterial<WardFields_aa598cb4>;

} // namespace zsi
