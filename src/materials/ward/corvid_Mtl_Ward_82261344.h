// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

/// Ward surface whose diffuse colour is two pictures blended by a noise, cut out by a picture.
#define WARD_82261344(P, U, A)                       \
    WARD_VARIANT_FRONT(P, U, A)                      \
    BITMAP_ROWS(U, _ward_cutout_map)                 \
    NOISE_ROWS(U, _ward_diffuse_color)               \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color1) \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color2) \
    WARD_VARIANT_BACK(P, U, A)

struct WardFields_82261344 : MaterialShader {
    SHADER(WardFields_82261344, kWardEntryPoints, WARD_82261344)
    Vec4f cutout_map(NetworkSite const& at) const;
    Vec4f diffuse_color(NetworkSite const& at) const;
};
extern template class WardMaterial<WardFields_82261344>;

class corvid_Mtl_Ward_82261344 final : public WardMaterial<WardFields_82261344> { };

} // namespace zsi
