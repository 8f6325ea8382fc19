// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/ward/wardMaterial.h"

namespace zsi {

/// Layered surface: a diffuse layer under an anisotropic Ward lobe whose reflectivity rises along
/// a power curve, with metal tint, refraction, translucency, cut-out and two bump maps.
/// At its defaults it is a black mirror.
#define WARD(P, U, A)           \
    AMBIENT_OCCLUSION(P, U, A)  \
    MASKING(P, U, A)            \
    TANGENT_ATTRIBUTES(P, U, A) \
    WARD_CHANNELS(P, U, A)

struct WardFields : MaterialShader {
    SHADER(WardFields, kWardEntryPoints, WARD)
};
extern template class WardMaterial<WardFields>;

class corvid_Mtl_Ward final : public WardMaterial<WardFields> { };

} // namespace zsi
