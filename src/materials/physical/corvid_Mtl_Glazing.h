// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/physical/shared/materialSkeleton.h"

namespace zsi {

/// A flat pane of thin glass: a reflectance that does not depend on the angle, rough highlights of
/// lights, and a tinted view straight through.
#define GLAZING(P, U, A)                                                                          \
    AMBIENT_OCCLUSION(P, U, A)                                                                    \
    MASKING(P, U, A)                                                                              \
    TANGENT_ATTRIBUTES(P, U, A)                                                                   \
    P(float, u_reflectance, (0.1f), "reflectance of one face, 0..1; the pane has its square",     \
      slider(0, 1), group("pane"))                                                                \
    P(Vec3f, u_reflectColor, (1.0f, 1.0f, 1.0f), "tint of reflected light, linear RGB")           \
    P(Vec3f, u_refractColor, (1.0f, 1.0f, 1.0f), "tint of transmitted light without a map")       \
    P(float, u_rough, (0.0001f), "squared width of the highlights, above 0", slider(0.0001f, 1))  \
    P(float, u_level, (1.0f), "layers crossed, above 0: divides reflectance, roots the map",      \
      slider(1, 10))                                                                              \
    P(bool, u_transmittanceMapEnable, (false), "tint of transmitted light from the map",          \
      group("transmittance map"))                                                                 \
    P(TextureSampler2D, u_transmittanceMap, (), "transmittance, linear RGB; not for shadow rays") \
    U(Mat3f, u_transmittanceTransform, "UV transform of that map",                                \
      when("u_transmittanceMapEnable"), when("u_transmittanceMap"))                               \
    P(float, u_transmittanceAmount, (1.0f), "multiplier of the map's colour", slider(0, 2))

class corvid_Mtl_Glazing final : public MaterialShader, public PhysicalShading<corvid_Mtl_Glazing> {
public:
    SHADER(corvid_Mtl_Glazing, kShade | kTransmission | kTransfer | kSample, GLAZING)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transmission(IShaderAPI* api, ShadeState& state) const override;
    void transfer(IShaderAPI* api, ShadeState& state) const override;
    void sample(IShaderAPI* api, ShadeState& state) const override;

    void f_calculateColors(IShaderAPI* api, ShadeState const& state, PhysicalColors& out) const;

private:
    float reflectance() const { return u_reflectance * u_reflectance / u_level; }
    Vec3f transmissionTint(ShadeState const& state) const;
    void sampleReflected(ShadeState& state, float factor) const;
    void sampleTransmitted(ShadeState& state, float factor) const;
};

} // namespace zsi
