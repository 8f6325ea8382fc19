// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

/// Ward surface whose diffuse colour is a noise between two colours: marble, clouds, patina.
#define WARD_120B7820(P, U, A)               \
    WARD_VARIANT_FRONT(P, U, A)              \
    COLOR_NOISE_ROWS(U, _ward_diffuse_color) \
    WARD_VARIANT_BACK(P, U, A)

struct WardFields_120b7820 : MaterialShader {
    SHADER(WardFields_120b7820, kWardEntryPoints, WARD_120B7820)
    Vec4f diffuse_color(NetworkSite const& at) const;
};
extern template class WardMaterial<WardFields_120b7820>;

class corvid_Mtl_Ward_120b7820 final : public WardMaterial<WardFields_120b7820> { };

} // namespace zsi
