#pragma once

#include "materials/ward/wardFunctions.h"

namespace zsi {

/// Layered surface: a diffuse layer under an anisotropic Ward lobe whose reflectivity rises along
/// a power curve, with metal tint, refraction, translucency, cut-out and two bump maps.
/// At its defaults it is a black mirror.
#define WARD(P, U, A)           \
    AMBIENT_OCCLUSION(P, U, A)  \
    MASKING(P, U, A)            \
    TANGENT_ATTRIBUTES(P, U, A) \
    WARD_CHANNELS(P, U, A)

class corvid_Mtl_Ward final : public MaterialShader, public WardFunctions<corvid_Mtl_Ward> {
public:
    SHADER(corvid_Mtl_Ward, kWardEntryPoints, WARD)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transmission(IShaderAPI* api, ShadeState& state) const override;
    void transfer(IShaderAPI* api, ShadeState& state) const override;
    void sample(IShaderAPI* api, ShadeState& state) const override;
};

} // namespace zsi
