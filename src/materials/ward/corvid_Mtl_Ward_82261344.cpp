// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/corvid_Mtl_Ward_82261344.h"

namespace zsi {

Vec4f WardFields_82261344::cutout_map(NetworkSite const& at) const
{
    return BITMAP_VALUE(at, _ward_cutout_map);
}

Vec4f WardFields_82261344::diffuse_color(NetworkSite const& at) const
{
    return NOISE_VALUE(at, _ward_diffuse_color, BITMAP_VALUE(at, _ward_diffuse_color_Noise_color1),
                       BITMAP_VALUE(at, _ward_diffuse_color_Noise_color2));
}

template class WardMaterial<WardFields_82261344>;

} // namespace zsi
