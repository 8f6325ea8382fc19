// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

/// Ward surface of brickwork: pictures for bricks and mortar, and one as bump.
/// The network of its bump stands for u_normal0Map, which is not read; its r + g + b is the height.
#define WARD_F05DB29E(P, U, A)                           \
    WARD_VARIANT_FRONT(P, U, A)                          \
    BITMAP_ROWS(U, _ward_normal0_map)                    \
    TILE_ROWS(U, _ward_diffuse_color)                    \
    BITMAP_ROWS(U, _ward_diffuse_color_Tile_brickColor)  \
    BITMAP_ROWS(U, _ward_diffuse_color_Tile_mortarColor) \
    WARD_VARIANT_BACK(P, U, A)

struct WardFields_f05db29e : MaterialShader {
    SHADER(WardFields_f05db29e, kWardEntryPoints, WARD_F05DB29E)
    Vec4f normal0_map(NetworkSite const& at) const;
    Vec4f diffuse_color(NetworkSite const& at) const;
};
extern template class WardMaterial<WardFields_f05db29e>;

class corvid_Mtl_Ward_f05db29e final : public WardMaterial<WardFields_f05db29e> { };

} // namespace zsi
