// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/corvid_Mtl_Ward_b9aac246.h"

namespace zsi {

Vec4f WardFields_b9aac246::normal0_map(NetworkSite const& at) const
{
    return BITMAP_VALUE(at, _ward_normal0_map);
}

Vec4f WardFields_b9aac246::diffuse_color(NetworkSite const& at) const
{
    return NOISE_VALUE(
        at, _ward_diffuse_color,
        TILE_VALUE(at, _ward_diffuse_color_Noise_color1,
                   BITMAP_VALUE(at, _ward_diffuse_color_Noise_color1_Tile_brickColor),
                   BITMAP_VALUE(at, _ward_diffuse_color_Noise_color1_Tile_mortarColor)),
        TILE_VALUE(at, _ward_diffuse_color_Noise_color2,
                   BITMAP_VALUE(at, _ward_diffuse_color_Noise_color2_Tile_brickColor),
                   BITMAP_VALUE(at, _ward_diffuse_color_Noise_color2_Tile_mortarColor)));
}

template class WardMaterial<WardFields_b9aac246>;

} // namespace zsi
