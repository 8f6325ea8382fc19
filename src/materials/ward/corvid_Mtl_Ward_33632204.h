// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

/// Ward surface of mottled pictures: noises of noises blend four pictures, once for the diffuse
/// colour and once, with pictures and noises of its own, for the bump.
/// The network of its bump stands for u_normal0Map, which is not read; its r + g + b is the height.
#define WARD_33632204(P, U, A)                                    \
    WARD_VARIANT_FRONT(P, U, A)                                   \
    BITMAP_ROWS(U, _ward_normal0_map_Noise_color1_Noise_color1)   \
    BITMAP_ROWS(U, _ward_normal0_map_Noise_color1_Noise_color2)   \
    BITMAP_ROWS(U, _ward_normal0_map_Noise_color2_Noise_color1)   \
    BITMAP_ROWS(U, _ward_normal0_map_Noise_color2_Noise_color2)   \
    NOISE_ROWS(U, _ward_normal0_map)                              \
    NOISE_ROWS(U, _ward_normal0_map_Noise_color1)                 \
    NOISE_ROWS(U, _ward_normal0_map_Noise_color2)                 \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color1_Noise_color1) \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color1_Noise_color2) \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color2_Noise_color1) \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color2_Noise_color2) \
    NOISE_ROWS(U, _ward_diffuse_color)                            \
    NOISE_ROWS(U, _ward_diffuse_color_Noise_color1)               \
    NOISE_ROWS(U, _ward_diffuse_color_Noise_color2)               \
    WARD_VARIANT_BACK(P, U, A)

struct WardFields_33632204 : MaterialShader {
    SHADER(WardFields_33632204, kWardEntryPoints, WARD_33632204)
    Vec4f normal0_map(NetworkSite const& at) const;
    Vec4f diffuse_color(NetworkSite const& at) const;
};
extern template class WardMaterial<WardFields_33632204>;

class corvid_Mtl_Ward_33632204 final : public WardMaterial<WardFields_33632204> { };

} // namespace zsi
