// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/ward/wardVariant.h"

namespace zsi {

/// Ward surface with a bump of noise: hammered, cast or rippled.
/// The network of its bump stands for u_normal0Map, which is not read; its r + g + b is the height.
#define WARD_5BA0BFFF(P, U, A)             \
    WARD_VARIANT_FRONT(P, U, A)            \
    COLOR_NOISE_ROWS(U, _ward_normal0_map) \
    WARD_VARIANT_BACK(P, U, A)

struct WardFields_5ba0bfff : MaterialShader {
    SHADER(WardFields_5ba0bfff, kWardEntryPoints, WARD_5BA0BFFF)
    Vec4f normal0_map(NetworkSite const& at) const;
};
extern template class WardMaterial<WardFields_5ba0bfff>;

class corvid_Mtl_Ward_5ba0bfff final : public WardMaterial<WardFields_5ba0bfff> { };

} // namespace zsi
