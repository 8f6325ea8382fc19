// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/corvid_Mtl_Ward_f05db29e.h"

namespace zsi {

Vec4f WardFields_f05db29e::normal0_map(NetworkSite const& at) const
{
    return BITMAP_VALUE(at, _ward_normal0_map);
}

Vec4f WardFields_f05db29e::diffuse_color(NetworkSite const& at) const
{
    return TILE_VALUE(at, _ward_diffuse_color,
                      BITMAP_VALUE(at, _ward_diffuse_color_Tile_brickColor),
                      BITMAP_VALUE(at, _ward_diffuse_color_Tile_mortarColor));
}

template class WardMaterial<WardFields_f05db29e>;

} // namespace zsi
