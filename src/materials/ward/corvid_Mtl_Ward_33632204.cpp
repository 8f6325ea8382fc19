// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/corvid_Mtl_Ward_33632204.h"

namespace zsi {

Vec4f WardFields_33632204::normal0_map(NetworkSite const& at) const
{
    return NOISE_VALUE(at, _ward_normal0_map,
                       NOISE_VALUE(at, _ward_normal0_map_Noise_color1,
                                   BITMAP_VALUE(at, _ward_normal0_map_Noise_color1_Noise_color1),
                                   BITMAP_VALUE(at, _ward_normal0_map_Noise_color1_Noise_color2)),
                       NOISE_VALUE(at, _ward_normal0_map_Noise_color2,
                                   BITMAP_VALUE(at, _ward_normal0_map_Noise_color2_Noise_color1),
                                   BITMAP_VALUE(at, _ward_normal0_map_Noise_color2_Noise_color2)));
}

Vec4f WardFields_33632204::diffuse_color(NetworkSite const& at) const
{
    return NOISE_VALUE(
        at, _ward_diffuse_color,
        NOISE_VALUE(at, _ward_diffuse_color_Noise_color1,
                    BITMAP_VALUE(at, _ward_diffuse_color_Noise_color1_Noise_color1),
                    BITMAP_VALUE(at, _ward_diffuse_color_Noise_color1_Noise_color2)),
        NOISE_VALUE(at, _ward_diffuse_color_Noise_color2,
                    BITMAP_VALUE(at, _ward_diffuse_color_Noise_color2_Noise_color1),
                    BITMAP_VALUE(at, _ward_diffuse_color_Noise_color2_Noise_color2)));
}

template class WardMaterial<WardFields_33632204>;

} // namespace zsi
