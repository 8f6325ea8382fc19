// SPDX-License-Identifier: Apache-2.0
#include "materials/ward/corvid_Mtl_Ward_120b7820.h"

namespace zsi {

Vec4f WardFields_120b7820::diffuse_color(NetworkSite const& at) const
{
    return NOISE_VALUE(at, _ward_diffuse_color, _ward_diffuse_color_Noise_color1,
                       _ward_diffuse_color_Noise_color2);
}

template class WardMaterial<WardFields_120b7820>;

} // namespace zsi
