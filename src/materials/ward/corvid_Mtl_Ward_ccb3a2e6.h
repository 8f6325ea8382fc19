// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

/// Ward surface whose diffuse colour is two pictures blended by a noise.
#define WARD_CCB3A2E6(P, U, A)                       \
    WARD_VARIANT_FRONT(P, U, A)                      \
    NOISE_ROWS(U, _ward_diffuse_color)               \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color1) \
    BITMAP_ROWS(U, _ward_diffuse_color_Noise_color2) \
    WARD_VARIANT_BACK(P, U, A)

struct WardFields_ccb3a2e6 : MaterialShader {
    SHADER(WardFields_ccb3a2e6, kWardEntryPoints, WARD_CCB3A2E6)
    Vec4f diffuse_color(NetworkSite const& at) const;
};
extern template class WardMaterial<WardFields_ccb3a2e6>;

class corvid_Mtl_Ward_ccb3a2e6 final : public WardMaterial<WardFields_ccb3a2e6> { };

} // namespace zsi
