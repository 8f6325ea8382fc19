// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

/// Ward surface of two kinds of brickwork of pictures, blended by a noise, with a picture as bump.
/// The network of its bump stands for u_normal0Map, which is not read; its r + g + b is the height.
#define WARD_B9AAC246(P, U, A)                                        \
    WARD_VARIANT_FRONT(P, U, A)                                       \
    BITMAP_ROWS(U, _ward_normal0_map)                                 \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color1_Tile_brickColor)  \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color1_Tile_mortarColor) \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color2_Tile_brickColor)  \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color2_Tile_mortarColor) \
    NOISE_ROWS(U, _ward_diffuse_color)                                \
    TILE_ROWS(U, _ward_diffuse_color_Noise_color1)                    \
    TILE_ROWS(U, _ward_diffuse_color_Noise_color2)                    \
    WARD_VARIANT_BACK(P, U, A)

struct WardFields_b9aac246 : MaterialShader {
    SHADER(WardFields_b9aac246, kWardEntryPoints, WARD_B9AAC246)
    Vec4f normal0_map(NetworkSite const& at) const;
    Vec4f diffuse_color(NetworkSite const& at) const;
};
extern template class WardMaterial<WardFields_b9aac246>;

class corvid_Mtl_Ward_b9aac246 final : public WardMaterial<WardFields_b9aac246> { };

} // namespace zsi
