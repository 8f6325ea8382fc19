// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/corvid_Mtl_Ward_ccb3a2e6.h"

namespace zsi {

Vec4f WardFields_ccb3a2e6::diffuse_color(NetworkSite const& at) const
{
    return NOISE_VALUE(at, _ward_diffuse_color, BITMAP_VALUE(at, _ward_diffuse_color_Noise_color1),
                       BITMAP_VALUE(at, _ward_diffuse_color_Noise_color2));
}

template class WardMaterial<WardFields_ccb3a2e6>;

} // namespace zsi
