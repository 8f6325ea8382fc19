// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

/// Ward surface whose diffuse colour and bump are each two pictures blended by a noise.
/// The network of its bump stands for u_normal0Map, which is not read; its r + g + b is the height.
#define WARD_AA598CB4(P, U, A)                       \
    WARD_VARIANT_FRONT(P, U, A)                      \
    BITMAP_ROWS(U, _ward_normal0_map_Noise_color1)   \
    BITMAP_ROWS(U, _ward_normal0_map_Noise_color2)   \
    NOISE_ROWS(U, _ward_normal0_map)                 \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color1) \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color2) \
    NOISE_ROWS(U, _ward_diffuse_color)               \
    WARD_VARIANT_BACK(P, U, A)

struct WardFields_aa598cb4 : MaterialShader {
    SHADER(WardFields_aa598cb4, kWardEntryPoints, WARD_AA598CB4)
    Vec4f normal0_map(NetworkSite const& at) const;
    Vec4f diffuse_color(NetworkSite const& at) const;
};
extern template class WardMaterial<WardFields_aa598cb4>;

class corvid_Mtl_Ward_aa598cb4 final : public WardMaterial<WardFields_aa598cb4> { };

} // namespace zsi
